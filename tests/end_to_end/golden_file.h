// SPDX-License-Identifier: MIT
// Golden files: the exact lines that a run is expected to print, kept in tests/end_to_end/golden/.
//
// The random pass of a run, steps 16 to 65, is one line there, kRandomPass. It stands for fifty step lines
// with consecutive numbers, each with one of the five texts that can be drawn.
//
// UPDATE_GOLDEN=1 in the environment of the tests rewrites the files.
#pragma once

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/shared/program_run.h"

constexpr const char* kRandomPass = "16 to 65, tests drawn at random";

/// The lines of standard output and, as the last one, how the run ended.
std::vector<std::string> linesAndEnd(const ProgramRun& run);

/// `actual` with its random pass as one line. Unchanged when a step of the pass is missing or wrong.
std::vector<std::string> foldRandomPass(std::vector<std::string> actual);

/// The first line in which the two differ, in words; empty when they are equal.
std::string firstDifference(const std::vector<std::string>& expected, const std::vector<std::string>& actual);

/// Compares `actual`, its random pass folded, with golden/NAME.txt, or writes that file.
testing::AssertionResult matchesGolden(const std::string& name, const std::vector<std::string>& actual);

/// The lines of golden/NAME.txt; none when there is no such file.
std::vector<std::string> goldenLines(const std::string& name);
void writeGolden(const std::string& name, const std::vector<std::string>& golden);
bool goldenIsToBeUpdated();
