// SPDX-License-Identifier: MIT
// What a file is, read from its bytes: for which system and processor it was built, and whether it exports an
// entry point. ELF files of both word sizes and byte orders, Mach-O files of one or several processors, and PE
// files are understood. Nothing in the file is believed: every offset is checked, every loop has an end.
#pragma once

#include <optional>
#include <string>

#include "scanner/find/module.h"

namespace scanner {

struct ModuleFile {
  FileIdentity identity;
  /// Nothing where the file is no plug-in module. Of several processors in one file, the first.
  std::optional<Target> target;
};

/// Reads the regular file at `path`, links followed. Nothing where there is no such file or it cannot be read.
std::optional<ModuleFile> readModuleFile(const std::string& path);

/// The target of a program, by its file alone; for telling which plug-ins a worker can load.
std::optional<Target> targetOfProgram(const std::string& path);

}  // namespace scanner
