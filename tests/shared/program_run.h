// SPDX-License-Identifier: MIT
// Runs a program as a host application does, and returns everything that a host can see of it.
//
//   const ProgramRun run = runVstTorture({samplePlugin("shell")});
//   EXPECT_THAT(lines(run.standardOutput), ElementsAre("total, 51", "1, test gathering info"));
//   EXPECT_EQ(run.end, "exit status 1");
//
// The program has a process group of its own; when it has ended, the rest of the group is killed. Standard
// input is /dev/null, no core is dumped, the stack is limited to 8 MiB, and no signal is ignored. The environment
// is fixed: LC_ALL=C, PATH=/usr/bin:/bin, HOME a new folder that is removed after the run, and the options of the
// sanitizers.
#pragma once

#include <map>
#include <string>
#include <vector>

/// What the host does with the program's standard output.
enum class Reader {
  kReads,       ///< Reads it from the start to the end.
  kReadsLate,   ///< Begins to read after half a second, or when the program has ended.
  kStops,       ///< Reads until the text of the interruption has come, and no further.
  kNeverReads,  ///< Never reads, and the pipe is full from the start.
  kIsGone,      ///< Has closed its end of the pipe.
  kWasNone,     ///< The program starts with standard output closed.
};

/// Signals that the host sends to the program, in this order.
struct Interruption {
  std::vector<int> signals = {};
  std::string afterText = {};  ///< The host waits until the program has printed this,
  double afterSeconds = 0;     ///< and then for this time.
  double secondsBetween = 0;   ///< Between two signals. Nothing is read meanwhile.
};

struct ProgramCall {
  std::vector<std::string> arguments = {};
  std::map<std::string, std::string> environment = {};  ///< Added to the fixed one; replaces equal names.
  std::string workingDirectory = {};                    ///< Empty: the same folder as HOME.
  double timeLimitInSeconds = 60;
  Reader reader = Reader::kReads;
  Interruption interruption = {};
};

struct ProgramRun {
  std::string standardOutput;
  std::string standardError;
  std::string
      end;  ///< "exit status N", "signal N", or "timed out" for a program that was killed at the limit.
  double elapsedSeconds;
  double secondsSinceInterruption;  ///< 0 when there was none.
};

/// Runs `program`, a path, until it ends or is killed at the time limit. Processes that it started are killed
/// when it has ended; their output after that is not read.
/// Throws std::system_error when the program cannot be started.
ProgramRun runProgram(const std::string& program, const ProgramCall& call);

/// Runs the program under test.
ProgramRun runVstTorture(const ProgramCall& call);
ProgramRun runVstTorture(const std::vector<std::string>& arguments);

/// The absolute path of a sample plug-in, by the name of its folder.
std::string samplePlugin(const std::string& name);

/// The call that runs the faulty sample with a fault of this kind at this place (see plugins/faulty/).
ProgramCall faultyPlugin(const std::string& kind, const std::string& place);

/// The lines of a text, without their line ends. Text after the last line end is a line too.
std::vector<std::string> lines(const std::string& text);
