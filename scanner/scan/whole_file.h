// SPDX-License-Identifier: MIT
// A file that appears whole or not at all.
#pragma once

#include <string>

namespace scanner {

/// Is written under another name in the same folder, and takes its own name at the end. Until then a file that has the
/// name already stays as it is. What is no plain file, such as a pipe or a device, and standard output ("-") are
/// written to directly.
class WholeFile {
 public:
  /// Throws std::runtime_error with a sentence where the file cannot be made.
  explicit WholeFile(const std::string& file);
  /// Takes away what was written, unless finish() has been called.
  ~WholeFile();
  WholeFile(const WholeFile&) = delete;
  WholeFile& operator=(const WholeFile&) = delete;

  /// Both throw std::runtime_error with a sentence where the disk is full or the like.
  void write(const std::string& text);
  void finish();

 private:
  void openTemporary();
  [[noreturn]] void fail() const;

  std::string name;       ///< For sentences.
  std::string path;       ///< What is replaced at the end: behind all links.
  std::string temporary;  ///< Empty where the file is written to directly.
  int descriptor = -1;
};

}  // namespace scanner
