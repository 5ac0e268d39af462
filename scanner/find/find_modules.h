// SPDX-License-Identifier: MIT
// Finds plug-in modules: walks folders and looks into files, without loading any.
//
// A file is a module when it is a shared library that exports an entry point: VSTPluginMain, main_macho, or
// main. A folder whose name ends in ".vst" is a bundle where it holds an executable of its own name, in the
// places that the worker looks in; it is not searched further then.
#pragma once

#include <string>
#include <vector>

#include "scanner/find/module.h"

namespace scanner {

/// A place that could not be searched, or a named path that cannot be used, with the system's reason.
struct Unreadable {
  std::string path;
  std::string reason;
};

struct FindResult {
  std::vector<Module> modules;         ///< In byte order of their bundles; each file once.
  std::vector<std::string> places;     ///< The folders that were searched, in order.
  std::vector<Unreadable> unreadable;  ///< Folders and files below the places.
  std::vector<Unreadable> missing;     ///< Named paths that do not exist or cannot be read.
};

/// Searches `paths`: a folder with everything below it, a file by itself. A file that is named and is no
/// module is a Module with an empty target, so that its run says what is wrong with it. Links are followed
/// once, loops end. Relative paths are taken from the current folder; all paths in the result begin at the
/// root, but for those of `missing`, which are as they were named.
FindResult findModules(const std::vector<std::string>& paths);

/// Where plug-ins are looked for when no path is named: the folders in `vstPath` (VST_PATH, separated by
/// colons) where it is not null and not empty, else those that hosts look in, `home` among them. Only folders
/// that exist; see also namedPlaces().
std::vector<std::string> defaultPlaces(const char* vstPath, const char* home);

/// All of them, whether they exist or not, for the sentence that says where nothing was found.
std::vector<std::string> namedPlaces(const char* vstPath, const char* home);

}  // namespace scanner
