// SPDX-License-Identifier: MIT
// An event that is written again, without being read: most of it is as it was, and reading takes far longer.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace scanner {

/// The names of an event's members with their values as JSON, in their order.
using EventMembers = std::vector<std::pair<std::string, std::string>>;

/// Takes a line apart that eventLine() has written, without its newline. Nothing for any other text: what is
/// no JSON object, or has blanks between its parts.
std::optional<EventMembers> eventMembers(std::string_view line);

}  // namespace scanner
