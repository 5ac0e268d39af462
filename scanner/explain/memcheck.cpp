// SPDX-License-Identifier: MIT
#include "scanner/explain/memcheck.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <map>
#include <sstream>

#include <fmt/format.h>
#include <pugixml.hpp>

#include "scanner/explain/frames.h"

namespace scanner {
namespace {

constexpr std::size_t kMostFindings = 100;
// The plug-in can write to the files, too: these keep what was made up from taking memory without end.
constexpr std::size_t kMostBytesOfFindings = std::size_t{512} << 10;
constexpr std::size_t kMostFrames = 100;  ///< memcheck is asked for 40.
constexpr std::size_t kLongestText = 1024;

/// By the module's path: what an address in memory is ahead of its offset in the module.
using LoadAddresses = std::map<std::string, std::uint64_t>;

/// The log has, for each module, "Reading syms from PATH" and a line "svma 0x..., avma 0x...": where its code lies in
/// the module and in memory. One that was loaded again counts with its last place.
LoadAddresses readLog(std::string_view log) {
  constexpr std::string_view kPath = "Reading syms from ";
  constexpr std::string_view kInModule = "svma ";
  constexpr std::string_view kInMemory = "avma ";
  LoadAddresses addresses;
  std::istringstream lines{std::string(log)};
  std::string module;
  for (std::string line; std::getline(lines, line);) {
    const std::size_t path = line.find(kPath);
    if (path != std::string::npos) module = line.substr(path + kPath.size());
    const std::size_t inModule = line.find(kInModule);
    const std::size_t inMemory = line.find(kInMemory);
    if (module.empty() || inModule == std::string::npos || inMemory == std::string::npos) continue;
    const std::uint64_t offset = std::strtoull(line.c_str() + inModule + kInModule.size(), nullptr, 16);
    const std::uint64_t address = std::strtoull(line.c_str() + inMemory + kInMemory.size(), nullptr, 16);
    if (address >= offset) addresses[module] = address - offset;
    module.clear();
  }
  return addresses;
}

std::string textOf(const pugi::xml_node& node, const char* child) {
  return std::string(node.child_value(child)).substr(0, kLongestText);
}

std::vector<Frame> readStack(const pugi::xml_node& stack, const LoadAddresses& addresses) {
  std::vector<Frame> frames;
  for (const pugi::xml_node& one : stack.children("frame")) {
    if (frames.size() == kMostFrames) break;
    Frame frame;
    frame.function = textOf(one, "fn");
    frame.file = textOf(one, "file");
    frame.line = textOf(one, "line");
    frame.module = textOf(one, "obj");
    frame.address = std::strtoull(one.child_value("ip"), nullptr, 16);
    const auto at = addresses.find(frame.module);
    if (at != addresses.end() && frame.address >= at->second) frame.offset = frame.address - at->second;
    frames.push_back(frame);
  }
  return frames;
}

struct Error {
  std::string kind;
  std::string what;
  std::string more;           ///< What memcheck adds to it: "Address 0x5 is 0 bytes after a block".
  std::vector<Frame> frames;  ///< Where it happened,
  std::vector<Frame> origin;  ///< and what `more` speaks of, such as where the memory was allocated.
};

Error readError(const pugi::xml_node& node, const LoadAddresses& addresses) {
  Error error;
  error.kind = textOf(node, "kind");
  error.what = textOf(node, "what");
  if (error.what.empty()) error.what = textOf(node.child("xwhat"), "text");
  error.more = textOf(node, "auxwhat");
  if (error.more.empty()) error.more = textOf(node.child("xauxwhat"), "text");
  const pugi::xml_node stack = node.child("stack");
  error.frames = readStack(stack, addresses);
  error.origin = readStack(stack.next_sibling("stack"), addresses);
  return error;
}

const Frame* innermostOfPlugin(const std::vector<Frame>& frames) {
  const auto at = std::find_if(frames.begin(), frames.end(), isOfPlugin);
  return at == frames.end() ? nullptr : &*at;
}

/// One line. Addresses in memory are left out: they are others in each run.
std::string textOf(const Error& error) {
  constexpr std::string_view kAddress = "Address 0x";
  constexpr std::uint64_t kSmallestAddress = 4096;
  std::string more = error.more;
  if (more.rfind(kAddress, 0) == 0) {
    const std::uint64_t address = std::strtoull(more.c_str() + kAddress.size(), nullptr, 16);
    const std::size_t is = more.find(" is ");
    if (is != std::string::npos) more = more.substr(is + 4);
    if (address < kSmallestAddress) more = "through a null pointer";
  } else if (!more.empty()) {
    more[0] = static_cast<char>(std::tolower(static_cast<unsigned char>(more[0])));
  }
  if (!more.empty()) more = ": " + more;
  const Frame* origin = innermostOfPlugin(error.origin);
  if (origin != nullptr) more += " in " + textOf(*origin);
  return error.what + more;
}

std::string lastLine(std::string_view text) {
  while (!text.empty() && (text.back() == '\n' || text.back() == ' ')) text.remove_suffix(1);
  return std::string(text.substr(text.rfind('\n') + 1)).substr(0, kLongestText);
}

}  // namespace

std::vector<std::string> memcheckCommand(const std::string& valgrind, const std::string& folder) {
  std::vector<std::string> command = {valgrind, "--tool=memcheck", "--track-origins=yes", "--num-callers=40",
                                      "--leak-check=no",
                                      // The run ends with its own status.
                                      "--error-exitcode=0", "--vgdb=no",
                                      // A process that the plug-in has forked would write to the same file.
                                      "--child-silent-after-fork=yes"};
  if (!folder.empty()) {
    command.insert(command.end(), {"--xml=yes", "--xml-file=" + folder + "/" + kMemcheckErrors,
                                   "--log-file=" + folder + "/" + kMemcheckLog, "-v", "-v", "-v"});
  }
  return command;
}

void readMemcheck(std::string_view errors, std::string_view log, Diagnosis& diagnosis) {
  pugi::xml_document document;
  // Of a run that was killed the end is missing; what was read until then is there.
  document.load_buffer(errors.data(), errors.size());
  const pugi::xml_node root = document.child("valgrindoutput");
  bool isFinished = false;
  for (const pugi::xml_node& status : root.children("status"))
    isFinished = isFinished || std::string_view(status.child_value("state")) == "FINISHED";

  const LoadAddresses addresses = readLog(log);
  std::map<std::string, std::size_t> findingAt;
  std::vector<unsigned> times;
  std::size_t leftOut = 0;
  std::size_t bytesOfFindings = 0;
  for (const pugi::xml_node& node : root.children("error")) {
    const Error error = readError(node, addresses);
    if (error.kind.rfind("Leak_", 0) == 0) continue;
    if (diagnosis.report.size() < Diagnosis::kMostBytesOfReport) {
      diagnosis.report += fmt::format("{}: {}\n{}", error.kind, error.what, listOf(error.frames));
      if (!error.more.empty()) diagnosis.report += fmt::format("  {}\n{}", error.more, listOf(error.origin));
    }
    const Frame* place = innermostOfPlugin(error.frames);
    const std::vector<std::string> frames = textsOf(error.frames);
    const std::string key = error.kind + '\n' +
                            (place != nullptr ? textOf(*place)
                             : frames.empty() ? ""
                                              : frames.front());
    const auto known = findingAt.find(key);
    if (known != findingAt.end()) {
      ++times[known->second];
    } else if (diagnosis.findings.size() == kMostFindings || bytesOfFindings > kMostBytesOfFindings) {
      ++leftOut;
    } else {
      findingAt[key] = diagnosis.findings.size();
      const bool isInPlugin = place != nullptr || hasPlugin(error.origin);
      diagnosis.findings.push_back({error.kind, textOf(error), frames, isInPlugin});
      times.push_back(1);
      for (const std::string& one : frames) bytesOfFindings += one.size();
    }
  }
  diagnosis.report.resize(std::min(diagnosis.report.size(), Diagnosis::kMostBytesOfReport));
  for (std::size_t i = 0; i < times.size(); ++i) {
    if (times[i] > 1) diagnosis.findings[i].text += fmt::format(" (one of {} there)", times[i]);
  }
  if (!root) {
    const std::string reason = lastLine(log);
    diagnosis.problem = "memcheck has found nothing out" + (reason.empty() ? "" : ": " + reason);
  } else if (!isFinished) {
    diagnosis.problem = "memcheck was ended before the run was";
  } else if (leftOut > 0) {
    diagnosis.problem = fmt::format("{} more findings are in the report only", leftOut);
  }
}

}  // namespace scanner
