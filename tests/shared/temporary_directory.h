// SPDX-License-Identifier: MIT
// A new, empty folder, removed with its content when the object goes out of scope.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <string>
#include <system_error>

class TemporaryDirectory {
 public:
  /// Throws std::system_error when the folder cannot be made.
  TemporaryDirectory() {
    std::string name = (std::filesystem::temp_directory_path() / "vsttorture-XXXXXX").string();
    if (mkdtemp(name.data()) == nullptr) throw std::system_error(errno, std::generic_category(), name);
    folder = std::filesystem::canonical(name);
  }
  TemporaryDirectory(const TemporaryDirectory&) = delete;
  TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;
  ~TemporaryDirectory() {
    std::error_code ignored;
    std::filesystem::remove_all(folder, ignored);
  }

  /// Absolute, without a slash at the end and without links: what the system says of it is the same.
  const std::filesystem::path& path() const { return folder; }

 private:
  std::filesystem::path folder;
};
