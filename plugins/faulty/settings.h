// SPDX-License-Identifier: MIT
// Which fault is wanted, and where.
//
// From the environment: FAULT_KIND, FAULT_PLACE, FAULT_STATUS. Where the environment names none, from a text
// file beside the plug-in, with its name and ".fault" behind it: "KIND PLACE [STATUS]". So a folder of copies
// can hold a different fault in each.
#pragma once

#include <string>

namespace sample_plugins {

struct FaultSettings {
  std::string kind;
  std::string place;  ///< Empty: no fault is wanted.
  int status = 0;
};

const FaultSettings& faultSettings();

}  // namespace sample_plugins
