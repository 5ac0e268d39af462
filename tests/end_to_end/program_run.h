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

struct ProgramCall {
  std::vector<std::string> arguments = {};
  std::map<std::string, std::string> environment = {};  ///< Added to the fixed one, or instead of it.
  std::string workingDirectory = {};                    ///< Empty: the same folder as HOME.
  double timeLimitInSeconds = 60;
};

struct ProgramRun {
  std::string standardOutput;
  std::string standardError;
  std::string end;  ///< "exit status N", "signal N" or "timed out", which ends in a kill.
  double elapsedSeconds;
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
