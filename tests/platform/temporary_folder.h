// SPDX-License-Identifier: MIT
// A folder of its own for each test, gone afterwards.
#pragma once

#include <filesystem>
#include <fstream>
#include <string>

#include <gtest/gtest.h>
#include <stdlib.h>

/// Makes files and folders below a new, empty folder. Names are relative to it.
class TemporaryFolder {
 public:
  TemporaryFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "core_foundation.XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) ADD_FAILURE() << "no temporary folder";
    root = pattern;
  }
  ~TemporaryFolder() { std::filesystem::remove_all(root); }
  TemporaryFolder(const TemporaryFolder&) = delete;
  TemporaryFolder& operator=(const TemporaryFolder&) = delete;

  std::string path(const std::string& name) const { return (root / name).string(); }

  /// Makes the folder `name` and those above it.
  std::string makeFolder(const std::string& name) const {
    std::filesystem::create_directories(root / name);
    return path(name);
  }
  /// Writes a file, after making the folders above it.
  std::string write(const std::string& name, const std::string& content) const {
    std::filesystem::create_directories((root / name).parent_path());
    std::ofstream(root / name, std::ios::binary) << content;
    return path(name);
  }
  /// Copies the file `source` to `name`.
  std::string copy(const std::string& source, const std::string& name) const {
    std::filesystem::create_directories((root / name).parent_path());
    std::filesystem::copy_file(source, root / name);
    return path(name);
  }

 private:
  std::filesystem::path root;
};

/// Makes `folder` the current directory for as long as it lives.
class CurrentDirectory {
 public:
  explicit CurrentDirectory(const std::string& folder) : before(std::filesystem::current_path()) {
    std::filesystem::current_path(folder);
  }
  ~CurrentDirectory() { std::filesystem::current_path(before); }
  CurrentDirectory(const CurrentDirectory&) = delete;
  CurrentDirectory& operator=(const CurrentDirectory&) = delete;

 private:
  const std::filesystem::path before;
};
