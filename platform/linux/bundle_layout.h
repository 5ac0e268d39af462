// SPDX-License-Identifier: MIT
// Which file is a bundle's executable.
//
// A regular file is its own bundle. In a directory the executable is called by the key CFBundleExecutable of
// Contents/Info.plist or Info.plist, or else like the directory without its last extension. For the name ProM
// the files ProM, ProM.so and libProM.so are looked for in each of Contents/Linux, Contents/x86_64-linux (or
// the name of another architecture), Contents/MacOS, Contents and the directory itself, in this order.
#pragma once

#include <string>

namespace core_foundation {

/// What findBundleExecutable found: one of the two is empty.
struct BundleExecutable {
  std::string path;     ///< The regular file to load.
  std::string problem;  ///< Why there is none, for people to read.
};

/// Looks for the executable of the bundle at `path`. A pure function of the file system.
BundleExecutable findBundleExecutable(const std::string& path);

}  // namespace core_foundation
