// SPDX-License-Identifier: MIT
// Runs workers side by side and collects what is seen of each.
//
// One event loop (libuv) on the calling thread. Each run has a session of its own, standard input from
// /dev/null, pipes for both outputs, a scratch folder that holds its HOME, XDG_* and TMPDIR, limits for time,
// memory, output and files, and, where that works, a sandbox in which the file system is read-only but for
// the scratch folder, without network, in a process namespace of its own.
//
// Nothing that a plug-in started survives its run; nothing of a run survives the engine's process, even when
// that is killed with SIGKILL.
#pragma once

#include <csignal>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "scanner/engine/run_seen.h"

namespace scanner {

enum class SandboxUse { kAuto, kRequired, kOff };

struct EngineOptions {
  unsigned jobs = 1;  ///< How many run at a time; 1 at least.
  Limits limits = {};
  SandboxUse sandbox = SandboxUse::kAuto;
  std::string scratchParent = {};  ///< Empty: TMPDIR, else /tmp.
  bool keepDisplay = false;        ///< Whether DISPLAY and WAYLAND_DISPLAY pass.
};

/// A program that runs another one, such as a debugger.
struct Tool {
  /// The command that goes in front, its program's absolute path first, with its files in `folder`.
  std::function<std::vector<std::string>(const std::string& folder)> command;
  std::vector<std::string> files = {};  ///< Names of files that it writes in that folder: RunSeen::toolFiles.
  bool needsAddressSpace = false;  ///< More than the memory limit: only what is in use counts against that.
  int endSignal = SIGTERM;         ///< What it gets when a time limit is hit,
  double patienceInSeconds = 2;    ///< and how long it may take to end then.
};

/// One process to run.
struct Job {
  std::string program;  ///< Absolute path of the worker or the describer.
  std::vector<std::string>
      arguments;         ///< Without the program's name; options for record and limits are added
                         ///< for a worker.
  bool isWorker = true;  ///< Writes a flight record and prints the protocol. Otherwise all of
                         ///< standard output is kept, up to the output limit, as one text.
  std::vector<std::string> environment = {};  ///< NAME=VALUE, added to the fixed one.
  std::optional<Limits> limits = {};          ///< Instead of the engine's own.
  std::optional<Tool> tool = {};              ///< Runs the program, in its place.
};

class RunEngine {
 public:
  using OnEnd = std::function<void(const RunSeen&)>;
  using OnStart = std::function<void()>;
  using OnInterrupt = std::function<void()>;

  /// Throws std::runtime_error, with a sentence for the user, where the engine cannot work at all: no scratch
  /// folder, no sandbox with SandboxUse::kRequired.
  explicit RunEngine(const EngineOptions& options);
  ~RunEngine();
  RunEngine(const RunEngine&) = delete;
  RunEngine& operator=(const RunEngine&) = delete;

  /// Queues a job; `onEnd` is called from run() with what was seen. May be called from within `onEnd`.
  /// `urgent` jobs go before all that are queued. `onStart`, where it is given, is called right before the
  /// process is started.
  void add(Job job, OnEnd onEnd, bool urgent = false, OnStart onStart = {});

  /// Does what SIGINT does: starts nothing new, and ends what runs.
  void stop();

  /// Works until the queue is empty and nothing runs any more. False when it was interrupted (SIGINT, SIGTERM,
  /// SIGHUP unless that was ignored when the engine was made): then nothing new was started, what ran was ended, and
  /// its OnEnd was called with LimitHit::kInterrupted.
  bool run();

  /// Called about 5 times a second while run() works, for a progress display.
  void onTick(std::function<void()> tick);

  [[nodiscard]] std::size_t queued() const;
  [[nodiscard]] std::size_t running() const;
  /// Whether jobs run in the sandbox, and if not, why.
  [[nodiscard]] bool isSandboxed() const;
  [[nodiscard]] const std::string& whyNotSandboxed() const;

 private:
  struct Implementation;
  std::unique_ptr<Implementation> implementation;
};

}  // namespace scanner
