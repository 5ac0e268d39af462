// SPDX-License-Identifier: MIT
#include "driver/last_words.h"

#include <atomic>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <ctime>

#include <poll.h>
#include <pthread.h>
#include <unistd.h>

#include "driver/safety_nets.h"

namespace {

constexpr char kUnexpectedExit[] = "unexpected exit";
constexpr int kWaitLimitInMilliseconds = 100;

enum class LastWords { kNotPrinted, kBeingPrinted, kPrinted };

std::atomic<LastWords> lastWords{LastWords::kNotPrinted};
std::atomic<bool> reportIsClosed{false};
std::atomic<pthread_t> closingThread{};
pid_t reportingProcess = 0;  // 0 before startReporting()

bool isOutputWritable() {
  pollfd output = {STDOUT_FILENO, POLLOUT, 0};
  return poll(&output, 1, 0) == 1 && (output.revents & POLLOUT) != 0;
}

/// Safe inside a signal handler.
long long nowInMilliseconds() {
  timespec now = {};
  clock_gettime(CLOCK_MONOTONIC, &now);
  return now.tv_sec * 1000LL + now.tv_nsec / 1000000;
}

/// Blocks the signals that ask a process to end, for as long as it lives.
class BlockedEndSignals {
 public:
  BlockedEndSignals() {
    sigset_t endSignals;
    sigemptyset(&endSignals);
    sigaddset(&endSignals, SIGINT);
    sigaddset(&endSignals, SIGHUP);
    sigaddset(&endSignals, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &endSignals, &before);
  }
  ~BlockedEndSignals() { pthread_sigmask(SIG_SETMASK, &before, nullptr); }
  BlockedEndSignals(const BlockedEndSignals&) = delete;
  BlockedEndSignals& operator=(const BlockedEndSignals&) = delete;

 private:
  sigset_t before;
};

/// True for the first caller, who has to print "unexpected exit".
bool claimLastWords() {
  LastWords expected = LastWords::kNotPrinted;
  return lastWords.compare_exchange_strong(expected, LastWords::kBeingPrinted);
}

/// Waits while another thread, or the code that this signal handler interrupted, prints "unexpected exit".
/// The clock limits the wait, not a number of sleeps: on a busy machine a sleep of 1 ms takes much longer.
void waitForLastWords() {
  const timespec millisecond = {0, 1000000};
  const long long limit = nowInMilliseconds() + kWaitLimitInMilliseconds;
  while (lastWords == LastWords::kBeingPrinted && nowInMilliseconds() < limit)
    nanosleep(&millisecond, nullptr);
}

void printLastWords() {
  if (!claimLastWords()) {
    waitForLastWords();
    return;
  }
  std::printf("%s", kUnexpectedExit);
  std::fflush(stdout);
  lastWords = LastWords::kPrinted;
}

}  // namespace

void startReporting() {
  lastWords = LastWords::kNotPrinted;
  reportingProcess = getpid();
}

bool isReportingProcess() {
  return reportingProcess == 0 || reportingProcess == getpid() || !isEnabled(SafetyNet::kOwnProcess);
}

void closeReport() {
  closingThread = pthread_self();
  reportIsClosed = true;
}

bool isReportClosed() { return reportIsClosed; }

void waitIfReportIsClosed() {
  if (!reportIsClosed) return;
  if (pthread_equal(closingThread, pthread_self()) != 0) std::abort();
  for (;;) pause();
}

void printUnexpectedExit() {
  // With these signals blocked, no handler can run after the text is printed and before `lastWords` says so.
  // They stay unblocked while waiting for stdout's lock and on a full pipe: there they must be able to end
  // the process.
  flockfile(stdout);
  if (isOutputWritable()) {
    const BlockedEndSignals blocked;
    printLastWords();
  } else {
    printLastWords();
  }
  funlockfile(stdout);
}

void printUnexpectedExitDirectly() {
  if (!isReportingProcess()) return;
  if (!claimLastWords()) waitForLastWords();
  if (lastWords == LastWords::kPrinted || !isOutputWritable()) return;
  [[maybe_unused]] const ssize_t written = write(STDOUT_FILENO, kUnexpectedExit, sizeof kUnexpectedExit - 1);
  lastWords = LastWords::kPrinted;
}
