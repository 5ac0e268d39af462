// SPDX-License-Identifier: MIT
// The well-behaved effect that first does to its surroundings what UNRULY names: processes, files, memory and
// shared memory that nobody ends or removes.
// Used by the tests of the scan's engine. What it starts goes by the name in UNRULY_TOKEN.
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <fcntl.h>
#include <pthread.h>
#include <sys/mman.h>
#include <sys/shm.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "plugins/well_behaved_effect/well_behaved_effect.h"

namespace {

[[noreturn]] void sleepAsAnotherProgram(bool keepsEnvironment) {
  const char* const token = std::getenv("UNRULY_TOKEN");
  const char* const arguments[] = {token == nullptr ? "sleep" : token, "1000", nullptr};
  char* const nothing[] = {nullptr};
  execve("/bin/sleep", const_cast<char* const*>(arguments), keepsEnvironment ? environ : nothing);
  _exit(1);
}

void forkChild(bool hasOwnSession, bool isTwice, bool keepsEnvironment) {
  const pid_t child = fork();
  if (child != 0) {
    if (isTwice) waitpid(child, nullptr, 0);
    return;
  }
  if (hasOwnSession) setsid();
  if (isTwice && fork() != 0) _exit(0);
  sleepAsAnotherProgram(keepsEnvironment);
}

void ignoreTermination() {
  std::signal(SIGTERM, SIG_IGN);
  for (;;) pause();
}

void writeFile(const std::string& path, std::size_t megabytes) {
  const std::vector<char> block(1 << 20, 'x');
  const int file = open(path.c_str(), O_CREAT | O_WRONLY | O_TRUNC, 0600);
  for (std::size_t i = 0; i < megabytes; ++i) {
    if (write(file, block.data(), block.size()) < 0) break;
  }
  close(file);
}

void fillHome() {
  const std::string home = std::getenv("HOME");
  for (int number = 0; number < 100000; ++number) {
    writeFile(home + "/" + std::to_string(number), 1);
    usleep(2000);  // Leaves the disk of the machine some room.
  }
}

void writeLargeFile() {
  writeFile(std::string(std::getenv("HOME")) + "/large", 4096);
  for (;;) pause();
}

void floodStandardOutput() {
  const std::string block(1 << 20, 'x');
  for (int megabytes = 0; megabytes < 1024; ++megabytes) {
    if (write(STDOUT_FILENO, block.data(), block.size()) < 0) return;
  }
}

void openDescriptors() {
  for (int i = 0; i < 10000 && open("/dev/null", O_RDONLY) >= 0; ++i) {
  }
}

void allocateWithoutEnd() {
  constexpr std::size_t kSize = 32 << 20;
  for (;;) std::memset(new char[kSize], 1, kSize);
}

void startThreads() {
  pthread_attr_t small;
  pthread_attr_init(&small);
  pthread_attr_setstacksize(&small, 65536);
  for (int i = 0; i < 1000; ++i) {
    pthread_t thread;
    pthread_create(
        &thread, &small,
        [](void*) -> void* {
          for (;;) pause();
        },
        nullptr);
  }
}

void leaveSystemVSegment() {
  constexpr std::size_t kSize = 54321;
  static_cast<void>(shmget(IPC_PRIVATE, kSize, IPC_CREAT | 0600));
}

void leavePosixSegment() {
  const int file = shm_open("/vsttorture-unruly", O_CREAT | O_RDWR, 0600);
  static_cast<void>(ftruncate(file, 4096) == 0);
}

void burn() {
  for (volatile unsigned turns = 0;; turns = turns + 1) {
  }
}

struct Kind {
  const char* name;
  void (*act)();
};

constexpr Kind kKinds[] = {
    {"fork", [] { forkChild(false, false, true); }},
    {"fork_in_own_session", [] { forkChild(true, false, true); }},
    {"fork_twice", [] { forkChild(true, true, true); }},
    {"fork_twice_without_environment", [] { forkChild(true, true, false); }},
    {"ignore_termination", ignoreTermination},
    {"burn", burn},
    {"fill_home", fillHome},
    {"large_file", writeLargeFile},
    {"flood", floodStandardOutput},
    {"descriptors", openDescriptors},
    {"allocate", allocateWithoutEnd},
    {"threads", startThreads},
    {"system_v_segment", leaveSystemVSegment},
    {"posix_segment", leavePosixSegment},
};

void act() {
  const char* const wanted = std::getenv("UNRULY");
  for (const Kind& kind : kKinds) {
    if (wanted == nullptr || std::strcmp(wanted, kind.name) != 0) continue;
    kind.act();
    return;
  }
  std::fprintf(stderr, "UNRULY names nothing that this plug-in does\n");
  std::abort();
}

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  // A host may ask for another instance.
  static const bool hasActed = (act(), true);
  static_cast<void>(hasActed);
  return sample_plugins::instantiate<sample_plugins::WellBehavedEffect>(host);
}
