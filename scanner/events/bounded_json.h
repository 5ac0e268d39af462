// SPDX-License-Identifier: MIT
// JSON out of somebody else's hands: parsed within bounds, so that neither its nesting nor its size can harm.
#pragma once

#include <optional>
#include <string_view>

#include <nlohmann/json.hpp>

namespace scanner {

/// How deep objects and arrays of an event may stand in one another. A description is 6 deep.
constexpr int kDeepestEvent = 64;

/// The value, its members in their order. Nothing for what is no JSON, for what is nested deeper than `deepest`, and
/// for an object of more than 4096 members; `problem`, which may be null, then is a phrase that says why.
std::optional<nlohmann::ordered_json> parseBounded(std::string_view text, int deepest, const char** problem);

}  // namespace scanner
