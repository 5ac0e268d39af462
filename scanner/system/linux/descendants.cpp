// SPDX-License-Identifier: MIT
// Finding, watching and killing what a run has started.
#include <algorithm>
#include <chrono>
#include <csignal>
#include <cstdlib>

#include <sys/prctl.h>
#include <sys/shm.h>
#include <unistd.h>

#include "scanner/system/linux/proc.h"
#include "scanner/system/linux/system_calls.h"
#include "scanner/system/system.h"

namespace scanner::system {
namespace {

/// The one outside, and the first one in the process namespace.
constexpr std::size_t kSandboxProcesses = 2;
constexpr std::chrono::seconds kPatience{5};
constexpr useconds_t kRoundInMicroseconds = 500;

// Places of fields behind the name in /proc/PID/stat.
constexpr std::size_t kState = 0;
constexpr std::size_t kUserTicks = 11;
constexpr std::size_t kSystemTicks = 12;
constexpr std::size_t kAddressSpace = 20;
constexpr std::size_t kResidentPages = 21;

double ticksIn(const std::vector<std::string>& stat) {
  if (stat.size() <= kSystemTicks) return 0;
  return std::strtod(stat[kUserTicks].c_str(), nullptr) + std::strtod(stat[kSystemTicks].c_str(), nullptr);
}

std::vector<std::string> statOf(const std::string& process) {
  return statFields(readProc(process + "/stat"));
}

unsigned openSockets(int process) {
  const std::string folder = "/proc/" + std::to_string(process) + "/fd/";
  unsigned sockets = 0;
  for (const int descriptor : descriptorsOf(process)) {
    char target[64];
    const ssize_t length = readlink((folder + std::to_string(descriptor)).c_str(), target, sizeof target - 1);
    if (length > 0 && std::string(target, static_cast<std::size_t>(length)).rfind("socket:", 0) == 0)
      ++sockets;
  }
  return sockets;
}

}  // namespace

void adoptOrphans() { prctl(PR_SET_CHILD_SUBREAPER, 1); }

namespace {

bool isIn(const std::vector<int>& processes, int process) {
  return std::find(processes.begin(), processes.end(), process) != processes.end();
}

/// Reaps an orphan that has ended; kills any other with all of its descendants.
void endOrphan(int orphan, const Marks& marks, Orphans& orphans) {
  if (const std::optional<ProcessEnd> ended = reapIfEnded(orphan)) {
    addUsage(orphans.used, *ended);
    return;
  }
  orphans.left.push_back(orphan);
  std::vector<int> family = descendantsOf(orphan);
  family.push_back(orphan);
  for (const int process : family) {
    if (killIfMarked(process, marks) && !isIn(orphans.killed, process)) orphans.killed.push_back(process);
  }
}

}  // namespace

Orphans killOrphans(const Marks& marks, const std::vector<int>& living) {
  Orphans orphans;
  // A process that is killed may have started another one just before, and takes a moment to end.
  for (const auto end = std::chrono::steady_clock::now() + kPatience;;) {
    orphans.left.clear();
    for (const int child : childrenOf(getpid())) {
      if (isIn(living, child)) continue;
      const Mark mark = markOf(child);
      if (mark >= marks.first && mark <= marks.last) endOrphan(child, marks, orphans);
    }
    if (orphans.left.empty() || std::chrono::steady_clock::now() > end) break;
    usleep(kRoundInMicroseconds);
  }
  return orphans;
}

unsigned removeSharedMemory(const std::vector<int>& makers, double since) {
  shm_info info = {};
  const int highest = shmctl(0, SHM_INFO, reinterpret_cast<shmid_ds*>(&info));
  unsigned removed = 0;
  for (int index = 0; info.used_ids > 0 && index <= highest; ++index) {
    shmid_ds segment = {};
    const int id = shmctl(index, SHM_STAT, &segment);
    const bool isTheirs =
        id >= 0 && std::find(makers.begin(), makers.end(), segment.shm_cpid) != makers.end();
    // The system's time of change has whole seconds.
    if (!isTheirs || static_cast<double>(segment.shm_ctime) + 1 < since) continue;
    if (shmctl(id, IPC_RMID, nullptr) == 0) ++removed;
  }
  return removed;
}

void signalRun(int process, bool isSandboxed, int signal) {
  if (!isSandboxed) {
    kill(process, signal);
    return;
  }
  // To signal the sandbox's own processes would end everything at once.
  const std::vector<int> descendants = descendantsOf(process);
  kill(descendants.size() < kSandboxProcesses ? process : descendants[kSandboxProcesses - 1], signal);
}

Sample sampleRun(int process, bool isSandboxed, bool inDetail) {
  static const double ticksPerSecond = static_cast<double>(sysconf(_SC_CLK_TCK));
  static const auto bytesPerPage = static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE));
  Sample sample;
  std::vector<int> processes = descendantsOf(process);
  processes.insert(processes.begin(), process);
  double mostTicks = -1;
  std::size_t ofTheSandbox = isSandboxed ? std::min(kSandboxProcesses, processes.size() - 1) : 0;
  for (const int one : processes) {
    const bool isOfTheSandbox = ofTheSandbox > 0;
    if (isOfTheSandbox) --ofTheSandbox;
    const std::string folder = std::to_string(one);
    const std::vector<std::string> stat = statOf(folder);
    if (stat.size() <= kResidentPages) continue;
    sample.processorSeconds += ticksIn(stat) / ticksPerSecond;
    sample.residentBytes += std::strtoull(stat[kResidentPages].c_str(), nullptr, 10) * bytesPerPage;
    const std::uint64_t addressSpace = std::strtoull(stat[kAddressSpace].c_str(), nullptr, 10);
    sample.addressSpaceBytes = std::max(sample.addressSpaceBytes, addressSpace);
    if (!inDetail || isOfTheSandbox) continue;
    sample.sockets += openSockets(one);
    for (const int thread : threadsOf(one)) {
      const std::string threadFolder = folder + "/task/" + std::to_string(thread);
      const std::vector<std::string> threadStat = statOf(threadFolder);
      const double ticks = ticksIn(threadStat);
      if (threadStat.empty() || ticks < mostTicks) continue;
      // Of threads that used the same time the innermost process's is the one of interest.
      mostTicks = ticks;
      sample.state = threadStat[kState][0];
      sample.systemCall = systemCallName(readProc(threadFolder + "/syscall"), is32Bit(one));
    }
  }
  return sample;
}

}  // namespace scanner::system
