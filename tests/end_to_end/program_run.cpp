// Runs a program as a host application does: fork, exec, two pipes, and a thread that waits for the end.
#include "tests/end_to_end/program_run.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <sstream>
#include <system_error>
#include <thread>

#include <fcntl.h>
#include <poll.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/end_to_end/temporary_directory.h"

namespace {

using Clock = std::chrono::steady_clock;

[[noreturn]] void fail(const std::string& what) {
  throw std::system_error(errno, std::generic_category(), what);
}

/// One end of a pipe, or nothing.
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

/// Both ends are closed by exec.
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

/// Takes at most one buffer of what is there to read. Positive: there may be more; 0: the end of the file.
ssize_t readSome(int descriptor, std::string& text) {
  std::array<char, 65536> buffer;
  const ssize_t count = read(descriptor, buffer.data(), buffer.size());
  if (count > 0) text.append(buffer.data(), static_cast<std::size_t>(count));
  return count;
}

/// The list of pointers, null at its end, that exec takes. It points into `texts`.
std::vector<char*> pointersTo(std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  for (std::string& text : texts) pointers.push_back(text.data());
  pointers.push_back(nullptr);
  return pointers;
}

std::vector<std::string> environmentOf(const ProgramCall& call, const std::string& home) {
  std::map<std::string, std::string> all = {{"HOME", home}, {"LC_ALL", "C"}, {"PATH", "/usr/bin:/bin"}};
  for (const char* name : {"ASAN_OPTIONS", "LSAN_OPTIONS", "TSAN_OPTIONS", "UBSAN_OPTIONS"}) {
    if (const char* value = std::getenv(name)) all[name] = value;
  }
  for (const auto& [name, value] : call.environment) all[name] = value;
  std::vector<std::string> entries;
  for (const auto& [name, value] : all) entries.push_back(name + '=' + value);
  return entries;
}

/// A program that has been started and not yet reaped.
class Child {
 public:
  Child(const std::string& program, const ProgramCall& call, const std::string& home) {
    std::vector<std::string> argumentTexts = call.arguments;
    argumentTexts.insert(argumentTexts.begin(), program);
    std::vector<std::string> environmentTexts = environmentOf(call, home);
    const std::vector<char*> arguments = pointersTo(argumentTexts);
    const std::vector<char*> environment = pointersTo(environmentTexts);
    const std::string folder = call.workingDirectory.empty() ? home : call.workingDirectory;

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
    for (const Pipe* pipe : {&output, &error}) fcntl(pipe->reading.get(), F_SETFL, O_NONBLOCK);
    waiter = std::thread([this] {
      siginfo_t ignored;
      while (waitid(P_PID, static_cast<id_t>(pid), &ignored, WEXITED | WNOWAIT) != 0 && errno == EINTR) {
      }
      ended.writing.close();
    });
  }

  /// Reads until the program has ended. False when the time is over before that.
  bool readToEnd(Clock::time_point limit, ProgramRun& run) {
    std::array<pollfd, 3> sources = {{{ended.reading.get(), POLLIN, 0},
                                      {output.reading.get(), POLLIN, 0},
                                      {error.reading.get(), POLLIN, 0}}};
    const std::array<std::string*, 3> texts = {nullptr, &run.standardOutput, &run.standardError};
    while (sources[0].revents == 0) {
      const auto left = std::chrono::ceil<std::chrono::milliseconds>(limit - Clock::now()).count();
      if (left <= 0) return false;
      if (poll(sources.data(), sources.size(), static_cast<int>(left)) < 0 && errno != EINTR) fail("poll");
      for (std::size_t i = 1; i < sources.size(); ++i) {
        if (sources[i].revents != 0 && readSome(sources[i].fd, *texts[i]) == 0) sources[i].fd = -1;
      }
    }
    return true;
  }

  /// Kills what is left of the process group, reaps the program and returns its wait status.
  int endAndReap() {
    kill(-pid, SIGKILL);
    waiter.join();
    int status = 0;
    while (waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    return status;
  }

  /// Takes what the dead have left in the pipes.
  void readRest(ProgramRun& run) {
    while (readSome(output.reading.get(), run.standardOutput) > 0) {
    }
    while (readSome(error.reading.get(), run.standardError) > 0) {
    }
  }

 private:
  /// In the child: only what is safe after a fork.
  [[noreturn]] void become(const std::string& program, const std::string& folder,
                           const std::vector<char*>& arguments, const std::vector<char*>& environment,
                           int failure) const {
    const rlimit noCore = {0, 0};
    const int nothing = open("/dev/null", O_RDONLY);
    sigset_t none;
    sigemptyset(&none);
    if (setpgid(0, 0) == 0 && setrlimit(RLIMIT_CORE, &noCore) == 0 && dup2(nothing, STDIN_FILENO) >= 0 &&
        dup2(output.writing.get(), STDOUT_FILENO) >= 0 && dup2(error.writing.get(), STDERR_FILENO) >= 0 &&
        chdir(folder.c_str()) == 0 && sigprocmask(SIG_SETMASK, &none, nullptr) == 0) {
      // Whatever the test's own parent left open stays here. The failure pipe must last until exec.
      for (int other = STDERR_FILENO + 1; other < 1024; ++other) fcntl(other, F_SETFD, FD_CLOEXEC);
      execve(program.c_str(), arguments.data(), environment.data());
    }
    const int problem = errno;
    _exit(write(failure, &problem, sizeof problem) < 0 ? 126 : 127);
  }

  pid_t pid;
  Pipe output;
  Pipe error;
  Pipe ended;  ///< Its writing end is closed by the waiting thread when the program has ended.
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
  const auto limit =
      std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(call.timeLimitInSeconds));

  ProgramRun run{};
  Child child(program, call, home.path().string());
  const bool inTime = child.readToEnd(start + limit, run);
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

std::vector<std::string> lines(const std::string& text) {
  std::vector<std::string> result;
  std::istringstream stream(text);
  for (std::string line; std::getline(stream, line);) result.push_back(line);
  return result;
}
