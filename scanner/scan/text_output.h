// SPDX-License-Identifier: MIT
// Where the program's texts for people go.
#pragma once

#include <string>

#include "scanner/report/terminal.h"
#include "scanner/scan/options.h"

namespace scanner {

/// What the report for people may do on this descriptor: whether it is a terminal, how wide, with which colours.
TerminalOptions terminalOptions(const ScanOptions& options, int descriptor);

/// How many columns a line may have there: those of the terminal as wide as it is now, 100 where there is
/// none.
unsigned textColumns(int descriptor);

/// Writes texts whole, until that fails once.
class TextOutput {
 public:
  explicit TextOutput(int descriptor_) : descriptor(descriptor_) {}

  /// False once a text could not be written.
  bool write(const std::string& text);

  int descriptor;
  bool hasFailed = false;
  std::string reason;  ///< The system's.
};

/// One line on standard error, with the program's name.
void complain(const std::string& sentence);

}  // namespace scanner
