// SPDX-License-Identifier: MIT
// The description of one plug-in, from loading its bundle to closing its instance.
#pragma once

#include <optional>
#include <string>

#include "loader/plugin_identity.h"

struct DescribedBundle {
  bool isShell;
  std::string json;
};

/// Loads the bundle at `path`, creates an instance (of the child that `loadID` names), describes and closes
/// it. Prints a failure line and returns nothing when something is thrown on the way. A plug-in that yields no
/// instance crashes the process on purpose, as in a torture run.
std::optional<DescribedBundle> describeBundle(const std::string& path, const VST_loadID& loadID);
