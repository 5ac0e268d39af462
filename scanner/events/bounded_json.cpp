// SPDX-License-Identifier: MIT
#include "scanner/events/bounded_json.h"

#include <vector>

namespace scanner {
namespace {

/// Of one object: its members are kept in their order, and each new one is compared with all before it.
constexpr std::size_t kMostMembers = 4096;

}  // namespace

std::optional<nlohmann::ordered_json> parseBounded(std::string_view text, int deepest, const char** problem) {
  using Json = nlohmann::ordered_json;
  const char* trouble = nullptr;
  std::vector<std::size_t> members;  // Of each object that is open.
  const auto keeps = [&](int depth, Json::parse_event_t event, Json&) {
    using Part = Json::parse_event_t;
    if (event == Part::object_start || event == Part::array_start) {
      members.push_back(0);
      if (depth >= deepest) trouble = "it is nested too deeply";
    } else if (event == Part::object_end || event == Part::array_end) {
      if (!members.empty()) members.pop_back();
    } else if (event == Part::key && !members.empty() && ++members.back() > kMostMembers) {
      trouble = "an object in it has too many members";
    }
    return trouble == nullptr;  // Nothing that follows is kept.
  };
  Json json = Json::parse(text.begin(), text.end(), keeps, false);
  if (trouble == nullptr && json.is_discarded()) trouble = "it is no JSON";
  if (trouble == nullptr) return json;
  if (problem != nullptr) *problem = trouble;
  return std::nullopt;
}

}  // namespace scanner
