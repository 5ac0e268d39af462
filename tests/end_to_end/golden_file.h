// SPDX-License-Identifier: MIT
// Golden files: the exact lines that a run is expected to give, kept in tests/end_to_end/golden/.
//
// The random pass of a run, steps 16 to 65, stands there as one line, kRandomPass. It stands for fifty step
// lines, numbered on, each with the text of one of the five tests that may be drawn.
//
// UPDATE_GOLDEN=1 in the environment of the tests writes the files anew.
#pragma once

#include <string>
#include <vector>

#include <gtest/gtest.h>

constexpr const char* kRandomPass = "16 to 65, tests drawn at random";

/// Whether the line announces a drawn test under this number.
bool isDrawnStep(const std::string& line, int number);

/// The lines of a golden file for `actual`: the random pass, where there is a right one, as one line.
std::vector<std::string> foldRandomPass(const std::vector<std::string>& actual);

/// What differs first between the lines of a golden file and those of a run; empty when nothing does.
std::string firstDifference(const std::vector<std::string>& golden, const std::vector<std::string>& actual);

/// Compares with golden/NAME.txt, or writes it.
testing::AssertionResult matchesGolden(const std::string& name, const std::vector<std::string>& actual);

/// The lines of golden/NAME.txt; none when there is no such file.
std::vector<std::string> goldenLines(const std::string& name);
void writeGolden(const std::string& name, const std::vector<std::string>& golden);
bool goldenIsToBeUpdated();
