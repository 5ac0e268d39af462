// SPDX-License-Identifier: MIT
#include "scanner/events/event_members.h"

#include <algorithm>

#include <nlohmann/json.hpp>

namespace scanner {
namespace {

/// Behind the text in quotes that begins at `at`. Valid JSON ends each.
std::size_t endOfText(std::string_view json, std::size_t at) {
  for (++at; at < json.size() && json[at] != '"'; ++at) {
    if (json[at] == '\\') ++at;
  }
  return std::min(at + 1, json.size());
}

/// Behind the value that begins at `at`, where a comma or a bracket stands.
std::size_t endOfValue(std::string_view json, std::size_t at) {
  for (int depth = 0; at < json.size();) {
    const char c = json[at];
    if (c == '"') {
      at = endOfText(json, at);
      continue;
    }
    if (depth == 0 && (c == ',' || c == '}')) break;
    if (c == '{' || c == '[') ++depth;
    if (c == '}' || c == ']') --depth;
    ++at;
  }
  return at;
}

}  // namespace

std::optional<EventMembers> eventMembers(std::string_view line) {
  if (line.find('\n') != std::string_view::npos || !nlohmann::json::accept(line)) return std::nullopt;
  EventMembers members;
  std::size_t at = 0;
  while (at + 1 < line.size()) {
    // At the bracket that opens the object, or at a comma.
    if (line[at] != (members.empty() ? '{' : ',') || line[at + 1] != '"') return std::nullopt;
    const std::size_t colon = endOfText(line, at + 1);
    if (colon >= line.size() || line[colon] != ':') return std::nullopt;
    const std::size_t end = endOfValue(line, colon + 1);
    members.emplace_back(line.substr(at + 2, colon - at - 3), line.substr(colon + 1, end - colon - 1));
    at = end;
  }
  return members;
}

}  // namespace scanner
