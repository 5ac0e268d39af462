// SPDX-License-Identifier: MIT
#include "driver/report.h"

#include <atomic>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <ctime>

#include <poll.h>
#include <pthread.h>
#include <unistd.h>

#include "driver/safety_nets.h"

int gStep = 0;
const char* gCurTest = nullptr;

namespace {

constexpr int kPhaseNameSize = 64;
constexpr int kLineSize = 128;
constexpr char kLastWords[] = "unexpected exit";
constexpr int kPatienceInMilliseconds = 100;

enum class LastWords { kUnsaid, kBeingSaid, kSaid };

std::atomic<LastWords> lastWords{LastWords::kUnsaid};
std::atomic<bool> reportIsClosed{false};
std::atomic<pthread_t> closer{};
pid_t owner = 0;  // Nobody's, before the report is opened.

/// The name of the phase under way, in a buffer of its own; empty before the first phase.
void copyPhaseName(char (&phase)[kPhaseNameSize]) {
  std::snprintf(phase, sizeof phase, "%s", gCurTest == nullptr ? "" : gCurTest);
}

void printLine(const char* line) {
  // Asked under the output's lock, so that nobody's last words get between the question and the line.
  flockfile(stdout);
  if (!reportIsClosed && isReportOurs()) {
    std::printf("%s", line);
    std::fflush(stdout);
  }
  funlockfile(stdout);
  waitIfReportIsClosed();
}

bool outputTakesMore() {
  pollfd output = {STDOUT_FILENO, POLLOUT, 0};
  return poll(&output, 1, 0) == 1 && (output.revents & POLLOUT) != 0;
}

/// Safe inside a signal handler.
long long nowInMilliseconds() {
  timespec now = {};
  clock_gettime(CLOCK_MONOTONIC, &now);
  return now.tv_sec * 1000LL + now.tv_nsec / 1000000;
}

/// Keeps the signals that ask a process to end waiting for a moment.
class HeldSignals {
 public:
  HeldSignals() {
    sigset_t asking;
    sigemptyset(&asking);
    sigaddset(&asking, SIGINT);
    sigaddset(&asking, SIGHUP);
    sigaddset(&asking, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &asking, &before);
  }
  ~HeldSignals() { pthread_sigmask(SIG_SETMASK, &before, nullptr); }
  HeldSignals(const HeldSignals&) = delete;
  HeldSignals& operator=(const HeldSignals&) = delete;

 private:
  sigset_t before;
};

/// Whether it is the caller who has to say them.
bool claimLastWords() {
  LastWords unsaid = LastWords::kUnsaid;
  return lastWords.compare_exchange_strong(unsaid, LastWords::kBeingSaid);
}

/// While somebody else is just saying them. The clock is asked, since on a busy machine a sleep of a
/// millisecond takes many.
void waitForLastWords() {
  const timespec millisecond = {0, 1000000};
  const long long limit = nowInMilliseconds() + kPatienceInMilliseconds;
  while (lastWords == LastWords::kBeingSaid && nowInMilliseconds() < limit) nanosleep(&millisecond, nullptr);
}

void sayLastWords() {
  if (!claimLastWords()) {
    waitForLastWords();
    return;
  }
  std::printf("%s", kLastWords);
  std::fflush(stdout);
  lastWords = LastWords::kSaid;
}

}  // namespace

void openReport() {
  std::setvbuf(stdout, nullptr, _IONBF, 0);
  lastWords = LastWords::kUnsaid;
  owner = getpid();
}

bool isReportOurs() { return owner == 0 || owner == getpid() || !isSpread(SafetyNet::kOwnProcess); }

void printUsage() { printLine("!too few arguments. syntax is command pathtovst childID(optional)\n"); }

void printTotal(int count) {
  char line[kLineSize];
  std::snprintf(line, sizeof line, "total, %d\n", count);
  printLine(line);
}

void printStep(const char* text) {
  ++gStep;
  char line[kLineSize];
  std::snprintf(line, sizeof line, "%d, %s\n", gStep, text);
  printLine(line);
}

void printFailure(int code) {
  char phase[kPhaseNameSize];
  copyPhaseName(phase);
  char line[kLineSize];
  std::snprintf(line, sizeof line, "!%s %s %d\n", phase, "failed", code);
  printLine(line);
}

void printFailure() {
  char phase[kPhaseNameSize];
  copyPhaseName(phase);
  char line[kLineSize];
  std::snprintf(line, sizeof line, "!%s %s\n", phase, "failed, unknown error");
  printLine(line);
}

void printUnexpectedExit() {
  // A second signal must not come between the words and the note that they are said. The waits are outside:
  // for the lock, and for room where there is none.
  flockfile(stdout);
  if (outputTakesMore()) {
    const HeldSignals held;
    sayLastWords();
  } else {
    sayLastWords();
  }
  funlockfile(stdout);
}

void printUnexpectedExitDirectly() {
  if (!isReportOurs()) return;
  if (!claimLastWords()) waitForLastWords();
  if (lastWords == LastWords::kSaid || !outputTakesMore()) return;
  [[maybe_unused]] const ssize_t written = write(STDOUT_FILENO, kLastWords, sizeof kLastWords - 1);
  lastWords = LastWords::kSaid;
}

void closeReport() {
  closer = pthread_self();
  reportIsClosed = true;
}

void waitIfReportIsClosed() {
  if (!reportIsClosed) return;
  if (pthread_equal(closer, pthread_self()) != 0) std::abort();
  for (;;) pause();
}
