// SPDX-License-Identifier: MIT
// Faults on a plug-in's own thread, and in what a plug-in shares with its host.
#include <algorithm>
#include <cfenv>
#include <chrono>
#include <clocale>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <future>
#include <string>
#include <thread>

#include <pthread.h>
#include <unistd.h>

#include "plugins/faulty/faults.h"

namespace sample_plugins {

void crashOnAThread() { std::thread(storeToAddressZero).join(); }

void throwOnAThread() {
  std::thread([] { throw 5; }).join();
}

void overflowTheStackOfAThread() { std::thread(overflowTheStack).join(); }

/// The exit after a crash may take one second.
void crashOnAThreadBehindTheRun() {
  static std::promise<void> leaving;
  std::atexit([] {
    leaving.set_value();
    std::this_thread::sleep_for(std::chrono::milliseconds(300));
  });
  std::thread(storeToAddressZero).detach();
  leaving.get_future().wait();
}

void replaceHandlersThenCrash() {
  for (const int number :
       {SIGINT, SIGABRT, SIGHUP, SIGSEGV, SIGTERM, SIGBUS, SIGILL, SIGFPE, SIGTRAP, SIGSYS}) {
    std::signal(number, SIG_DFL);
  }
  storeToAddressZero();
}

void blockSignalsThenCrash() {
  sigset_t all;
  sigfillset(&all);
  pthread_sigmask(SIG_BLOCK, &all, nullptr);
  storeToAddressZero();
}

void blockSignalsButCrashes() {
  sigset_t most;
  sigfillset(&most);
  for (const int number : {SIGABRT, SIGSEGV, SIGBUS, SIGILL, SIGFPE, SIGTRAP, SIGSYS}) {
    sigdelset(&most, number);
  }
  pthread_sigmask(SIG_BLOCK, &most, nullptr);
}

void leaveTheThread() { pthread_exit(nullptr); }

void bufferStdout() {
  static char buffer[65536];
  if (std::setvbuf(stdout, buffer, _IOFBF, sizeof buffer) != 0) complain("no buffer for standard output");
}

void closeStdout() { close(STDOUT_FILENO); }

/// 8 MiB, more than any pipe takes in without a reader.
void floodStdout() {
  const std::string line = std::string(127, 'x') + '\n';
  for (int i = 0; i < 65536; ++i) {
    for (std::size_t done = 0; done < line.size();) {
      const ssize_t count = write(STDOUT_FILENO, line.data() + done, line.size() - done);
      if (count <= 0) return;
      done += static_cast<std::size_t>(count);
    }
  }
}

void changeLocaleAndDirectory() {
  for (const char* name : {"de_DE.UTF-8", "de_DE", "C.UTF-8"}) {
    if (std::setlocale(LC_ALL, name) != nullptr) break;
  }
  if (chdir("/") != 0) complain("cannot go to the root directory");
}

void trapFloatingPoint() { feenableexcept(FE_DIVBYZERO | FE_INVALID | FE_OVERFLOW); }

}  // namespace sample_plugins
