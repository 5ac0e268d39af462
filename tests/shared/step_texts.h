// SPDX-License-Identifier: MIT
// The texts of a run's fixed steps.
#pragma once

#include <array>

/// Of steps 1 to 15, in their order. Those that follow are drawn at random.
inline constexpr std::array<const char*, 15> kOrderedTexts = {
    "test gathering info",    "inspect class info",
    "inspect preset info",    "inspect parameter info",
    "testing setting states", "inspect latency",
    "inspect stream format",  "inspect stream format",
    "inspect latency",        "testing setting states",
    "inspect parameter info", "inspect preset info",
    "inspect class info",     "initialize",
    "test gathering info",
};
