// SPDX-License-Identifier: MIT
// What the scan asks of the operating system beyond files, pipes and timers: processes with limits, who their
// descendants are and what these are doing, a sandbox, and a keeper that cleans up when the scan itself is
// killed. All of it is Linux's own way of doing it; another system gets a folder of its own beside linux/.
#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace scanner::system {

// ---- Processes --------------------------------------------------------------------------------------------

/// A number that a process and all that it starts carry for good: neither a new session nor a cleared environment
/// takes it off, and only the administrator could. 0 for none.
using Mark = std::uint64_t;

struct Marks {
  Mark first = 0;
  Mark last = 0;  ///< Part of the range.
};

/// Marks that no other scan on this machine uses, a million of them.
Marks newMarks();

struct ProcessStart {
  std::vector<std::string> command;      ///< The program's absolute path first.
  std::vector<std::string> environment;  ///< NAME=VALUE, all of it.
  std::string workingDirectory;
  int standardOutput = -1;  ///< Descriptors that the process gets as 1 and 2. Borrowed.
  int standardError = -1;
  std::uint64_t addressSpaceInBytes = 0;  ///< 0: no limit. Also of the process's children.
  std::uint64_t fileSizeInBytes = 0;      ///< Of each file that is written; 0: no limit.
  Mark mark = 0;
};

/// Starts a process in a session and process group of its own, with standard input from /dev/null, no core
/// files, no other descriptor of ours, and default signals. It is killed when this thread ends.
/// Returns its number, or -1 with the reason; `isShortage` tells whether the system has no more processes or memory
/// at this moment.
int startProcess(const ProcessStart& start, std::string& reason, bool* isShortage = nullptr);

/// Lets this process open as many descriptors as it may. Those that it starts get the limit that it had before.
void allowManyDescriptors();

/// How many processors this process may use, as taskset and containers limit them: 1 at least.
unsigned usableProcessors();

/// The number of a child, adopted ones too, that has ended and waits to be reaped, which keeps its number from being
/// used again; 0 when there is none.
int endedChild();

struct ProcessEnd {
  bool isSignalled = false;
  int value = 0;  ///< The signal, or the exit status; -1 where the system does not know it.
  double userSeconds = 0;
  double systemSeconds = 0;
  /// Resident. Never less than what this process used when it started the other one: until that becomes a program of
  /// its own, the system counts their common memory as its.
  std::uint64_t peakMemoryInBytes = 0;
};

/// Adds the times of `other`, and keeps the larger memory.
void addUsage(ProcessEnd& end, const ProcessEnd& other);

/// Waits for a child and forgets it.
ProcessEnd reap(int process);

/// The same without waiting: nothing for a child that has not ended, or whose end somebody else has to see first, as
/// for one that is being traced.
std::optional<ProcessEnd> reapIfEnded(int process);

// ---- Descendants ------------------------------------------------------------------------------------------

/// From now on a descendant that loses its parent becomes a child of this process, so that it can be found.
void adoptOrphans();

/// Kills and reaps what this process has adopted and what carries one of these marks, with all of its descendants.
/// `living` are our own children, which are left alone. Waits up to 5 seconds for the end of what was killed.
struct Orphans {
  std::vector<int> killed;  ///< Their numbers.
  std::vector<int> left;    ///< Those of our children that did not end in time.
  ProcessEnd used;          ///< Times and memory of all that were reaped; the rest of it says nothing.
};
Orphans killOrphans(const Marks& marks, const std::vector<int>& living);

/// Removes the segments of System V shared memory that these processes have made since then (seconds since 1970).
/// Returns how many. Numbers of processes are good for this only as long as they cannot have been used again.
unsigned removeSharedMemory(const std::vector<int>& makers, double since);

/// Sends a signal to the innermost processes of a run: to `process` itself, or, where that is a sandbox, to
/// what runs in it.
void signalRun(int process, bool isSandboxed, int signal);

/// What a process and its descendants are doing at this moment.
struct Sample {
  double processorSeconds = 0;  ///< Used so far, all together.
  std::uint64_t residentBytes = 0;
  std::uint64_t addressSpaceBytes = 0;  ///< Of the process that has most of it.
  char state = '?';                     ///< Of the busiest thread: R, S, D, T, Z.
  std::string systemCall;               ///< That it sleeps in; empty when it is in none.
  unsigned sockets = 0;                 ///< Open ones.
};

/// Processor time and memory; with `inDetail` the rest as well, which takes longer. The processes of a sandbox itself
/// have no part in that.
Sample sampleRun(int process, bool isSandboxed, bool inDetail);

// ---- Folders ----------------------------------------------------------------------------------------------

/// Removes a folder with all that is in it, whatever its depth and its permissions, as far as this process may.
/// False when something is left.
bool removeTree(const std::string& folder);

/// Something that is somewhere below a folder.
struct TreeEntry {
  std::string path;       ///< Relative to the folder.
  bool isFolder = false;  ///< A link to one is none.
  std::uint64_t bytesOnDisk =
      0;  ///< What a file takes, which is less than its length where it has holes. Else 0.
};

/// Calls `visit` with all that is below a folder, down to `mostLevels` below it, until that returns false. A folder
/// comes before what is in it. Links are not followed; what cannot be read is left out.
void visitTree(const std::string& folder, unsigned mostLevels,
               const std::function<bool(const TreeEntry&)>& visit);

struct FolderLook {
  unsigned entries = 0;      ///< In the folder itself, without "." and "..".
  unsigned permissions = 0;  ///< The lower bits of its mode, such as 0700.
};

/// Nothing when it is not there, no folder but a link, or cannot be read.
std::optional<FolderLook> lookAtFolder(const std::string& folder);

// ---- Sandbox ----------------------------------------------------------------------------------------------

/// The command that runs another one confined: the file system read-only but for `writable`, no network, a
/// process namespace of its own that ends with it. `sharedMemory`, a folder in `writable`, is its /dev/shm. Goes in
/// front of that command.
std::vector<std::string> sandboxCommand(const std::string& sandbox, const std::string& writable,
                                        const std::string& sharedMemory);

/// The path of the system's sandbox program, or nothing with the reason why there is none that works: it is
/// tried once, with `writable`.
std::optional<std::string> findSandbox(const std::string& writable, std::string& reason);

// ---- Keeper -----------------------------------------------------------------------------------------------

/// Starts a process that waits for this one to end. When it ends without having called dismissKeeper(), the
/// keeper kills every process that carries one of these marks, removes `folder` and ends. Returns a handle, or -1.
/// To be called while this process has one thread.
int startKeeper(const Marks& marks, const std::string& folder);

/// Lets the keeper end without doing anything, and waits for that.
void dismissKeeper(int keeper);

}  // namespace scanner::system
