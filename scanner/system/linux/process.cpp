// SPDX-License-Identifier: MIT
// Processes with limits.
#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <random>

#include <fcntl.h>
#include <linux/close_range.h>
#include <sched.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include "scanner/system/system.h"

namespace scanner::system {
namespace {

void limit(int what, std::uint64_t most) {
  const rlimit value = {static_cast<rlim_t>(most), static_cast<rlim_t>(most)};
  setrlimit(static_cast<__rlimit_resource>(what), &value);
}

void takeDefaultSignals() {
  for (int signal = 1; signal < NSIG; ++signal) std::signal(signal, SIG_DFL);
  sigset_t none;
  sigemptyset(&none);
  sigprocmask(SIG_SETMASK, &none, nullptr);
}

std::vector<char*> pointersTo(const std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  pointers.reserve(texts.size() + 1);
  for (const std::string& text : texts) pointers.push_back(const_cast<char*>(text.c_str()));
  pointers.push_back(nullptr);
  return pointers;
}

/// What allowManyDescriptors() has changed for this process alone.
rlimit& usualDescriptorLimit() {
  static rlimit usual = {0, 0};
  return usual;
}

/// Runs in the new process, which shares the memory of this one: nothing of it is changed. `failure` is closed when the program begins, or gets the number of the error.
[[noreturn]] void becomeProgram(const ProcessStart& start, char* const* command, char* const* environment,
                                int parent, int failure) {
  // The mark first: from here on whoever cleans up finds this process.
  if (start.mark != 0) limit(RLIMIT_LOCKS, start.mark);
  setsid();
  takeDefaultSignals();
  prctl(PR_SET_PDEATHSIG, SIGKILL);
  if (getppid() != parent) _exit(127);  // It has ended already.
  const int input = open("/dev/null", O_RDONLY);
  dup2(input, STDIN_FILENO);
  dup2(start.standardOutput, STDOUT_FILENO);
  dup2(start.standardError, STDERR_FILENO);
  // Those that this process has inherited are no business of a plug-in either.
  close_range(static_cast<unsigned>(STDERR_FILENO + 1), ~0U, CLOSE_RANGE_CLOEXEC);
  // One byte is too little for a file, and the only limit with which the kernel does not hand the core to a program
  // (/proc/sys/kernel/core_pattern).
  limit(RLIMIT_CORE, 1);
  if (usualDescriptorLimit().rlim_max > 0) setrlimit(RLIMIT_NOFILE, &usualDescriptorLimit());
  if (start.addressSpaceInBytes > 0) limit(RLIMIT_AS, start.addressSpaceInBytes);
  if (start.fileSizeInBytes > 0) limit(RLIMIT_FSIZE, start.fileSizeInBytes);
  if (chdir(start.workingDirectory.c_str()) == 0) execve(command[0], command, environment);
  const int error = errno;
  [[maybe_unused]] const ssize_t written = write(failure, &error, sizeof error);
  _exit(127);
}

/// Returns in this process alone. A function of its own: a variable that lives across vfork() may be lost.
__attribute__((noinline)) pid_t beginProgram(const ProcessStart& start, char* const* command,
                                             char* const* environment, int parent, int failure) {
  const pid_t process =
      vfork();  // NOLINT(clang-analyzer-security.insecureAPI.vfork): a fork copies page tables
  // NOLINTNEXTLINE(clang-analyzer-unix.Vfork): it makes system calls, and changes nothing that this process reads
  if (process == 0) becomeProgram(start, command, environment, parent, failure);
  return process;
}

}  // namespace

Marks newMarks() {
  constexpr Mark kCount = Mark{1} << 20;
  rlimit own = {};
  getrlimit(RLIMIT_LOCKS, &own);
  // A mark is a limit, which can only be lowered. Below a scan that runs in another one's run there is still room.
  const Mark highest = std::min(static_cast<Mark>(own.rlim_max), Mark{1} << 62);
  std::random_device random;
  const Mark number = Mark{random()} << 32 | random();
  const Mark first = highest > 4 * kCount ? highest / 2 + number % (highest / 2 - kCount) : 1;
  // One that may have no locks at all gets a mark that nothing carries.
  return {first, std::max(first, std::min(first + kCount - 1, highest))};
}

int startProcess(const ProcessStart& start, std::string& reason, bool* isShortage) {
  int failure[2];
  if (pipe2(failure, O_CLOEXEC) != 0) {
    if (isShortage != nullptr) *isShortage = true;
    reason = std::strerror(errno);
    return -1;
  }
  const std::vector<char*> command = pointersTo(start.command);
  const std::vector<char*> environment = pointersTo(start.environment);
  const pid_t parent = getpid();
  static_cast<void>(usualDescriptorLimit());  // Made here, not in the new process.
  // No handler of this process may run in the new one, whose memory it shares.
  sigset_t all;
  sigset_t before;
  sigfillset(&all);
  sigprocmask(SIG_SETMASK, &all, &before);
  const pid_t process = beginProgram(start, command.data(), environment.data(), parent, failure[1]);
  int error = process < 0 ? errno : 0;
  sigprocmask(SIG_SETMASK, &before, nullptr);
  if (isShortage != nullptr) *isShortage = process < 0;
  close(failure[1]);
  ssize_t count = 0;
  while (process > 0 && (count = read(failure[0], &error, sizeof error)) < 0 && errno == EINTR) {
  }
  if (count > 0) reap(process);
  close(failure[0]);
  if (error == 0) return process;
  reason = start.command.front() + ": " + std::strerror(error);
  return -1;
}

void allowManyDescriptors() {
  rlimit own = {};
  if (getrlimit(RLIMIT_NOFILE, &own) != 0 || own.rlim_cur == own.rlim_max) return;
  usualDescriptorLimit() = own;
  own.rlim_cur = own.rlim_max;
  setrlimit(RLIMIT_NOFILE, &own);
}

unsigned usableProcessors() {
  cpu_set_t usable;
  // Fails on a machine with more processors than the set has room for.
  if (sched_getaffinity(0, sizeof usable, &usable) == 0) {
    const int count = CPU_COUNT(&usable);
    if (count > 0) return static_cast<unsigned>(count);
  }
  const long online = sysconf(_SC_NPROCESSORS_ONLN);
  return online > 0 ? static_cast<unsigned>(online) : 1;
}

int endedChild() {
  siginfo_t info = {};
  return waitid(P_ALL, 0, &info, WEXITED | WNOHANG | WNOWAIT) == 0 ? info.si_pid : 0;
}

void addUsage(ProcessEnd& end, const ProcessEnd& other) {
  end.userSeconds += other.userSeconds;
  end.systemSeconds += other.systemSeconds;
  end.peakMemoryInBytes = std::max(end.peakMemoryInBytes, other.peakMemoryInBytes);
}

namespace {

ProcessEnd endFrom(int status, const rusage& used) {
  const auto seconds = [](const timeval& time) {
    return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) / 1e6;
  };
  ProcessEnd end;
  end.isSignalled = WIFSIGNALED(status);
  end.value = end.isSignalled ? WTERMSIG(status) : WEXITSTATUS(status);
  end.userSeconds = seconds(used.ru_utime);
  end.systemSeconds = seconds(used.ru_stime);
  end.peakMemoryInBytes = static_cast<std::uint64_t>(used.ru_maxrss) * 1024;
  return end;
}

}  // namespace

ProcessEnd reap(int process) {
  int status = 0;
  rusage used = {};
  pid_t ended = 0;
  while ((ended = wait4(process, &status, 0, &used)) < 0 && errno == EINTR) {
  }
  if (ended == process) return endFrom(status, used);
  ProcessEnd unknown;
  unknown.value = -1;
  return unknown;
}

std::optional<ProcessEnd> reapIfEnded(int process) {
  int status = 0;
  rusage used = {};
  if (wait4(process, &status, WNOHANG, &used) != process) return std::nullopt;
  return endFrom(status, used);
}

}  // namespace scanner::system
