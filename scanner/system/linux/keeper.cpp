// SPDX-License-Identifier: MIT
// The keeper: a process that outlives a scan that is killed, and cleans up behind it.
#include <cerrno>
#include <csignal>
#include <map>

#include <fcntl.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include "scanner/system/linux/proc.h"
#include "scanner/system/system.h"

namespace scanner::system {
namespace {

constexpr char kDismissed = 'd';
constexpr int kMostRounds = 400;
constexpr int kQuietRounds = 5;
constexpr useconds_t kPauseInMicroseconds = 2000;

std::map<int, pid_t>& keepers() {
  static std::map<int, pid_t> processes;
  return processes;
}

/// Until none has been seen for a few rounds: one that was just starting another must not get away with it.
void killEverythingMarked(const Marks& marks) {
  int quiet = 0;
  for (int round = 0; round < kMostRounds && quiet < kQuietRounds; ++round) {
    bool wasAny = false;
    for (const int process : allProcesses()) wasAny = killIfMarked(process, marks) || wasAny;
    quiet = wasAny ? 0 : quiet + 1;
    usleep(kPauseInMicroseconds);
  }
}

[[noreturn]] void keepWatch(int watched, const Marks& marks, const std::string& folder) {
  setsid();  // Ctrl-C is not for this process.
  for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGPIPE}) std::signal(signal, SIG_IGN);
  prctl(PR_SET_NAME, "vsttorture-keep");
  // Whoever reads the scan's output must not have to wait for this process.
  const int nothing = open("/dev/null", O_RDWR);
  for (const int descriptor : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) dup2(nothing, descriptor);
  close_range(static_cast<unsigned>(STDERR_FILENO + 1), static_cast<unsigned>(watched - 1), 0);
  close_range(static_cast<unsigned>(watched + 1), ~0U, 0);
  // No folder is held either: that of the scan may be on a disk that is to be removed.
  if (chdir("/") != 0) _exit(1);
  char word = 0;
  ssize_t count = 0;
  while ((count = read(watched, &word, 1)) < 0 && errno == EINTR) {
  }
  if (count == 1 && word == kDismissed) _exit(0);
  killEverythingMarked(marks);
  removeTree(folder);
  _exit(0);
}

}  // namespace

int startKeeper(const Marks& marks, const std::string& folder) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) return -1;
  const pid_t process = fork();
  if (process == 0) {
    close(ends[1]);
    keepWatch(ends[0], marks, folder);
  }
  close(ends[0]);
  if (process < 0) {
    close(ends[1]);
    return -1;
  }
  keepers()[ends[1]] = process;
  return ends[1];
}

void dismissKeeper(int keeper) {
  if (keeper < 0) return;
  [[maybe_unused]] const ssize_t written = write(keeper, &kDismissed, 1);
  close(keeper);
  while (waitpid(keepers()[keeper], nullptr, 0) < 0 && errno == EINTR) {
  }
  keepers().erase(keeper);
}

}  // namespace scanner::system
