// SPDX-License-Identifier: MIT
// Frames of a back trace, as memcheck and gdb have them in common.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "scanner/events/result.h"

namespace scanner {

/// One frame, with what is known of it.
struct Frame {
  std::string function = {};  ///< Empty when unknown, as the others are.
  std::string file = {};
  std::string line = {};
  std::string module = {};                   ///< Path of the image.
  std::optional<std::uint64_t> offset = {};  ///< From where the image is loaded.
  std::uint64_t address = 0;                 ///< Where it lies in memory.
};

/// "function (file:line)", "function (module+0xoffset)", "module+0xoffset" or "0xaddress".
std::string textOf(const Frame& frame);

/// Whether the frame is neither of the worker nor of the libraries that it is linked to, nor of the tool. Code that
/// lies in no module is the plug-in's.
bool isOfPlugin(const Frame& frame);
bool hasPlugin(const std::vector<Frame>& frames);

/// The frames as texts, up to the first one of the worker behind the last one of the plug-in. All of them where there
/// is none of the plug-in.
std::vector<std::string> textsOf(const std::vector<Frame>& frames);

/// A line for each frame, all of them, for the report.
std::string listOf(const std::vector<Frame>& frames);

/// The last part of a path.
std::string fileNameOf(const std::string& path);

}  // namespace scanner
