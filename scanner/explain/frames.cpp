// SPDX-License-Identifier: MIT
#include "scanner/explain/frames.h"

#include <algorithm>

#include <fmt/format.h>

namespace scanner {
namespace {

constexpr std::string_view kWorker = "vsttorture-worker";
/// What valgrind puts in the place of functions such as strlen.
constexpr std::string_view kReplacements = "vgpreload_";

/// How the names of the other modules begin that are no plug-in's: those that the worker is linked to.
constexpr std::string_view kOthers[] = {
    "ld-linux", "ld.so", "libc.so",  "libc-",     "libm.so",    "libm-",      "libpthread",
    "libdl",    "librt", "libgcc_s", "libstdc++", "linux-vdso", "linux-gate",
};

bool beginsWith(std::string_view text, std::string_view beginning) {
  return text.substr(0, beginning.size()) == beginning;
}

}  // namespace

std::string fileNameOf(const std::string& path) { return path.substr(path.rfind('/') + 1); }

std::string textOf(const Frame& frame) {
  const std::string module = fileNameOf(frame.module);
  if (!frame.function.empty() && beginsWith(module, kReplacements)) return frame.function;
  std::string place = module;
  if (!place.empty() && frame.offset) place += fmt::format("+0x{:x}", *frame.offset);
  if (!frame.file.empty()) place = frame.file + (frame.line.empty() ? "" : ":" + frame.line);
  if (frame.function.empty()) return place.empty() ? fmt::format("0x{:x}", frame.address) : place;
  return place.empty() ? frame.function : fmt::format("{} ({})", frame.function, place);
}

bool isOfPlugin(const Frame& frame) {
  const std::string module = fileNameOf(frame.module);
  if (module == kWorker || beginsWith(module, kReplacements)) return false;
  return std::none_of(std::begin(kOthers), std::end(kOthers),
                      [&](std::string_view other) { return beginsWith(module, other); });
}

bool hasPlugin(const std::vector<Frame>& frames) {
  return std::any_of(frames.begin(), frames.end(), isOfPlugin);
}

std::vector<std::string> textsOf(const std::vector<Frame>& frames) {
  const auto last = std::find_if(frames.rbegin(), frames.rend(), isOfPlugin);
  auto end = frames.end();
  if (last != frames.rend()) {
    end = last.base();
    if (end != frames.end()) ++end;  // Who called it.
  }
  std::vector<std::string> texts;
  std::transform(frames.begin(), end, std::back_inserter(texts), textOf);
  return texts;
}

std::string listOf(const std::vector<Frame>& frames) {
  std::string list;
  for (const Frame& frame : frames) list += "    " + textOf(frame) + "\n";
  return list;
}

}  // namespace scanner
