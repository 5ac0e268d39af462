// SPDX-License-Identifier: MIT
// Standard output, kept for the description alone.
//
// Whatever else is printed there from now on, by the plug-in, by the libraries that it loads or by the crash
// guard, goes to standard error. So standard output holds one whole object or nothing.
#pragma once

#include <string>

class PrivateOutput {
 public:
  /// Takes standard output for itself and redirects it to standard error.
  PrivateOutput();
  ~PrivateOutput();
  PrivateOutput(const PrivateOutput&) = delete;
  PrivateOutput& operator=(const PrivateOutput&) = delete;

  /// Writes all of `text`. False when that fails; errno says why.
  bool write(const std::string& text);

 private:
  int descriptor;  ///< Owned.
};
