// SPDX-License-Identifier: MIT
// Faults of processes that the plug-in starts: they share its output and are not part of the run.
#include <cstdlib>

#include <sys/wait.h>
#include <unistd.h>

#include "plugins/faulty/faults.h"

namespace sample_plugins {
namespace {

/// Forks; the child does `work`, and the plug-in waits for its end.
void doInAChild(void (*work)()) {
  const pid_t child = fork();
  if (child == 0) {
    work();
    _exit(0);
  }
  waitpid(child, nullptr, 0);
}

/// Longer than a host should wait for a process that the plug-in left behind.
constexpr unsigned kChildLifeInSeconds = 30;

/// Does `work` in a process with a session of its own: killing the plug-in's process group does not reach it.
void doInASessionOfItsOwn(void (*work)()) {
  const pid_t child = fork();
  if (child != 0) {
    while (getsid(child) != child) usleep(100);
    return;
  }
  setsid();
  alarm(kChildLifeInSeconds);
  work();
  _exit(0);
}

}  // namespace

void forkKeepingStdout() {
  if (fork() != 0) return;
  sleep(kChildLifeInSeconds);
  _exit(0);
}

void daemonKeepingStdout() {
  doInASessionOfItsOwn([] { sleep(kChildLifeInSeconds); });
}

/// The daemon ends when nobody reads the stream any more.
void daemonFloodingStdout() {
  doInASessionOfItsOwn([] {
    for (;;) floodStdout();
  });
}

/// From here on two processes go on with the run.
void forkChildThatGoesOn() { static_cast<void>(fork()); }

void forkChildThatExits() {
  doInAChild([] { std::exit(9); });
}

void forkChildThatCrashes() { doInAChild(storeToAddressZero); }

/// The child runs in its parent's memory.
void vforkChildThatCrashes() {
  const pid_t child = vfork();  // NOLINT(clang-analyzer-security.insecureAPI.vfork): that is the point
  if (child == 0) {
    storeToAddressZero();
    _exit(0);
  }
  waitpid(child, nullptr, 0);
}

void becomeAnotherProgram() {
  execl("/bin/sh", "sh", "-c", "exit 9", nullptr);
  complain("there is no shell");
}

}  // namespace sample_plugins
