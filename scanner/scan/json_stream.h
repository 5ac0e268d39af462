// SPDX-License-Identifier: MIT
// The file, or standard output, that events are written to.
#pragma once

#include <string>

namespace scanner {

/// Each line is written whole and at once, so that a reader, and a file that is left behind, ends at a whole
/// line.
class JsonStream {
 public:
  JsonStream() = default;
  ~JsonStream();
  JsonStream(const JsonStream&) = delete;
  JsonStream& operator=(const JsonStream&) = delete;

  /// `file`: empty for none, "-" for standard output. A file is made new, so this is for a scan that is about
  /// to start. Throws std::runtime_error with a sentence where it cannot be.
  void openFile(const std::string& file);

  /// Whether lines are wanted and can still be written.
  [[nodiscard]] bool isOpen() const { return descriptor >= 0 && trouble.empty(); }

  void write(const std::string& line);

  /// Why no more is written; empty while all is well.
  [[nodiscard]] const std::string& problem() const { return trouble; }

  /// Whether that is because whoever read a pipe has closed it.
  [[nodiscard]] bool hasLostReader() const { return isReaderGone; }

 private:
  std::string name;
  int descriptor = -1;
  bool isOwned = false;
  std::string trouble;
  bool isReaderGone = false;
};

}  // namespace scanner
