// SPDX-License-Identifier: MIT
// Tries out a plug-in with vsttorture, as a host does, and prints one verdict:
//
//     try_plugin [--limit SECONDS] VSTTORTURE BUNDLE [CHILD_ID]
//
// Exits with 0 for "passed" and "shell", 1 for any other verdict, 2 for wrong arguments, 3 when VSTTORTURE
// cannot be started. What the verdicts mean: PROTOCOL.md. Needs C++17 and POSIX:
//
//     c++ -std=c++17 -o try_plugin try_plugin.cpp
#include <algorithm>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <thread>

#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

constexpr int kLastStep = 65;
constexpr int kFixedSteps = 15;
constexpr int kDrawnTests = 5;
constexpr std::size_t kMostInAPipe = std::size_t{1} << 20;

constexpr const char* kTests[] = {"inspect class info",     "inspect preset info", "inspect parameter info",
                                  "testing setting states", "inspect latency",     "inspect stream format"};

struct Run {
  std::string output;
  std::optional<int> status;  ///< Negative for a signal; nothing when the limit had to end the run.
};

/// Does not reap the child: until then its number, which is its group's too, belongs to nobody else.
bool hasEnded(pid_t child) {
  siginfo_t info = {};
  return waitid(P_PID, static_cast<id_t>(child), &info, WEXITED | WNOWAIT | WNOHANG) == 0 &&
         info.si_pid == child;
}

/// Appends what can be read within so many milliseconds; 0 at the end of the pipe, -1 for nothing yet.
ssize_t readSome(int pipe, int timeout, std::string& output) {
  pollfd readable = {pipe, POLLIN, 0};
  if (poll(&readable, 1, timeout) < 1) return -1;
  char buffer[65536];
  const ssize_t size = read(pipe, buffer, sizeof buffer);
  if (size > 0) output.append(buffer, static_cast<std::size_t>(size));
  return size;
}

/// Starts the program in a process group of its own, with its output going to a pipe. Returns 0 or the error.
int start(char* const command[], pid_t& child, int& output) {
  int ends[2];
  if (pipe(ends) != 0) return errno;
  for (const int end : ends) fcntl(end, F_SETFD, FD_CLOEXEC);
  posix_spawn_file_actions_t files;
  posix_spawn_file_actions_init(&files);
  posix_spawn_file_actions_addopen(&files, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
  posix_spawn_file_actions_adddup2(&files, ends[1], STDOUT_FILENO);
  posix_spawnattr_t attributes;
  posix_spawnattr_init(&attributes);
  posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETPGROUP);
  const int error = posix_spawnp(&child, command[0], &files, &attributes, command, environ);
  posix_spawnattr_destroy(&attributes);
  posix_spawn_file_actions_destroy(&files);
  close(ends[1]);
  output = ends[0];
  return error;
}

Run finish(pid_t child, int pipe, Clock::time_point limit) {
  Run run;
  ssize_t size = -1;
  bool ended = false;
  while (!(ended = hasEnded(child)) && Clock::now() < limit) {
    if (size != 0) size = readSome(pipe, 10, run.output);
    // Lets many small writes come together. After the end of the pipe, just waits.
    std::this_thread::sleep_for(milliseconds(1));
  }
  kill(-child, SIGKILL);  // With what the plug-in has left behind.
  int status = 0;
  waitpid(child, &status, 0);
  if (ended) run.status = WIFSIGNALED(status) ? -WTERMSIG(status) : WEXITSTATUS(status);
  // All that the program printed is in the pipe by now. A process with a session of its own may still hold
  // the pipe, and even write to it, so do not wait for the end.
  const std::size_t most = run.output.size() + kMostInAPipe;
  while (run.output.size() < most && readSome(pipe, 0, run.output) > 0) {
  }
  close(pipe);
  return run;
}

bool endsWith(std::string_view text, std::string_view end) {
  return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

/// Takes the first line off the text.
std::string_view takeLine(std::string_view& text) {
  const std::size_t end = std::min(text.find('\n'), text.size());
  const std::string_view line = text.substr(0, end);
  text.remove_prefix(std::min(end + 1, text.size()));
  return line;
}

/// Whether the line, with any text of the plug-in's own in front, announces this step.
bool announces(std::string_view line, int step) {
  const auto ends = [&](const char* text) { return endsWith(line, std::to_string(step) + ", " + text); };
  if (step == 1 || step == kFixedSteps) return ends("test gathering info");
  if (step < 8) return ends(kTests[step - 2]);
  if (step < 14) return ends(kTests[13 - step]);
  if (step == 14) return ends("initialize");
  for (int test = 0; test < kDrawnTests; ++test) {
    if (ends(kTests[test])) return true;
  }
  return false;
}

/// Whether the line ends in "!PHASE failed CODE" or "!PHASE failed, unknown error".
bool isFailure(std::string_view line) {
  constexpr std::string_view kFailed = " failed";
  const std::size_t failed = line.rfind(kFailed);
  if (failed == std::string_view::npos || line.find('!') > failed) return false;
  std::string_view rest = line.substr(failed + kFailed.size());
  if (rest == ", unknown error") return true;
  if (rest.substr(0, 1) != " ") return false;
  rest.remove_prefix(rest.substr(0, 2) == " -" ? 2 : 1);
  return !rest.empty() && rest.find_first_not_of("0123456789") == std::string_view::npos;
}

std::string judge(const Run& run) {
  std::string_view total;
  int step = 0;
  bool failed = false;
  for (std::string_view rest = run.output; !rest.empty();) {
    const std::string_view line = takeLine(rest);
    failed = failed || isFailure(line);
    if (total.empty()) {
      if (endsWith(line, "total, 64") || endsWith(line, "total, 51")) total = line.substr(line.size() - 2);
    } else if (step < kLastStep && announces(line, step + 1)) {
      ++step;
    }
  }
  const std::string at = " at " + std::to_string(step);
  if (!run.status) return "timed out" + at;
  const int status = *run.status;
  const std::string exited = "exited" + at + " with " + std::to_string(status);
  if (status < 0) return "killed by signal " + std::to_string(-status) + at;
  if (status == 7) return "crashed" + at;
  if (status == 5 && run.output.empty()) return "refused";
  if (run.output.find("unexpected exit") != std::string::npos) return exited;
  if (status == 3 && failed) {
    return run.output == "!create and initialize failed -1\n" ? "not loadable" : "failed" + at;
  }
  if (status == 0 && total == "64" && step == kLastStep) return "passed";
  if (status == 1 && total == "51" && step == 1) return "shell";
  return exited;
}

}  // namespace

int main(int argc, char** argv) {
  double limitInSeconds = 60;
  char** command = argv + 1;
  if (argc > 2 && std::strcmp(argv[1], "--limit") == 0) {
    limitInSeconds = std::atof(argv[2]);
    command += 2;
  }
  const auto count = argv + argc - command;
  if (count < 2 || count > 3) {
    std::fputs("usage: try_plugin [--limit SECONDS] VSTTORTURE BUNDLE [CHILD_ID]\n", stderr);
    return 2;
  }
  const auto limit =
      std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(limitInSeconds));
  pid_t child = 0;
  int output = -1;
  if (const int error = start(command, child, output)) {
    std::fprintf(stderr, "cannot start %s: %s\n", command[0], std::strerror(error));
    return 3;
  }
  const std::string verdict = judge(finish(child, output, Clock::now() + limit));
  std::puts(verdict.c_str());
  return verdict == "passed" || verdict == "shell" ? 0 : 1;
}
