// SPDX-License-Identifier: MIT
// The value of --under: which tool runs a plug-in once more.
#pragma once

#include <stdexcept>
#include <string>
#include <vector>

namespace scanner {

struct ExplainTool {
  enum class Kind { kMemcheck, kGdb, kCommand };
  Kind kind = Kind::kCommand;
  std::string name;                  ///< "memcheck", "gdb", or the file name of the command's program.
  std::vector<std::string> command;  ///< The program's absolute path first; more for kCommand only.
};

/// The tool cannot be used; what() is a sentence for the user.
class UnusableTool : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Reads "memcheck", "gdb" or a command line, and looks for its program in PATH. Throws UnusableTool where it is not
/// there, naming the package of Debian's that has it.
ExplainTool findTool(const std::string& under);

/// Splits a command line at blanks as a shell does: '...', "..." and \ keep blanks in a word. Nothing is expanded.
/// Throws UnusableTool for a quote that is not closed.
std::vector<std::string> splitCommand(const std::string& line);

}  // namespace scanner
