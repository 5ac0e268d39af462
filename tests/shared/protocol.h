// SPDX-License-Identifier: MIT
// Reads what a run printed to standard output: the announced total, the steps, a failure line, and
// "unexpected exit". Every other line was printed by the plug-in.
//
//   for (const Section& section : sections(run.standardOutput)) {
//     if (section.line.kind == ProtocolLine::Kind::kStep) ... section.line.number, section.pluginLines ...
//   }
#pragma once

#include <cstddef>
#include <string>
#include <vector>

/// One line of a run's output.
struct ProtocolLine {
  enum class Kind {
    kOther,           ///< Not a line of the program.
    kTotal,           ///< "total, NUMBER"
    kStep,            ///< "NUMBER, TEXT"
    kFailure,         ///< "!TEXT"
    kUnexpectedExit,  ///< "unexpected exit"
  };
  Kind kind = Kind::kOther;
  int number = 0;    ///< kTotal, kStep.
  std::string text;  ///< kStep: without the number. kFailure: without the exclamation mark.
  std::string whole;
};

ProtocolLine readLine(const std::string& line);

/// A line of the program, and the plug-in's lines that follow it.
struct Section {
  ProtocolLine line;
  std::vector<std::string> pluginLines;
};

/// The whole output in order. The first section holds the plug-in's lines before any line of the program; its
/// own line is empty and of kind kOther.
std::vector<Section> sections(const std::string& output);

/// "total, 64" and the first `steps` step lines of an ordinary plug-in, at most 15, each with its line end.
std::string beginningOfRun(std::size_t steps);

/// Whether `line` is step `number` with one of the five texts that the random pass can draw.
bool isDrawnStep(const std::string& line, int number);
