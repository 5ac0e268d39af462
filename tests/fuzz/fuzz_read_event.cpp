// SPDX-License-Identifier: MIT
// Fuzz target: reads arbitrary bytes as a line of an event stream.
//
// What is read as an event must be written as a line that is read as the same event. What is not must have a problem,
// on one line.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <optional>
#include <string>
#include <string_view>

#include "scanner/events/event_json.h"
#include "scanner/events/event_reader.h"

namespace {

void demand(bool isTrue) {
  if (!isTrue) std::abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* input, std::size_t size) {
  const std::string text(input, input + size);
  std::string problem;
  const std::optional<scanner::Event> event = scanner::readEvent(text, &problem);
  if (!event) {
    demand(!problem.empty() && problem.find('\n') == std::string::npos);
    return 0;
  }
  const std::string line = eventLine(*event);
  demand(!line.empty() && line.find('\n') == line.size() - 1);
  const std::optional<scanner::Event> again = scanner::readEvent(line);
  demand(again && eventLine(*again) == line);
  return 0;
}
