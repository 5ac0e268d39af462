// SPDX-License-Identifier: MIT
#include "scanner/engine/run_engine.h"

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <exception>
#include <filesystem>
#include <random>
#include <stdexcept>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <uv.h>

#include "flight_recorder/flight_record.h"
#include "scanner/engine/output_parser.h"
#include "scanner/engine/scratch.h"
#include "scanner/system/system.h"

extern char** environ;

namespace scanner {
namespace {

constexpr std::uint64_t kPollInMilliseconds = 50;
constexpr std::uint64_t kTickInMilliseconds = 200;
/// A look at a run takes longer the more threads and files it has: the older it is, the rarer they are.
constexpr double kSampleEverySeconds = 0.1;
constexpr double kSampleSeldomInSeconds = 0.5;
constexpr double kSampleAtShareOfAge = 0.1;
constexpr double kMeasureFilesEverySeconds = 0.25;
constexpr double kMeasureFilesAtTimesItsCost = 10;
constexpr double kLongestWindowInSeconds = 2;
constexpr double kPatienceAfterInterruptInSeconds = 0.5;
/// How long a process may take to end when it has been killed.
constexpr double kPatienceAfterKillInSeconds = 5;
/// How long the pipes may stay open when all that could write to them is gone.
constexpr double kPatienceWithPipesInSeconds = 0.5;
/// How much longer than a step may last until a tool has started the worker.
constexpr double kStartOfAToolInSeconds = 30;
/// When the engine could not look for longer than this, that time counts against no run.
constexpr double kLongestPauseInSeconds = 1;
/// So much of the limit, used by a run that failed, is what it failed of: the allocation that would have exceeded it
/// was refused.
constexpr double kNearlyAllMemory = 0.875;
/// No process can use more addresses: a limit of so many is none.
constexpr std::uint64_t kAddressesOfAProcess = std::uint64_t{1} << 47;
constexpr int kSandboxSignalStatus = 128;
constexpr std::size_t kReadBlock = 64 * 1024;
constexpr std::size_t kMostBytesOfAToolFile = std::size_t{32} << 20;

// Not passed on: each run has its own, or shall have none.
constexpr const char* kOwnVariables[] = {
    "HOME",          "TMPDIR",         "XDG_CONFIG_HOME", "XDG_CACHE_HOME",
    "XDG_DATA_HOME", "XDG_STATE_HOME", "XDG_RUNTIME_DIR", "DBUS_SESSION_BUS_ADDRESS",
};
constexpr const char* kDisplayVariables[] = {"DISPLAY", "WAYLAND_DISPLAY", "XAUTHORITY"};

std::string nameOf(const std::string& entry) { return entry.substr(0, entry.find('=')); }

std::vector<std::string> inheritedEnvironment(bool keepDisplay) {
  std::vector<std::string> kept;
  for (char** entry = environ; *entry != nullptr; ++entry) {
    const std::string name = nameOf(*entry);
    const auto isNamed = [&](const char* one) { return name == one; };
    if (std::any_of(std::begin(kOwnVariables), std::end(kOwnVariables), isNamed)) continue;
    if (!keepDisplay && std::any_of(std::begin(kDisplayVariables), std::end(kDisplayVariables), isNamed))
      continue;
    kept.emplace_back(*entry);
  }
  return kept;
}

/// Sets NAME=VALUE, instead of what the environment has for that name.
void set(std::vector<std::string>& environment, const std::string& entry) {
  const auto at =
      std::find_if(environment.begin(), environment.end(),
                   [name = nameOf(entry)](const std::string& one) { return nameOf(one) == name; });
  if (at != environment.end()) {
    *at = entry;
  } else {
    environment.push_back(entry);
  }
}

double secondsSince1970() {
  timespec now = {};
  clock_gettime(CLOCK_REALTIME, &now);
  return static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) / 1e9;
}

double monotonicSeconds() { return static_cast<double>(uv_hrtime()) / 1e9; }

std::string uniqueName() {
  std::random_device random;
  char name[32];
  std::snprintf(name, sizeof name, "%08x%08x", random(), random());
  return name;
}

/// As nohup leaves it for SIGHUP.
bool isIgnored(int signal) {
  struct sigaction current = {};
  return sigaction(signal, nullptr, &current) == 0 && current.sa_handler == SIG_IGN;
}

void orThrow(int result, const char* what) {
  if (result < 0) throw std::runtime_error(std::string(what) + ": " + uv_strerror(result));
}

struct ProcessorTime {
  double at;
  double seconds;
};

}  // namespace

struct RunEngine::Implementation {
  struct ActiveRun;
  struct Queued {
    Job job;
    OnEnd onEnd;
    OnStart onStart;
  };

  explicit Implementation(const EngineOptions& wanted);
  ~Implementation();
  Implementation(const Implementation&) = delete;
  Implementation& operator=(const Implementation&) = delete;

  bool work();
  void startMore();
  void start(Queued queued);
  void makeLoop();
  void closeLoop();
  std::unique_ptr<ScratchFolder> takeScratch();
  std::vector<std::string> commandFor(ActiveRun& run) const;
  std::vector<std::string> environmentFor(const ActiveRun& run) const;
  void lookForEnded();
  void takeEnd(ActiveRun& run);
  void report(const OnEnd& onEnd, const RunSeen& seen);
  void poll();
  void interrupt();
  void finish(ActiveRun& run);
  std::vector<int> livingProcesses() const;

  EngineOptions options;
  uv_loop_t loop = {};
  uv_signal_t childSignal = {};
  uv_signal_t endSignals[3] = {};
  uv_timer_t pollTimer = {};
  uv_timer_t tickTimer = {};
  std::function<void()> tick;
  std::string scratchRoot;
  std::vector<std::unique_ptr<ScratchFolder>> spareScratch;  ///< As new.
  unsigned scratchFolders = 0;                               ///< That were made.
  system::Marks marks = system::newMarks();
  std::optional<std::string> sandbox;
  std::string noSandboxBecause;
  int keeper = -1;
  std::vector<std::string> baseEnvironment;
  std::deque<Queued> queue;
  std::vector<std::unique_ptr<ActiveRun>> active;
  unsigned startedRuns = 0;
  bool isShort = false;  ///< The system had no more processes: nothing is started before a run has ended.
  bool isInterrupted = false;
  double lookedAt = 0;         ///< When poll() last looked at all runs, or work() began.
  std::exception_ptr failure;  ///< Of an OnEnd.
};

/// One process and all that is known of it so far.
struct RunEngine::Implementation::ActiveRun {
  ActiveRun(Implementation& owner_, Queued queued_, std::unique_ptr<ScratchFolder> scratch_,
            system::Mark mark_)
      : owner(owner_), queued(std::move(queued_)), scratch(std::move(scratch_)), mark(mark_) {}
  ActiveRun(const ActiveRun&) = delete;
  ActiveRun& operator=(const ActiveRun&) = delete;
  ~ActiveRun() {
    if (recordFile >= 0) close(recordFile);
    for (const int file : toolFiles) close(file);
  }

  /// One of the two outputs.
  struct Output {
    uv_pipe_t pipe = {};
    ActiveRun* run = nullptr;
    bool isStandardError = false;
    bool isOpen = false;  ///< The handle exists.
    double endedAt = 0;   ///< 0 while bytes may still come.
  };

  int openOutput(Output& output, bool isStandardError);
  int makeFile(const std::string& path) const;
  void makeRecord();
  void makeToolFiles();
  void readToolFiles();
  void received(const Output& output, std::string_view bytes);
  void outputEnded(Output& output);
  void readRest(Output& output);
  void hit(LimitHit limit);
  void killNow();
  void giveUp();
  void excuse(double seconds, double now);
  void watch(double now);
  void watchStep(double now);
  void sample(double now);
  void noteActivity(double now);
  void noteLimitsOfTheSystem();
  std::string readRecord() const;
  [[nodiscard]] const Limits& limits() const;
  [[nodiscard]] std::string toolFile(const std::string& name) const { return scratch->path() + "/" + name; }

  Implementation& owner;
  Queued queued;
  std::unique_ptr<ScratchFolder> scratch;
  system::Mark mark;
  int recordFile = -1;
  std::vector<int> toolFiles;
  int process = -1;
  bool isRunning = false;
  bool isPutOff = false;  ///< Could not be started now, and goes back to the queue.
  Output standardOutput;
  Output standardError;
  OutputParser parser;
  TextTail errorText{true};
  std::string wholeOutput;  ///< Of a program that is no worker.
  RunSeen seen;
  double startedAt = 0;
  double excusedSeconds = 0;  ///< Of its age, those that do not count.
  double endedAt = 0;
  double terminatedAt = 0;
  double killedAt = 0;
  double stepSince = 0;
  std::pair<std::uint32_t, std::uint32_t> stepKey = {0, 0};
  double sampledAt = 0;
  double filesMeasuredAt = 0;
  double filesMeasuringSeconds = 0;
  std::uint64_t peakAddressSpaceInBytes = 0;
  std::deque<ProcessorTime> processorTimes;
};

// ---- One run ----------------------------------------------------------------------------------------------

int RunEngine::Implementation::ActiveRun::openOutput(Output& output, bool isStandardError) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) return -1;
  output.run = this;
  output.isStandardError = isStandardError;
  uv_pipe_init(&owner.loop, &output.pipe, 0);
  output.pipe.data = &output;
  output.isOpen = true;
  if (uv_pipe_open(&output.pipe, ends[0]) != 0) {
    close(ends[0]);
    close(ends[1]);
    return -1;
  }
  uv_read_start(
      reinterpret_cast<uv_stream_t*>(&output.pipe),
      [](uv_handle_t*, std::size_t, uv_buf_t* buffer) {
        static char block[kReadBlock];  // One loop, one read at a time.
        *buffer = uv_buf_init(block, sizeof block);
      },
      [](uv_stream_t* stream, ssize_t count, const uv_buf_t* buffer) {
        auto& from = *static_cast<Output*>(stream->data);
        if (count > 0) from.run->received(from, {buffer->base, static_cast<std::size_t>(count)});
        if (count < 0) from.run->outputEnded(from);
      });
  return ends[1];
}

void RunEngine::Implementation::ActiveRun::received(const Output& output, std::string_view bytes) {
  seen.outputBytes += bytes.size();
  if (seen.outputBytes > limits().outputInBytes) {
    hit(LimitHit::kOutput);
    // It may have ended before all that it had printed was read.
    if (seen.limitHit == LimitHit::kNone) seen.limitHit = LimitHit::kOutput;
    // It may take a moment to end, and print all the while.
    for (Output* one : {&standardOutput, &standardError}) {
      if (!one->isOpen || one->endedAt > 0) continue;
      one->endedAt = monotonicSeconds();
      uv_read_stop(reinterpret_cast<uv_stream_t*>(&one->pipe));
    }
    return;
  }
  if (output.isStandardError) {
    errorText.add(parser.step(), bytes);
  } else if (queued.job.isWorker) {
    parser.feed(bytes);
  } else {
    wholeOutput += bytes;
  }
}

void RunEngine::Implementation::ActiveRun::outputEnded(Output& output) {
  if (output.endedAt > 0) return;
  output.endedAt = monotonicSeconds();
  uv_read_stop(reinterpret_cast<uv_stream_t*>(&output.pipe));
  owner.lookForEnded();  // May have been the last thing that this run was waiting for.
}

/// Takes what is still in the pipe. On a busy machine the loop may come back so late that a run has been over for
/// long before its output was looked at for the first time.
void RunEngine::Implementation::ActiveRun::readRest(Output& output) {
  uv_os_fd_t descriptor = -1;
  if (!output.isOpen || output.endedAt > 0) return;
  if (uv_fileno(reinterpret_cast<uv_handle_t*>(&output.pipe), &descriptor) != 0) return;
  char block[kReadBlock];
  while (seen.outputBytes <= limits().outputInBytes) {
    const ssize_t count = read(descriptor, block, sizeof block);  // The pipe does not block.
    if (count < 0 && errno == EINTR) continue;
    if (count <= 0) return;
    received(output, {block, static_cast<std::size_t>(count)});
  }
}

void RunEngine::Implementation::ActiveRun::hit(LimitHit limit) {
  if (!isRunning || seen.limitHit != LimitHit::kNone) return;
  seen.limitHit = limit;
  if (limit == LimitHit::kStep || limit == LimitHit::kRun || limit == LimitHit::kInterrupted) {
    terminatedAt = monotonicSeconds();
    const bool isInterrupt = limit == LimitHit::kInterrupted;
    const int signal = queued.job.tool && !isInterrupt ? queued.job.tool->endSignal : SIGTERM;
    system::signalRun(process, owner.sandbox.has_value(), signal);
  } else {
    killNow();
  }
}

void RunEngine::Implementation::ActiveRun::killNow() {
  if (!isRunning) return;
  if (killedAt == 0) killedAt = monotonicSeconds();
  kill(process, SIGKILL);
}

/// It was killed and does not end. When it does after all, it is reaped like an orphan.
void RunEngine::Implementation::ActiveRun::giveUp() {
  seen.end.kind = End::Kind::kNotEnded;
  seen.leftBehind.unkillable.push_back(process);
  process = -1;
  isRunning = false;
  endedAt = monotonicSeconds();
  seen.wallSeconds = endedAt - startedAt;
}

const Limits& RunEngine::Implementation::ActiveRun::limits() const {
  return queued.job.limits ? *queued.job.limits : owner.options.limits;
}

int RunEngine::Implementation::ActiveRun::makeFile(const std::string& path) const {
  const int file = open(path.c_str(), O_CREAT | O_EXCL | O_RDWR | O_CLOEXEC, 0600);
  if (file < 0) throw std::system_error(errno, std::generic_category(), path);
  return file;
}

void RunEngine::Implementation::ActiveRun::makeRecord() {
  recordFile = makeFile(scratch->record());
  if (ftruncate(recordFile, sizeof(FlightRecord)) != 0)
    throw std::system_error(errno, std::generic_category(), scratch->record());
}

void RunEngine::Implementation::ActiveRun::makeToolFiles() {
  if (!queued.job.tool) return;
  for (const std::string& name : queued.job.tool->files) toolFiles.push_back(makeFile(toolFile(name)));
}

/// By the descriptors, as the record.
void RunEngine::Implementation::ActiveRun::readToolFiles() {
  for (std::size_t i = 0; i < toolFiles.size(); ++i) {
    std::string bytes;
    char block[kReadBlock];
    while (bytes.size() < kMostBytesOfAToolFile) {
      const ssize_t count = pread(toolFiles[i], block, sizeof block, static_cast<off_t>(bytes.size()));
      if (count <= 0) break;
      bytes.append(block, static_cast<std::size_t>(count));
    }
    seen.toolFiles.push_back(std::move(bytes));
    unlink(toolFile(queued.job.tool->files[i]).c_str());
  }
}

/// By the descriptor that it was made with: the plug-in may put another file in its place.
std::string RunEngine::Implementation::ActiveRun::readRecord() const {
  if (recordFile < 0) return {};
  std::string bytes(sizeof(FlightRecord), '\0');
  const ssize_t count = pread(recordFile, bytes.data(), bytes.size(), 0);
  bytes.resize(count < 0 ? 0 : static_cast<std::size_t>(count));
  return bytes;
}

/// The engine has not looked for so long: it was stopped, or waited for a terminal or a disk. The run may have waited
/// for it all the while, with its pipes full.
void RunEngine::Implementation::ActiveRun::excuse(double seconds, double now) {
  const double own = std::min(seconds, now - startedAt);
  excusedSeconds += own;
  stepSince += own;
  if (terminatedAt > 0) terminatedAt = std::min(terminatedAt + own, now);
  if (killedAt > 0) killedAt = std::min(killedAt + own, now);
}

void RunEngine::Implementation::ActiveRun::watch(double now) {
  if (!isRunning) return;
  if (killedAt > 0) {
    if (now - killedAt > kPatienceAfterKillInSeconds) giveUp();
    return;
  }
  if (terminatedAt > 0) {
    const bool isInterrupt = seen.limitHit == LimitHit::kInterrupted;
    const double patienceAfterTerm = queued.job.tool.value_or(Tool{}).patienceInSeconds;
    const double patience = isInterrupt ? kPatienceAfterInterruptInSeconds : patienceAfterTerm;
    if (now - terminatedAt > patience) killNow();
    return;
  }
  const double age = now - startedAt - excusedSeconds;
  const double pause = std::clamp(age * kSampleAtShareOfAge, kSampleEverySeconds, kSampleSeldomInSeconds);
  if (now - sampledAt > pause) sample(now);
  const Limits& limits = this->limits();
  const double filesPause =
      std::max(kMeasureFilesEverySeconds, kMeasureFilesAtTimesItsCost * filesMeasuringSeconds);
  if (limits.filesInBytes > 0 && now - filesMeasuredAt > filesPause) {
    if (scratch->sizeInBytes(limits.filesInBytes) > limits.filesInBytes) hit(LimitHit::kFiles);
    filesMeasuredAt = monotonicSeconds();
    filesMeasuringSeconds = filesMeasuredAt - now;
  }
  if (queued.job.isWorker) watchStep(now);
  if (age > limits.runInSeconds && seen.limitHit == LimitHit::kNone) {
    noteActivity(now);
    hit(LimitHit::kRun);
  }
}

void RunEngine::Implementation::ActiveRun::watchStep(double now) {
  const std::string bytes = readRecord();
  if (bytes.size() == sizeof(FlightRecord)) {
    FlightRecord record;
    std::memcpy(&record, bytes.data(), sizeof record);
    const std::pair<std::uint32_t, std::uint32_t> key = {record.phase, record.step};
    if (key != stepKey) {
      stepKey = key;
      stepSince = now;
    }
  }
  const bool isToolStarting = queued.job.tool && stepKey.first == kFlightNotStarted;
  if (now - stepSince <= limits().stepInSeconds + (isToolStarting ? kStartOfAToolInSeconds : 0)) return;
  noteActivity(now);
  hit(LimitHit::kStep);
}

void RunEngine::Implementation::ActiveRun::sample(double now) {
  sampledAt = now;
  const system::Sample current = system::sampleRun(process, seen.wasSandboxed, false);
  processorTimes.push_back({now, current.processorSeconds});
  const double window = std::min(kLongestWindowInSeconds, limits().stepInSeconds / 2);
  while (processorTimes.size() > 2 && now - processorTimes[1].at >= window) processorTimes.pop_front();
  seen.peakMemoryInBytes = std::max(seen.peakMemoryInBytes, current.residentBytes);
  peakAddressSpaceInBytes = std::max(peakAddressSpaceInBytes, current.addressSpaceBytes);
  const std::uint64_t most = limits().memoryInBytes;
  if (most > 0 && current.residentBytes > most) hit(LimitHit::kMemory);
}

void RunEngine::Implementation::ActiveRun::noteActivity(double now) {
  const system::Sample current = system::sampleRun(process, seen.wasSandboxed, true);
  Activity activity;
  const ProcessorTime base = processorTimes.empty() ? ProcessorTime{startedAt, 0} : processorTimes.front();
  // What a process of the run used that has ended meanwhile is no longer in the sum.
  activity.processorSeconds = std::max(0.0, current.processorSeconds - base.seconds);
  activity.wallSeconds = now - base.at;
  activity.state = current.state;
  activity.systemCall = current.systemCall;
  activity.sockets = current.sockets;
  seen.activity = activity;
}

/// The system itself ends a process that writes too large a file, and refuses memory beyond the limit.
void RunEngine::Implementation::ActiveRun::noteLimitsOfTheSystem() {
  if (seen.limitHit != LimitHit::kNone) return;
  const End& end = seen.end;
  const bool isSignalled = end.kind == End::Kind::kSignalled;
  const bool isFileSize =
      isSignalled ? end.signal == SIGXFSZ : seen.wasSandboxed && end.status == kSandboxSignalStatus + SIGXFSZ;
  if (isFileSize) seen.limitHit = LimitHit::kFiles;
  const auto nearlyAll =
      static_cast<std::uint64_t>(static_cast<double>(limits().memoryInBytes) * kNearlyAllMemory);
  const bool hasFailed = isSignalled || end.status > 1;
  const bool hasAddressSpaceLimit = !queued.job.tool || !queued.job.tool->needsAddressSpace;
  const bool isMemoryScarce =
      seen.peakMemoryInBytes > nearlyAll || (hasAddressSpaceLimit && peakAddressSpaceInBytes > nearlyAll);
  if (hasFailed && nearlyAll > 0 && isMemoryScarce) seen.limitHit = LimitHit::kMemory;
}

// ---- All runs ---------------------------------------------------------------------------------------------

RunEngine::Implementation::Implementation(const EngineOptions& wanted) : options(wanted) {
  // Ignored, as whoever started this process may have left it, it would keep from us how processes end.
  std::signal(SIGCHLD, SIG_DFL);
  const char* temporary = std::getenv("TMPDIR");
  std::string parent = options.scratchParent;
  if (parent.empty()) parent = temporary != nullptr && *temporary != '\0' ? temporary : "/tmp";
  std::error_code error;
  parent = std::filesystem::absolute(parent, error).string();
  scratchRoot = parent + "/vsttorture-scan-" + uniqueName();
  // Before the folder: there is no moment at which nobody would remove it.
  keeper = system::startKeeper(marks, scratchRoot);
  if (keeper < 0) throw std::runtime_error(std::string("no process can be started: ") + std::strerror(errno));
  try {
    if (mkdir(scratchRoot.c_str(), 0700) != 0) {
      throw std::runtime_error("no scratch folder can be made in " + parent + ": " + std::strerror(errno));
    }
    if (options.sandbox == SandboxUse::kOff) {
      noSandboxBecause = "off";
    } else {
      sandbox = system::findSandbox(scratchRoot, noSandboxBecause);
    }
    if (!sandbox && options.sandbox == SandboxUse::kRequired) {
      throw std::runtime_error("there is no sandbox: " + noSandboxBecause);
    }
    makeLoop();
  } catch (...) {
    system::dismissKeeper(keeper);
    system::removeTree(scratchRoot);
    throw;
  }
  system::adoptOrphans();
  system::allowManyDescriptors();
  baseEnvironment = inheritedEnvironment(options.keepDisplay);
}

void RunEngine::Implementation::makeLoop() {
  orThrow(uv_loop_init(&loop), "no event loop");
  const auto onSignal = [this](uv_signal_t& handle, uv_signal_cb callback, int signal) {
    uv_signal_init(&loop, &handle);
    handle.data = this;
    orThrow(uv_signal_start(&handle, callback, signal), "no signal handler");
  };
  onSignal(
      childSignal,
      [](uv_signal_t* handle, int) { static_cast<Implementation*>(handle->data)->lookForEnded(); }, SIGCHLD);
  constexpr int kEndSignals[] = {SIGINT, SIGTERM, SIGHUP};
  for (std::size_t i = 0; i < 3; ++i) {
    // SIGINT is another matter: scripts start programs in the background with it ignored, and mean to end them by it.
    if (kEndSignals[i] == SIGHUP && isIgnored(SIGHUP)) continue;
    onSignal(
        endSignals[i],
        [](uv_signal_t* handle, int) { static_cast<Implementation*>(handle->data)->interrupt(); },
        kEndSignals[i]);
  }
  const auto every = [this](uv_timer_t& timer, std::uint64_t milliseconds, uv_timer_cb callback) {
    uv_timer_init(&loop, &timer);
    timer.data = this;
    uv_timer_start(&timer, callback, milliseconds, milliseconds);
  };
  every(pollTimer, kPollInMilliseconds,
        [](uv_timer_t* timer) { static_cast<Implementation*>(timer->data)->poll(); });
  every(tickTimer, kTickInMilliseconds, [](uv_timer_t* timer) {
    const auto& self = *static_cast<Implementation*>(timer->data);
    if (self.tick) self.tick();
  });
}

void RunEngine::Implementation::closeLoop() {
  uv_walk(
      &loop,
      [](uv_handle_t* handle, void*) {
        if (uv_is_closing(handle) == 0) uv_close(handle, nullptr);
      },
      nullptr);
  uv_run(&loop, UV_RUN_DEFAULT);
  uv_loop_close(&loop);
}

RunEngine::Implementation::~Implementation() {
  closeLoop();
  for (const int process : livingProcesses()) {
    kill(process, SIGKILL);
    system::reap(process);
  }
  const bool isAnyLeft = !system::killOrphans(marks, {}).left.empty();
  active.clear();
  spareScratch.clear();
  // The folder first: should this process be killed now, the keeper still removes what is left.
  if (!isAnyLeft) system::removeTree(scratchRoot);
  system::dismissKeeper(keeper);
}

bool RunEngine::Implementation::work() {
  lookedAt = monotonicSeconds();
  startMore();
  while (!active.empty() || (!queue.empty() && !isInterrupted)) {
    uv_run(&loop, UV_RUN_ONCE);
    startMore();
  }
  if (failure) std::rethrow_exception(std::exchange(failure, nullptr));
  return !isInterrupted;
}

void RunEngine::Implementation::startMore() {
  while (!isInterrupted && !isShort && active.size() < options.jobs && !queue.empty()) {
    Queued next = std::move(queue.front());
    queue.pop_front();
    start(std::move(next));
  }
}

std::unique_ptr<ScratchFolder> RunEngine::Implementation::takeScratch() {
  if (spareScratch.empty())
    return std::make_unique<ScratchFolder>(scratchRoot + "/" + std::to_string(++scratchFolders));
  std::unique_ptr<ScratchFolder> scratch = std::move(spareScratch.back());
  spareScratch.pop_back();
  return scratch;
}

std::vector<std::string> RunEngine::Implementation::commandFor(ActiveRun& run) const {
  const Job& job = run.queued.job;
  std::vector<std::string> command;
  if (sandbox) command = system::sandboxCommand(*sandbox, run.scratch->path(), run.scratch->sharedMemory());
  if (job.tool) {
    const std::vector<std::string> tool = job.tool->command(run.scratch->path());
    command.insert(command.end(), tool.begin(), tool.end());
  }
  command.push_back(job.program);
  if (job.isWorker) command.insert(command.end(), {"--record", run.scratch->record()});
  command.insert(command.end(), job.arguments.begin(), job.arguments.end());
  return command;
}

std::vector<std::string> RunEngine::Implementation::environmentFor(const ActiveRun& run) const {
  std::vector<std::string> environment = baseEnvironment;
  for (const std::string& entry : run.scratch->environment()) environment.push_back(entry);
  for (const std::string& entry : run.queued.job.environment) set(environment, entry);
  return environment;
}

void RunEngine::Implementation::start(Queued queued) {
  if (queued.onStart) std::exchange(queued.onStart, nullptr)();
  const system::Mark mark = marks.first + ++startedRuns % (marks.last - marks.first + 1);
  RunSeen failed;
  failed.startedAt = secondsSince1970();
  const OnEnd onEnd = queued.onEnd;
  std::unique_ptr<ActiveRun> run;
  try {
    run = std::make_unique<ActiveRun>(*this, std::move(queued), takeScratch(), mark);
    if (run->queued.job.isWorker) run->makeRecord();
    run->makeToolFiles();
  } catch (const std::system_error& error) {
    failed.end.reason = std::string("no scratch folder: ") + error.what();
    report(onEnd, failed);
    return;
  }

  system::ProcessStart process;
  process.command = commandFor(*run);
  process.environment = environmentFor(*run);
  process.workingDirectory = run->scratch->home();
  const std::optional<Tool>& tool = run->queued.job.tool;
  const std::uint64_t memory = run->limits().memoryInBytes;
  const bool isUnlimited = memory >= kAddressesOfAProcess || (tool && tool->needsAddressSpace);
  process.addressSpaceInBytes = isUnlimited ? 0 : memory;
  process.fileSizeInBytes = run->limits().filesInBytes;
  process.mark = mark;
  process.standardOutput = run->openOutput(run->standardOutput, false);
  process.standardError = run->openOutput(run->standardError, true);
  const double now = monotonicSeconds();
  const bool hasPipes = process.standardOutput >= 0 && process.standardError >= 0;
  std::string reason = "no pipe";
  bool isShortage = !hasPipes;
  run->process = hasPipes ? system::startProcess(process, reason, &isShortage) : -1;
  if (process.standardOutput >= 0) close(process.standardOutput);
  if (process.standardError >= 0) close(process.standardError);
  run->seen.startedAt = failed.startedAt;
  run->seen.wasSandboxed = sandbox.has_value();
  run->startedAt = run->stepSince = run->sampledAt = run->filesMeasuredAt = now;
  run->isRunning = run->process > 0;
  run->seen.process = tool ? 0 : std::max(run->process, 0);  // Which one a tool starts is not known.
  if (!run->isRunning) {
    // What another run takes up is this one's again when that has ended.
    run->isPutOff = isShortage && !active.empty();
    isShort = run->isPutOff;
    run->seen.end.reason = reason;
    run->endedAt = now;
  }
  active.push_back(std::move(run));
  if (!active.back()->isRunning) finish(*active.back());
}

std::vector<int> RunEngine::Implementation::livingProcesses() const {
  std::vector<int> processes;
  for (const auto& run : active) {
    if (run->process > 0) processes.push_back(run->process);
  }
  return processes;
}

void RunEngine::Implementation::lookForEnded() {
  while (const int process = system::endedChild()) {
    const auto run = std::find_if(active.begin(), active.end(),
                                  [process](const auto& one) { return one->process == process; });
    if (run != active.end()) {
      takeEnd(**run);
    } else {
      system::reap(process);  // Was adopted.
    }
  }
  const double now = monotonicSeconds();
  for (std::size_t i = 0; i < active.size();) {
    ActiveRun& run = *active[i];
    const bool isRead = run.standardOutput.endedAt > 0 && run.standardError.endedAt > 0;
    const bool isOver = !run.isRunning && (isRead || now - run.endedAt > kPatienceWithPipesInSeconds);
    if (isOver) {
      finish(run);
    } else {
      ++i;
    }
  }
}

/// Its process has ended. As long as it is not reaped, its number, and that of its group, cannot be another's.
void RunEngine::Implementation::takeEnd(ActiveRun& run) {
  RunSeen& seen = run.seen;
  const system::Orphans orphans = system::killOrphans({run.mark, run.mark}, livingProcesses());
  kill(-run.process, SIGKILL);
  seen.leftBehind.unkillable = orphans.left;
  if (!sandbox) {
    std::vector<int> makers = orphans.killed;
    // What a limit of ours has ended did not get to ending its own processes.
    if (seen.limitHit == LimitHit::kNone) seen.leftBehind.processes = static_cast<unsigned>(makers.size());
    makers.push_back(run.process);
    seen.leftBehind.sharedMemory = system::removeSharedMemory(makers, seen.startedAt);
  }
  system::ProcessEnd end = system::reap(run.process);
  // The sandbox does not wait for its first process, which is an orphan then and has what the plug-in used.
  system::addUsage(end, orphans.used);
  run.process = -1;
  run.isRunning = false;
  run.endedAt = monotonicSeconds();
  seen.wallSeconds = run.endedAt - run.startedAt;
  seen.end.kind = end.isSignalled ? End::Kind::kSignalled : End::Kind::kExited;
  (end.isSignalled ? seen.end.signal : seen.end.status) = end.value;
  seen.userSeconds = end.userSeconds;
  seen.systemSeconds = end.systemSeconds;
  seen.peakMemoryInBytes = std::max(seen.peakMemoryInBytes, end.peakMemoryInBytes);
  run.noteLimitsOfTheSystem();
}

void RunEngine::Implementation::poll() {
  lookForEnded();
  const double now = monotonicSeconds();
  const double pause = now - lookedAt;
  for (const auto& run : active) {
    if (pause > kLongestPauseInSeconds) run->excuse(pause, now);
    run->watch(now);
  }
  lookedAt = monotonicSeconds();  // What looking takes counts.
}

/// Nothing may be thrown through the loop.
void RunEngine::Implementation::report(const OnEnd& onEnd, const RunSeen& seen) {
  try {
    onEnd(seen);
  } catch (...) {
    if (!failure) failure = std::current_exception();
    interrupt();
  }
}

void RunEngine::Implementation::interrupt() {
  isInterrupted = true;
  queue.clear();
  for (const auto& run : active) run->hit(LimitHit::kInterrupted);
}

void RunEngine::Implementation::finish(ActiveRun& run) {
  RunSeen& seen = run.seen;
  run.readRest(run.standardOutput);
  run.readRest(run.standardError);
  run.parser.finish();
  seen.lines = run.parser.lines();
  seen.texts = run.parser.texts().pieces();
  if (!run.queued.job.isWorker) seen.texts.push_back({0, false, std::move(run.wholeOutput)});
  for (PluginText& text : run.errorText.pieces()) seen.texts.push_back(std::move(text));
  seen.record = run.readRecord();
  run.readToolFiles();
  const bool isUsed = !seen.leftBehind.unkillable.empty();
  if (run.recordFile >= 0 && !isUsed) unlink(run.scratch->record().c_str());
  if (isUsed) {
    seen.leftBehind.folder = run.scratch->path();
    run.scratch->leave();
    run.scratch.reset();
  } else if (run.scratch->isAsNew()) {
    spareScratch.push_back(std::move(run.scratch));
  } else {
    run.scratch->list(seen.leftBehind);
    run.scratch.reset();
  }

  const auto at =
      std::find_if(active.begin(), active.end(), [&](const auto& one) { return one.get() == &run; });
  ActiveRun* const ended = at->release();
  active.erase(at);
  Queued queued = std::move(ended->queued);
  const RunSeen result = std::move(ended->seen);
  const bool isPutOff = ended->isPutOff;
  // The handles live in the run, so it lives until both are closed.
  bool hasHandles = false;
  for (ActiveRun::Output* output : {&ended->standardOutput, &ended->standardError}) {
    if (!output->isOpen) continue;
    hasHandles = true;
    uv_close(reinterpret_cast<uv_handle_t*>(&output->pipe), [](uv_handle_t* handle) {
      auto& closed = *static_cast<ActiveRun::Output*>(handle->data);
      ActiveRun* const owner = closed.run;
      closed.isOpen = false;
      if (!owner->standardOutput.isOpen && !owner->standardError.isOpen) delete owner;
    });
  }
  if (!hasHandles) delete ended;
  if (isPutOff) {
    if (!isInterrupted) queue.push_front(std::move(queued));
    return;
  }
  isShort = false;
  report(queued.onEnd, result);
}

// ---- The engine as others see it --------------------------------------------------------------------------

RunEngine::RunEngine(const EngineOptions& options)
    : implementation(std::make_unique<Implementation>(options)) {}
RunEngine::~RunEngine() = default;

void RunEngine::stop() { implementation->interrupt(); }

void RunEngine::add(Job job, OnEnd onEnd, bool urgent, OnStart onStart) {
  if (implementation->isInterrupted) return;
  Implementation::Queued queued{std::move(job), std::move(onEnd), std::move(onStart)};
  if (urgent) {
    implementation->queue.push_front(std::move(queued));
  } else {
    implementation->queue.push_back(std::move(queued));
  }
}

bool RunEngine::run() { return implementation->work(); }
void RunEngine::onTick(std::function<void()> tick) { implementation->tick = std::move(tick); }
std::size_t RunEngine::queued() const { return implementation->queue.size(); }
std::size_t RunEngine::running() const { return implementation->active.size(); }
bool RunEngine::isSandboxed() const { return implementation->sandbox.has_value(); }
const std::string& RunEngine::whyNotSandboxed() const { return implementation->noSandboxBecause; }

}  // namespace scanner
