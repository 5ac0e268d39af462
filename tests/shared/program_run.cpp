// SPDX-License-Identifier: MIT
// Runs a program as a host application does: fork, exec, two pipes, and a thread that waits for its end.
#include "tests/shared/program_run.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <optional>
#include <sstream>
#include <system_error>
#include <thread>

#include <fcntl.h>
#include <poll.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/shared/temporary_directory.h"

namespace {

using Clock = std::chrono::steady_clock;

constexpr std::chrono::milliseconds kLate{500};

[[noreturn]] void fail(const std::string& what) {
  throw std::system_error(errno, std::generic_category(), what);
}

/// Owns one end of a pipe, or nothing.
class Descriptor {
 public:
  Descriptor() = default;
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  ~Descriptor() { close(); }

  void set(int opened) { number = opened; }
  int get() const { return number; }
  void close() {
    if (number >= 0) ::close(number);
    number = -1;
  }

 private:
  int number = -1;
};

/// Both ends are closed on exec.
struct Pipe {
  Pipe() {
    std::array<int, 2> ends{};
    if (pipe(ends.data()) != 0) fail("pipe");
    reading.set(ends[0]);
    writing.set(ends[1]);
    for (const int end : ends) fcntl(end, F_SETFD, FD_CLOEXEC);
  }
  Descriptor reading;
  Descriptor writing;
};

/// Appends at most one buffer of what can be read now. Returns what read() does.
ssize_t readSome(int descriptor, std::string& text) {
  std::array<char, 65536> buffer;
  const ssize_t count = read(descriptor, buffer.data(), buffer.size());
  if (count > 0) text.append(buffer.data(), static_cast<std::size_t>(count));
  return count;
}

void setBlocking(int descriptor, bool blocks) {
  const int flags = fcntl(descriptor, F_GETFL);
  fcntl(descriptor, F_SETFL, blocks ? flags & ~O_NONBLOCK : flags | O_NONBLOCK);
}

/// Writes until the pipe is full. Returns the number of bytes written.
std::size_t fill(int pipeEnd) {
  setBlocking(pipeEnd, false);
  std::size_t count = 0;
  const std::array<char, 4096> filler{};
  for (ssize_t written = 0; (written = write(pipeEnd, filler.data(), filler.size())) > 0;) {
    count += static_cast<std::size_t>(written);
  }
  setBlocking(pipeEnd, true);
  return count;
}

Clock::duration seconds(double number) {
  return std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(number));
}

/// The null-terminated list that exec takes. It points into `texts`.
std::vector<char*> pointersTo(std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  for (std::string& text : texts) pointers.push_back(text.data());
  pointers.push_back(nullptr);
  return pointers;
}

/// Without a limit, a plug-in that overflows its stack takes all memory before it crashes.
void limitTheStack() {
  constexpr rlim_t kUsual = 8 << 20;
  rlimit limit = {};
  if (getrlimit(RLIMIT_STACK, &limit) != 0) return;
  limit.rlim_cur = std::min(kUsual, limit.rlim_max);
  setrlimit(RLIMIT_STACK, &limit);
}

/// What starts the tests may ignore some signals (nohup, and some servers of CI systems), and all that they start would
/// inherit that.
void takeDefaultSignals() {
  for (int number = 1; number < NSIG; ++number) std::signal(number, SIG_DFL);
}

std::vector<std::string> environmentOf(const ProgramCall& call, const std::string& home) {
  std::map<std::string, std::string> all = {{"HOME", home}, {"LC_ALL", "C"}, {"PATH", "/usr/bin:/bin"}};
#ifdef __SANITIZE_THREAD__
  // A crash ends the process through exit() inside the signal handler: the sanitizer must neither report that
  // nor sleep there.
  all["TSAN_OPTIONS"] = "report_signal_unsafe=0:atexit_sleep_ms=0";
#endif
  for (const char* name : {"ASAN_OPTIONS", "LSAN_OPTIONS", "TSAN_OPTIONS", "UBSAN_OPTIONS"}) {
    if (const char* value = std::getenv(name)) all[name] = value;
  }
  for (const auto& [name, value] : call.environment) all[name] = value;
  std::vector<std::string> entries;
  for (const auto& [name, value] : all) entries.push_back(name + '=' + value);
  return entries;
}

/// A program that was started and whose exit status was not yet taken.
class Child {
 public:
  Child(const std::string& program, const ProgramCall& itsCall, const std::string& home)
      : call(itsCall), start(Clock::now()) {
    std::vector<std::string> argumentTexts = call.arguments;
    argumentTexts.insert(argumentTexts.begin(), program);
    std::vector<std::string> environmentTexts = environmentOf(call, home);
    const std::vector<char*> arguments = pointersTo(argumentTexts);
    const std::vector<char*> environment = pointersTo(environmentTexts);
    const std::string folder = call.workingDirectory.empty() ? home : call.workingDirectory;

    if (call.reader == Reader::kNeverReads) fillerSize = fill(output.writing.get());
    if (call.reader == Reader::kIsGone) output.reading.close();

    Pipe failure;
    pid = fork();
    if (pid < 0) fail("fork");
    if (pid == 0) {
      become(program, folder, arguments, environment, failure.writing.get());
    }
    output.writing.close();
    error.writing.close();
    failure.writing.close();
    int problem = 0;
    if (read(failure.reading.get(), &problem, sizeof problem) > 0) {
      waitpid(pid, nullptr, 0);
      throw std::system_error(problem, std::generic_category(), program);
    }
    for (const Pipe* pipe : {&output, &error}) setBlocking(pipe->reading.get(), false);
    waiter = std::thread([this] {
      siginfo_t ignored;
      while (waitid(P_PID, static_cast<id_t>(pid), &ignored, WEXITED | WNOWAIT) != 0 && errno == EINTR) {
      }
      ended.writing.close();
    });
  }

  /// Reads until the program has ended, and sends the interruption's signals. False when the time limit comes
  /// first.
  bool follow(ProgramRun& run) {
    const Clock::time_point limit = start + seconds(call.timeLimitInSeconds);
    std::array<pollfd, 3> sources = {{{ended.reading.get(), POLLIN, 0}, {-1, POLLIN, 0}, {-1, POLLIN, 0}}};
    std::array<Descriptor*, 3> descriptors = {&ended.reading, &output.reading, &error.reading};
    const std::array<std::string*, 3> texts = {nullptr, &run.standardOutput, &run.standardError};
    while (sources[0].revents == 0) {
      const Clock::time_point now = Clock::now();
      if (now >= limit) return false;
      if (!interruptedAt && isTimeToInterrupt(run.standardOutput, now)) interrupt(now);
      sources[1].fd = readsNow(now) ? output.reading.get() : -1;
      sources[2].fd = error.reading.get();
      const auto left = std::chrono::ceil<std::chrono::milliseconds>(nextEvent(limit, now) - now).count();
      if (poll(sources.data(), sources.size(), static_cast<int>(left)) < 0 && errno != EINTR) fail("poll");
      for (std::size_t i = 1; i < sources.size(); ++i) {
        if (sources[i].revents != 0 && readSome(sources[i].fd, *texts[i]) == 0) descriptors[i]->close();
      }
    }
    return true;
  }

  double secondsSinceInterruption() const {
    return interruptedAt ? std::chrono::duration<double>(Clock::now() - *interruptedAt).count() : 0;
  }

  /// Kills the rest of the process group, waits for the program and returns its wait status.
  int endAndReap() {
    kill(-pid, SIGKILL);
    waiter.join();
    int status = 0;
    while (waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    return status;
  }

  /// Reads what is still in the pipes.
  void readRest(ProgramRun& run) {
    while (readSome(output.reading.get(), run.standardOutput) > 0) {
    }
    while (readSome(error.reading.get(), run.standardError) > 0) {
    }
    run.standardOutput.erase(0, fillerSize);
  }

 private:
  /// Runs in the child: calls only what is safe between fork and exec.
  [[noreturn]] void become(const std::string& program, const std::string& folder,
                           const std::vector<char*>& arguments, const std::vector<char*>& environment,
                           int failure) const {
    const rlimit noCore = {0, 0};
    limitTheStack();
    takeDefaultSignals();
    const int nothing = open("/dev/null", O_RDONLY);
    sigset_t none;
    sigemptyset(&none);
    if (setpgid(0, 0) == 0 && setrlimit(RLIMIT_CORE, &noCore) == 0 && dup2(nothing, STDIN_FILENO) >= 0 &&
        dup2(output.writing.get(), STDOUT_FILENO) >= 0 && dup2(error.writing.get(), STDERR_FILENO) >= 0 &&
        chdir(folder.c_str()) == 0 && sigprocmask(SIG_SETMASK, &none, nullptr) == 0) {
      // Descriptors that the test program itself inherited are closed on exec, like the failure pipe.
      for (int other = STDERR_FILENO + 1; other < 1024; ++other) fcntl(other, F_SETFD, FD_CLOEXEC);
      if (call.reader == Reader::kWasNone) close(STDOUT_FILENO);
      execve(program.c_str(), arguments.data(), environment.data());
    }
    const int problem = errno;
    _exit(write(failure, &problem, sizeof problem) < 0 ? 126 : 127);
  }

  bool readsNow(Clock::time_point now) const {
    switch (call.reader) {
      case Reader::kReads:
        return true;
      case Reader::kReadsLate:
        return now >= start + kLate;
      case Reader::kStops:
        return !textSeenAt;
      default:
        return false;
    }
  }

  bool isTimeToInterrupt(const std::string& printed, Clock::time_point now) {
    if (!textSeenAt && printed.find(call.interruption.afterText) != std::string::npos) textSeenAt = now;
    return textSeenAt && now >= *textSeenAt + seconds(call.interruption.afterSeconds) &&
           !call.interruption.signals.empty();
  }

  void interrupt(Clock::time_point now) {
    Clock::time_point next = now;
    for (const int signal : call.interruption.signals) {
      while (Clock::now() < next) {
      }
      kill(pid, signal);
      next = Clock::now() + seconds(call.interruption.secondsBetween);
    }
    interruptedAt = now;
  }

  /// When follow() has something to do even if the program prints nothing.
  Clock::time_point nextEvent(Clock::time_point limit, Clock::time_point now) const {
    Clock::time_point next = limit;
    if (textSeenAt && !interruptedAt && !call.interruption.signals.empty()) {
      next = std::min(next, *textSeenAt + seconds(call.interruption.afterSeconds));
    }
    if (call.reader == Reader::kReadsLate && now < start + kLate) next = std::min(next, start + kLate);
    return next;
  }

  const ProgramCall& call;
  const Clock::time_point start;
  std::optional<Clock::time_point> textSeenAt;
  std::optional<Clock::time_point> interruptedAt;
  std::size_t fillerSize = 0;
  pid_t pid;
  Pipe output;
  Pipe error;
  Pipe ended;  ///< `waiter` closes its writing end when the program has ended.
  std::thread waiter;
};

std::string endOf(int waitStatus) {
  if (WIFSIGNALED(waitStatus)) return "signal " + std::to_string(WTERMSIG(waitStatus));
  return "exit status " + std::to_string(WEXITSTATUS(waitStatus));
}

}  // namespace

ProgramRun runProgram(const std::string& program, const ProgramCall& call) {
  const TemporaryDirectory home;
  const Clock::time_point start = Clock::now();
  ProgramRun run{};
  Child child(program, call, home.path().string());
  const bool inTime = child.follow(run);
  run.secondsSinceInterruption = child.secondsSinceInterruption();
  const int waitStatus = child.endAndReap();
  child.readRest(run);
  run.elapsedSeconds = std::chrono::duration<double>(Clock::now() - start).count();
  run.end = inTime ? endOf(waitStatus) : "timed out";
  return run;
}

ProgramRun runVstTorture(const ProgramCall& call) { return runProgram(VSTTORTURE_PROGRAM, call); }

ProgramRun runVstTorture(const std::vector<std::string>& arguments) {
  ProgramCall call;
  call.arguments = arguments;
  return runVstTorture(call);
}

std::string samplePlugin(const std::string& name) {
  return std::string(VSTTORTURE_SAMPLE_PLUGINS) + '/' + name + ".so";
}

ProgramCall faultyPlugin(const std::string& kind, const std::string& place) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  call.environment = {{"FAULT_KIND", kind}, {"FAULT_PLACE", place}};
  return call;
}

std::vector<std::string> lines(const std::string& text) {
  std::vector<std::string> result;
  std::istringstream stream(text);
  for (std::string line; std::getline(stream, line);) result.push_back(line);
  return result;
}
