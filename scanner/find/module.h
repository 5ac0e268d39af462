// SPDX-License-Identifier: MIT
// A plug-in module on disk.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace scanner {

/// The system and processor that a module was built for.
struct Target {
  enum class System { kLinux, kMacOs, kWindows };
  System system = System::kLinux;
  /// "x86_64", "i386", "aarch64" and the like; "machine N" for one without a name here.
  std::string processor;

  bool operator==(const Target& other) const {
    return system == other.system && processor == other.processor;
  }
};

/// Which file it is, whatever its name: the same for all links to it.
struct FileIdentity {
  std::uint64_t device = 0;
  std::uint64_t inode = 0;
  std::uint64_t sizeInBytes = 0;
  std::int64_t changedAtInNanoseconds = 0;  ///< The kernel's time of the last change of content or inode.

  bool isSameFileAs(const FileIdentity& other) const {
    return device == other.device && inode == other.inode;
  }
};

/// A plug-in to try: a shared object, or a folder that holds one.
struct Module {
  std::string bundle;      ///< What a worker is given: the file, or the folder. Bytes, not necessarily UTF-8.
  std::string executable;  ///< The file itself; the same as `bundle` for a plain file.
  FileIdentity identity;   ///< Of the executable.
  Target target;           ///< Empty processor: the file was named on the command line and is no module.
  std::vector<std::string> otherNames = {};  ///< Further paths under which the same file was found.
};

}  // namespace scanner
