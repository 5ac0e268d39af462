// SPDX-License-Identifier: MIT
#include "scanner/explain/gdb.h"

#include <algorithm>
#include <cctype>
#include <csignal>
#include <cstdlib>
#include <map>
#include <optional>
#include <set>
#include <sstream>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <fmt/format.h>

#include "scanner/explain/frames.h"

namespace scanner {
namespace {

constexpr const char* kBackTrace = "bt 40";
// The plug-in can write to the log, too: these keep one that was made up from taking time and memory without end.
constexpr std::size_t kMostFrames = 100;  ///< gdb is asked for 40.
constexpr std::size_t kMostMappings = 10000;
constexpr std::size_t kMostRegisters = 1000;
constexpr std::size_t kLongestLine = 4096;

/// A part of memory that holds a part of a file.
struct Mapping {
  std::uint64_t begin = 0;
  std::uint64_t end = 0;
  std::uint64_t base = 0;  ///< Where the file's beginning lies.
  std::string path;
};

bool isBlank(char c) { return c == ' ' || c == '\t'; }

std::string_view withoutBlanks(std::string_view text) {
  while (!text.empty() && isBlank(text.front())) text.remove_prefix(1);
  while (!text.empty() && isBlank(text.back())) text.remove_suffix(1);
  return text;
}

/// Takes "0x..." off the front.
std::optional<std::uint64_t> takeAddress(std::string_view& text) {
  if (text.substr(0, 2) != "0x") return std::nullopt;
  const std::size_t end = std::min(text.find_first_not_of("0123456789abcdef", 2), text.size());
  const std::string digits(text.substr(0, end));
  text.remove_prefix(end);
  return std::strtoull(digits.c_str(), nullptr, 16);
}

/// A line of "info proc mappings": begin, end, size, offset, rights, path. The first mapping of a module has its
/// beginning; a file that is no module may be mapped anywhere, and several times.
void readMapping(std::string_view line, std::vector<Mapping>& mappings) {
  std::string_view rest = withoutBlanks(line);
  std::uint64_t numbers[4] = {};
  for (std::uint64_t& number : numbers) {
    const std::optional<std::uint64_t> taken = takeAddress(rest);
    if (!taken) return;
    number = *taken;
    rest = withoutBlanks(rest);
  }
  const std::size_t slash = rest.find('/');
  if (slash == std::string_view::npos) return;
  Mapping mapping{numbers[0], numbers[1], numbers[0] - numbers[3], std::string(rest.substr(slash))};
  const auto earlier = std::find_if(mappings.rbegin(), mappings.rend(),
                                    [&](const Mapping& other) { return other.path == mapping.path; });
  if (earlier != mappings.rend() && numbers[3] != 0) mapping.base = earlier->base;
  mappings.push_back(std::move(mapping));
}

/// "#1  0x00007f in function (...) at file.c:12", "#0  function (...) at file.c:12", "#2  0x00007f in ?? () from
/// module". The addresses are looked up later.
std::optional<Frame> readFrame(std::string_view line) {
  if (line.size() < 2 || line[0] != '#' || std::isdigit(static_cast<unsigned char>(line[1])) == 0)
    return std::nullopt;
  std::string_view rest = withoutBlanks(line.substr(std::min(line.find(' '), line.size())));
  Frame frame;
  if (const std::optional<std::uint64_t> address = takeAddress(rest)) {
    frame.address = *address;
    rest = withoutBlanks(rest);
    if (rest.substr(0, 3) == "in ") rest.remove_prefix(3);
  }
  constexpr std::string_view kAt = " at ";
  constexpr std::string_view kFrom = " from ";
  // Behind the arguments, which are shown as () or (...).
  for (const std::string_view arguments : {" ()", " (...)"}) {
    const std::size_t at = rest.rfind(arguments);
    if (at == std::string_view::npos) continue;
    std::string_view place = rest.substr(at + arguments.size());
    if (!place.empty() && place.substr(0, kAt.size()) != kAt && place.substr(0, kFrom.size()) != kFrom)
      continue;
    if (place.substr(0, kAt.size()) == kAt) {
      place.remove_prefix(kAt.size());
      const std::size_t colon = place.rfind(':');
      frame.file = place.substr(0, colon);
      if (colon != std::string_view::npos) frame.line = place.substr(colon + 1);
    } else if (!place.empty()) {
      frame.module = place.substr(kFrom.size());
    }
    rest = rest.substr(0, at);
    break;
  }
  if (rest != "??") frame.function = rest;
  return frame;
}

/// Everything of the log that findings are made of.
struct Log {
  std::vector<Frame> stack;          ///< The last one: of several threads that which runs the tests.
  std::string signal;                ///< "SIGSEGV"
  std::string instruction;           ///< Where the program counter stands,
  std::uint64_t programCounter = 0;  ///< and that itself.
  std::map<std::string, std::string> registers;
  std::string end;  ///< What the process ended with, when gdb did not stop it.
};

/// gdb names no module where it knows the file, nor for the program itself. The mappings know all.
void findModules(std::vector<Frame>& frames, const std::vector<Mapping>& mappings) {
  // A function that was inlined has the address of the one that it was inlined into.
  for (std::size_t i = frames.size(); i-- > 1;) {
    if (frames[i - 1].address == 0) frames[i - 1].address = frames[i].address;
  }
  for (Frame& frame : frames) {
    for (const Mapping& mapping : mappings) {
      if (frame.address < mapping.begin || frame.address >= mapping.end) continue;
      frame.module = mapping.path;
      frame.offset = frame.address - mapping.base;
    }
  }
  // Where gdb loses its way back it takes what it finds on the stack for addresses.
  const auto isNowhere = [](const Frame& frame) { return frame.module.empty() && frame.function.empty(); };
  frames.erase(std::remove_if(frames.begin() + 1, frames.end(), isNowhere), frames.end());
}

Log readLog(std::string_view text) {
  constexpr std::string_view kSignal = " received signal ";
  constexpr std::string_view kInstruction = "=> ";
  Log log;
  std::vector<Mapping> mappings;
  std::istringstream lines{std::string(text)};
  bool isInStack = false;
  for (std::string line; std::getline(lines, line);) {
    if (line.size() > kLongestLine) line.resize(kLongestLine);
    if (const std::optional<Frame> frame = readFrame(line)) {
      if (!isInStack) log.stack.clear();
      isInStack = true;
      if (log.stack.size() < kMostFrames) log.stack.push_back(*frame);
      continue;
    }
    isInStack = false;
    const std::size_t signal = line.find(kSignal);
    if (signal != std::string::npos) {
      const std::string name = line.substr(signal + kSignal.size());
      log.signal = name.substr(0, name.find(','));
    } else if (line.rfind(kInstruction, 0) == 0) {
      std::string_view address = std::string_view(line).substr(kInstruction.size());
      if (log.programCounter == 0) log.programCounter = takeAddress(address).value_or(0);
      const std::size_t tab = line.find('\t');
      if (log.instruction.empty() && tab != std::string::npos) log.instruction = line.substr(tab + 1);
    } else if (line.rfind("[Inferior ", 0) == 0) {
      log.end = line;
    } else {
      if (mappings.size() < kMostMappings) readMapping(line, mappings);
      std::istringstream words(line);
      std::string name;
      std::string value;
      const bool isRegister = words >> name >> value && value.rfind("0x", 0) == 0;
      if (isRegister && log.registers.size() < kMostRegisters) log.registers.emplace(name, value);
    }
  }
  if (log.stack.empty()) return log;
  // Of a frame that stands at the beginning of a line gdb shows no address.
  if (log.stack.front().address == 0) log.stack.front().address = log.programCounter;
  findModules(log.stack, mappings);
  return log;
}

/// The values of those registers that the instruction names, of one that reaches into memory those that say where:
/// " with rdi = 0x0".
std::string registersIn(const std::string& instruction, const std::map<std::string, std::string>& registers) {
  std::string text;
  std::set<std::string> seen;
  const std::size_t open = instruction.find('(');
  const std::size_t begin = open == std::string::npos ? 0 : open;
  const std::size_t end = std::min(instruction.find(')', begin), instruction.size());
  for (std::size_t at = instruction.find('%', begin); at < end; at = instruction.find('%', at + 1)) {
    std::size_t behind = at + 1;
    while (behind < end && std::isalnum(static_cast<unsigned char>(instruction[behind])) != 0) ++behind;
    const std::string name = instruction.substr(at + 1, behind - at - 1);
    const auto value = registers.find(name);
    if (value == registers.end() || !seen.insert(name).second) continue;
    text += fmt::format("{} {} = {}", text.empty() ? " with" : ",", name, value->second);
  }
  return text;
}

/// "mov    (%rdi),%rax" with one blank.
std::string oneLine(const std::string& instruction) {
  std::string text;
  for (const char c : instruction) {
    if (!isBlank(c)) {
      text += c;
    } else if (!text.empty() && text.back() != ' ') {
      text += ' ';
    }
  }
  return text;
}

bool looksForThrow(const Judgement& judgement) {
  return judgement.verdict == Verdict::kFailed || judgement.verdict == Verdict::kNoInstance;
}

/// The tool's word for what it stops at.
std::string kindOf(const Judgement& judgement, const Log& log) {
  if (looksForThrow(judgement)) return "throw";
  if (judgement.verdict == Verdict::kExited) return "exit";
  if (judgement.verdict == Verdict::kHung) return "hang";
  return log.signal.empty() ? "signal" : log.signal;
}

std::string textOf(const Judgement& judgement, const Log& log, const std::vector<Frame>& frames) {
  std::string where;
  for (const Frame& frame : frames) {
    if (!isOfPlugin(frame)) continue;
    where = " in " + textOf(frame);
    break;
  }
  if (looksForThrow(judgement)) return "An exception was thrown" + where;
  if (judgement.verdict == Verdict::kExited) return "The process was ended" + where;
  if (judgement.verdict == Verdict::kHung) return "It was stopped at the limit" + where;
  std::string text = log.signal + where;
  if (!log.instruction.empty() && isOfPlugin(frames.front())) {
    const std::string instruction = oneLine(log.instruction);
    text += ", at " + instruction + registersIn(instruction, log.registers);
  }
  return text;
}

/// gdb calls those without a name SIG34 and so on.
std::string nameForGdb(int signal) {
  const std::string name = nameOfSignal(signal);
  return name.rfind("SIG", 0) == 0 ? name : fmt::format("SIG{}", signal);
}

}  // namespace

bool canStopAt(const Judgement& judgement, std::string& whyNot) {
  switch (judgement.verdict) {
    case Verdict::kFailed:
    case Verdict::kCrashed:
    case Verdict::kExited:
    case Verdict::kHung:
    case Verdict::kNoInstance:
      return true;
    case Verdict::kKilled:
      if (judgement.signal && *judgement.signal != SIGKILL) return true;
      whyNot = "gdb cannot stop at what ended the run";
      return false;
    default:
      return false;
  }
}

std::vector<std::string> gdbCommand(const std::string& gdb, const Judgement& judgement,
                                    const std::string& folder) {
  // Nothing of the user's, nothing from the network, and nothing that lies beside a plug-in.
  std::vector<std::string> command = {
      gdb, "-nx", "-nh", "-batch", "-iex", "set auto-load no", "-iex", "set debuginfod enabled off"};
  const auto add = [&](const std::string& order) { command.insert(command.end(), {"-ex", order}); };
  if (!folder.empty()) {
    add(fmt::format("set logging file {}/{}", folder, kGdbLog));
    add("set logging overwrite on");
    add("set logging redirect on");
    add("set logging on");
    add("set width 0");
    add("set height 0");
    add("set print frame-arguments presence");
    add("set filename-display basename");
  }
  add("set disable-randomization off");
  add("handle all nostop noprint pass");
  if (looksForThrow(judgement)) {
    // The exception that ends the run is the last one: the first run counts them.
    for (const char* order : {"set $throws = 0", "catch throw", "condition 1 ++$throws < 0", "run",
                              "condition 1 --$throws == 0", "run", kBackTrace})
      add(order);
  } else if (judgement.verdict == Verdict::kExited) {
    for (const char* order : {"catch syscall exit_group", "run", kBackTrace}) add(order);
  } else if (judgement.verdict == Verdict::kHung) {
    for (const char* order : {"run", "thread apply all bt 40"}) add(order);
  } else {
    if (judgement.signal) {
      add(fmt::format("handle {} stop print pass", nameForGdb(*judgement.signal)));
    } else {
      add("handle SIGSEGV SIGBUS SIGILL SIGFPE SIGABRT SIGSYS stop print pass");
    }
    for (const char* order : {"run", kBackTrace, "x/i $pc", "info registers"}) add(order);
  }
  if (!folder.empty()) {
    add("thread apply 1 x/i $pc");
    add("info proc mappings");
  }
  command.emplace_back("--args");
  return command;
}

void readGdb(std::string_view log, const Judgement& judgement, Diagnosis& diagnosis) {
  const Log read = readLog(log);
  diagnosis.report = log.substr(log.size() - std::min(log.size(), Diagnosis::kMostBytesOfReport));
  if (!read.stack.empty()) {
    const std::vector<Frame>& frames = read.stack;
    const bool isOwn = !hasPlugin(frames);
    if (isOwn && looksForThrow(judgement)) {
      diagnosis.problem = "no exception that ends the run comes from the plug-in";
      return;
    }
    if (isOwn && judgement.verdict == Verdict::kExited) {
      diagnosis.problem = "the process was not ended by the plug-in";
      return;
    }
    diagnosis.findings.push_back(
        {kindOf(judgement, read), textOf(judgement, read, frames), textsOf(frames), !isOwn});
  } else if (!read.end.empty()) {
    diagnosis.problem = "the run under gdb ended otherwise: " + read.end;
  } else {
    diagnosis.problem = "gdb could not run it";
    std::istringstream lines{std::string(log)};
    for (std::string line; std::getline(lines, line);) {
      if (!line.empty()) diagnosis.problem = "gdb could not run it: " + line.substr(0, kLongestLine);
    }
  }
}

}  // namespace scanner
