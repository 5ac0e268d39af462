// SPDX-License-Identifier: MIT
// A folder of its own for each test, in which it makes bundles.
#pragma once

#include <filesystem>
#include <fstream>
#include <string>

#include "tests/shared/temporary_directory.h"

/// Makes files and folders. Names are relative to the folder; every function returns the absolute path.
class BundleFiles {
 public:
  std::string path(const std::string& name) const { return (folder.path() / name).string(); }

  std::string makeFolder(const std::string& name) const {
    std::filesystem::create_directories(path(name));
    return path(name);
  }
  /// Writes a file, after making the folders above it.
  std::string write(const std::string& name, const std::string& content) const {
    makeFolder(std::filesystem::path(name).parent_path());
    std::ofstream(path(name), std::ios::binary) << content;
    return path(name);
  }
  /// Copies the file `source`, after making the folders above `name`.
  std::string copy(const std::string& source, const std::string& name) const {
    makeFolder(std::filesystem::path(name).parent_path());
    std::filesystem::copy_file(source, path(name));
    return path(name);
  }

 private:
  TemporaryDirectory folder;
};

/// Makes `folder` the current directory until the end of its life.
class CurrentDirectory {
 public:
  explicit CurrentDirectory(const std::string& folder) { std::filesystem::current_path(folder); }
  ~CurrentDirectory() { std::filesystem::current_path(before); }
  CurrentDirectory(const CurrentDirectory&) = delete;
  CurrentDirectory& operator=(const CurrentDirectory&) = delete;

 private:
  const std::filesystem::path before = std::filesystem::current_path();
};
