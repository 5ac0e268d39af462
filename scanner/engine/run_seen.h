// SPDX-License-Identifier: MIT
// What was seen of one run: everything that a verdict may be based on, and nothing of the verdict.
//
// Plain values. Texts are bytes as they came.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace scanner {

/// The limits under which it ran.
struct Limits {
  // Both above 0. Time in which the engine could not look does not count.
  double stepInSeconds = 20;
  double runInSeconds = 120;
  std::uint64_t memoryInBytes = std::uint64_t{4} << 30;   ///< Address space; 0 for none.
  std::uint64_t outputInBytes = std::uint64_t{64} << 20;  ///< Both outputs together; above 0.
  std::uint64_t filesInBytes = std::uint64_t{1} << 30;  ///< Files in the scratch folder together; 0 for none.
};

/// How the process ended.
struct End {
  enum class Kind { kNotStarted, kExited, kSignalled, kNotEnded };  ///< kNotEnded: SIGKILL did not end it.
  Kind kind = Kind::kNotStarted;
  int status = 0;      ///< kExited
  int signal = 0;      ///< kSignalled
  std::string reason;  ///< kNotStarted: the system's.
};

/// Which limit of ours ended the run.
enum class LimitHit { kNone, kStep, kRun, kMemory, kOutput, kFiles, kInterrupted };

/// What a run was doing when its time was over.
struct Activity {
  double processorSeconds = 0;  ///< During the last part of the step that took too long,
  double wallSeconds = 0;       ///< which was as long as this.
  char state = '?';             ///< Of its busiest thread: R, S, D, T, Z as the kernel names them.
  std::string systemCall;       ///< "futex", "poll", "read" and the like; empty when it was in none.
  unsigned sockets = 0;         ///< Open ones.
};

/// One line of the run's protocol.
struct ProtocolLine {
  enum class Kind {
    kTotal,
    kStep,
    kFailure,
    kLastWords,
    kOutOfTurn,  ///< Looks like one of the others and was not due; the first 20.
  };
  Kind kind;
  int number = 0;         ///< kTotal, kStep
  std::string text = {};  ///< kStep: its text; kFailure, kOutOfTurn: the line.
};

/// What the plug-in printed, by the step in which it came.
struct PluginText {
  int step = 0;  ///< 0 before the first
  bool isStandardError = false;
  std::string bytes;
};

struct LeftBehind {
  unsigned processes = 0;          ///< That had to be killed after the run. Not known of one in a sandbox.
  unsigned sharedMemory = 0;       ///< Segments of System V shared memory that had to be removed.
  std::vector<std::string> files;  ///< In the scratch folder, relative to it; 100 of them at most.
  std::uint64_t fileCount = 0;
  std::uint64_t fileBytes = 0;
  /// Processes that SIGKILL did not end in time: as long as the kernel waits for a device or a file system, it ends no
  /// process. They and the scratch folder are left as they are.
  std::vector<int> unkillable = {};
  std::string folder = {};  ///< The scratch folder, where it was left.
};

struct RunSeen {
  End end;
  LimitHit limitHit = LimitHit::kNone;
  std::optional<Activity> activity = {};    ///< With kStep and kRun.
  std::vector<ProtocolLine> lines = {};     ///< In the order in which they came.
  std::vector<PluginText> texts = {};       ///< The last 64 KiB of each output.
  std::uint64_t outputBytes = 0;            ///< Both outputs, all of it.
  std::string record = {};                  ///< The flight record, 4096 bytes; empty when there was none.
  std::vector<std::string> toolFiles = {};  ///< Of a Tool: the first 32 MiB of each of its files.
  int process = 0;                          ///< Its number outside of a sandbox; 0 when it is not known.
  double startedAt = 0;                     ///< Seconds since 1970.
  double wallSeconds = 0;
  double userSeconds = 0;
  double systemSeconds = 0;
  std::uint64_t peakMemoryInBytes = 0;
  LeftBehind leftBehind = {};
  bool wasSandboxed = false;
};

}  // namespace scanner
