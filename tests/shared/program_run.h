// SPDX-License-Identifier: MIT
// Runs a program as a host application does, and tells everything that a host can see of it.
//
//   const ProgramRun run = runVstTorture({samplePlugin("shell")});
//   EXPECT_THAT(lines(run.standardOutput), ElementsAre("total, 51", "1, test gathering info"));
//   EXPECT_EQ(run.end, "exit status 1");
//
// The child has a process group of its own; at its end whatever is left of the group is killed, so nothing
// outlives the call. It reads /dev/null, dumps no core, and sees a fixed environment: LC_ALL=C, a PATH of the
// system's folders, HOME a folder that lives as long as the run, and the options of the sanitizers.
#pragma once

#include <map>
#include <string>
#include <vector>

/// What the host does with the program's standard output.
enum class Reader {
  kReads,       ///< Reads it from the start to the end.
  kReadsLate,   ///< Begins to read after half a second, or when the program has ended.
  kStops,       ///< Reads until the text of the interruption has come, and no more.
  kNeverReads,  ///< Does not even read what was in the pipe before: it is full from the start.
  kIsGone,      ///< Has closed its end of the pipe.
  kWasNone,     ///< Gives the program no standard output at all.
};

/// Signals that the host sends to the program, in this order.
struct Interruption {
  std::vector<int> signals = {};
  std::string afterText = {};  ///< Not before the program has printed this,
  double afterSeconds = 0;     ///< nor before this much more time has passed.
  double secondsBetween = 0;   ///< The host does nothing else meanwhile.
};

struct ProgramCall {
  std::vector<std::string> arguments = {};
  std::map<std::string, std::string> environment = {};  ///< Added to the fixed one, or instead of it.
  std::string workingDirectory = {};                    ///< Empty: the same folder as HOME.
  double timeLimitInSeconds = 60;
  Reader reader = Reader::kReads;
  Interruption interruption = {};
};

struct ProgramRun {
  std::string standardOutput;
  std::string standardError;
  std::string end;  ///< "exit status N", "signal N" or "timed out", which ends in a kill.
  double elapsedSeconds;
  double secondsSinceInterruption;  ///< 0 when there was none.
};

/// Runs `program`, a path, to its end: neither the program nor the time limit leaves anything running. What a
/// grandchild writes after the program has ended is not waited for.
/// Throws std::system_error when the program cannot be started.
ProgramRun runProgram(const std::string& program, const ProgramCall& call);

/// Runs the program under test.
ProgramRun runVstTorture(const ProgramCall& call);
ProgramRun runVstTorture(const std::vector<std::string>& arguments);

/// The absolute path of a sample plug-in, by the name of its folder.
std::string samplePlugin(const std::string& name);

/// The lines of a text, without their ends. What follows the last end is a line too, unless it is empty.
std::vector<std::string> lines(const std::string& text);
