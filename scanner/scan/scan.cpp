// SPDX-License-Identifier: MIT
#include "scanner/scan/scan.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <memory>
#include <set>
#include <stdexcept>

#include <fmt/format.h>
#include <nlohmann/json.hpp>
#include <sys/ioctl.h>
#include <sys/utsname.h>
#include <unistd.h>

#include "scanner/events/event_json.h"
#include "scanner/find/find_modules.h"
#include "scanner/report/terminal.h"
#include "scanner/scan/json_stream.h"
#include "scanner/scan/workers.h"

namespace scanner {
namespace {

/// Fillings of fresh memory for repeated runs: never 0, which means none.
std::string memoryFilling(unsigned repetition) {
  return fmt::format("MALLOC_PERTURB_={}", repetition * 37 % 255 + 1);
}

double secondsSince1970() {
  return std::chrono::duration<double>(std::chrono::system_clock::now().time_since_epoch()).count();
}

std::string machineName() {
  utsname names = {};
  return uname(&names) == 0 ? names.nodename : "";
}

TerminalOptions terminalOptions(const ScanOptions& options, int descriptor) {
  TerminalOptions terminal;
  terminal.isTerminal = isatty(descriptor) != 0;
  const char* noColour = std::getenv("NO_COLOR");
  const char* kind = std::getenv("TERM");
  const bool isDumb = kind != nullptr && std::strcmp(kind, "dumb") == 0;
  terminal.hasColours = terminal.isTerminal && !isDumb && (noColour == nullptr || *noColour == '\0');
  terminal.showsProgress = terminal.isTerminal && !isDumb && options.showsProgress;
  terminal.isQuiet = options.isQuiet;
  winsize size = {};
  if (terminal.isTerminal && ioctl(descriptor, TIOCGWINSZ, &size) == 0 && size.ws_col > 0)
    terminal.columns = size.ws_col;
  else if (!terminal.isTerminal)
    terminal.columns = 100;
  return terminal;
}

/// Writes all of a text; false once that has failed.
class TextOutput {
 public:
  explicit TextOutput(int descriptor_) : descriptor(descriptor_) {}

  bool write(const std::string& text) {
    std::size_t written = 0;
    while (!hasFailed && written < text.size()) {
      const ssize_t count = ::write(descriptor, text.data() + written, text.size() - written);
      if (count < 0 && errno == EINTR) continue;
      if (count < 0) {
        hasFailed = true;
        reason = std::strerror(errno);
      } else {
        written += static_cast<std::size_t>(count);
      }
    }
    return !hasFailed;
  }

  int descriptor;
  bool hasFailed = false;
  std::string reason;
};

void complain(const std::string& sentence) {
  std::fprintf(stderr, "vsttorture-scan: %s\n", printable(sentence).c_str());
}

class Scan {
 public:
  explicit Scan(const ScanOptions& options_)
      : options(options_),
        output(options.jsonFile == "-" ? STDERR_FILENO : STDOUT_FILENO),
        terminal(terminalOptions(options, output.descriptor),
                 [this](const std::string& text) { return output.write(text); }) {
    if (!options.skipFile.empty()) skipped = readSkipList(options.skipFile);
    if (!options.expectFile.empty()) expected = readExpectations(options.expectFile, verdictWords());
  }

  int run() {
    FindResult found;
    if (!find(found)) return kScanWrongUse;
    const WorkersByProcessor workers = findWorkers(options.workerFolders, notes);
    if (workers.empty()) {
      for (const std::string& note : notes) complain(note);
      complain(fmt::format("there is no vsttorture-worker; looked in {}",
                           fmt::join(workerFolders(options.workerFolders), ", ")));
      return kScanCannotGoOn;
    }
    RunEngine engine(options.engine);
    json.openFile(options.jsonFile);
    engineInUse = &engine;
    for (const Module& module : found.modules) otherNames[module.bundle] = module.otherNames;
    RunList list = planRuns(found.modules, workers, ownProcessor(), skipped, options.shard,
                            [](const Module&) { return 0.0; });
    total = list.runs.size() + list.notRun.size();
    begin(found, engine);
    for (const NotRun& one : list.notRun) endWithoutRun(one);
    for (const Run& one : list.runs) start(one, false);
    engine.onTick([this] { showProgress(); });
    const bool isWhole = engine.run();
    // Of several runs the later ones may have been left out by the interruption.
    for (const auto& plugin : std::vector(underWay)) {
      if (plugin->runsDone > 0) deliver(plugin);
    }
    engineInUse = nullptr;
    return finish(isWhole);
  }

 private:
  /// A plug-in that is being run, once or several times.
  struct UnderWay {
    PluginResult result;
    unsigned runsDone = 0;
  };
  using Plugin = std::shared_ptr<UnderWay>;

  bool find(FindResult& found) {
    const char* vstPath = std::getenv("VST_PATH");
    const char* home = std::getenv("HOME");
    const bool isNamed = !options.paths.empty();
    found = findModules(isNamed ? options.paths : defaultPlaces(vstPath, home));
    for (const Unreadable& missing : found.missing) complain(missing.path + ": " + missing.reason);
    if (!found.missing.empty()) return false;
    for (const Unreadable& one : found.unreadable)
      notes.push_back("not searched: " + one.path + ": " + one.reason);
    if (!found.modules.empty()) return true;
    for (const std::string& note : notes) complain(note);
    complain(fmt::format("no VST 2.x plug-in was found; looked in {}",
                         fmt::join(isNamed ? options.paths : namedPlaces(vstPath, home), ", ")));
    return false;
  }

  void begin(const FindResult& found, const RunEngine& engine) {
    startedAt = secondsSince1970();
    ScanStarted started;
    started.version = VSTTORTURE_VERSION;
    started.time = startedAt;
    started.machine = machineName();
    started.places = found.places;
    started.shard = options.shard;
    started.jobs = options.engine.jobs;
    started.limits = options.engine.limits;
    started.sandbox = engine.isSandboxed() ? "bubblewrap" : "none (" + engine.whyNotSandboxed() + ")";
    started.plugins = total;
    started.notes = notes;
    json.write(eventLine(started));
    terminal.started(started);
  }

  [[nodiscard]] Job workerJob(const Run& run, unsigned repetition) const {
    Job job;
    job.program = run.workers.worker;
    job.arguments = {"--", run.bundle};
    if (run.child) job.arguments.push_back(std::to_string(*run.child));
    if (repetition > 0) job.environment.push_back(memoryFilling(repetition));
    return job;
  }

  void start(const Run& run, bool isUrgent) {
    const auto plugin = std::make_shared<UnderWay>();
    plugin->result.run = run;
    plugin->result.otherNames = otherNames[run.bundle];
    plugin->result.command = {run.workers.worker, run.bundle};
    if (run.child) plugin->result.command.push_back(std::to_string(*run.child));
    startRepetition(plugin, isUrgent);
  }

  void startRepetition(const Plugin& plugin, bool isUrgent) {
    engineInUse->add(
        workerJob(plugin->result.run, plugin->runsDone),
        [this, plugin](const RunSeen& seen) { ended(plugin, seen); }, isUrgent,
        [this, plugin] {
          if (plugin->runsDone > 0) return;
          underWay.push_back(plugin);
          json.write(eventLine(plugin->result.run));
        });
  }

  void ended(const Plugin& plugin, const RunSeen& seen) {
    PluginResult& result = plugin->result;
    const Judgement judgement = judge(seen, options.engine.limits);
    const bool isFirst = plugin->runsDone++ == 0;
    if (options.repeat > 1) countRepetition(result, judgement);
    // Of several runs the first that is not good speaks for the plug-in.
    if (isFirst || (rowOf(result.judgement.verdict).isGood && !rowOf(judgement.verdict).isGood)) {
      result.judgement = judgement;
      result.seen = seen;
    }
    const bool isStopped = seen.limitHit == LimitHit::kInterrupted;
    if (plugin->runsDone < options.repeat && !isStopped) {
      startRepetition(plugin, true);
      return;
    }
    const bool isShell = result.judgement.verdict == Verdict::kShell;
    const bool isDescribable =
        isShell || (options.describes && result.judgement.verdict != Verdict::kNotLoadable &&
                    result.judgement.verdict != Verdict::kRefused);
    if (isDescribable && !isStopped) {
      describe(plugin, isShell);
    } else {
      deliver(plugin);
    }
  }

  static void countRepetition(PluginResult& result, const Judgement& judgement) {
    if (!result.repetitions) result.repetitions = Repetitions{0, {}};
    ++result.repetitions->runs;
    std::string end = rowOf(judgement.verdict).word;
    if (!rowOf(judgement.verdict).isGood && judgement.step > 0) end += fmt::format(" at {}", judgement.step);
    ++result.repetitions->verdicts[end];
  }

  void describe(const Plugin& plugin, bool isShell) {
    Job job;
    job.program = plugin->result.run.workers.describe;
    job.isWorker = false;
    job.arguments = {plugin->result.run.bundle};
    if (plugin->result.run.child) job.arguments.push_back(std::to_string(*plugin->result.run.child));
    engineInUse->add(
        std::move(job),
        [this, plugin, isShell](const RunSeen& seen) {
          std::string object;
          for (const PluginText& text : seen.texts) {
            if (!text.isStandardError) object += text.bytes;
          }
          const bool isOver =
              seen.end.kind == End::Kind::kExited && (seen.end.status == 0 || seen.end.status == 1);
          const nlohmann::json description = nlohmann::json::parse(isOver ? object : "", nullptr, false);
          if (description.is_object() && options.describes) plugin->result.description = object;
          const bool isStopped = seen.limitHit == LimitHit::kInterrupted;
          if (isShell && !isStopped) addChildren(plugin->result, description);
          deliver(plugin);
        },
        true);
  }

  void addChildren(PluginResult& shell, const nlohmann::json& description) {
    std::vector<Child> children;
    const nlohmann::json listed =
        description.is_object() ? description.value("children", nlohmann::json()) : nullptr;
    if (listed.is_array()) {
      // The describer ran the plug-in's code, so that what it printed may be anything.
      for (const nlohmann::json& child : listed) {
        const nlohmann::json id = child.is_object() ? child.value("id", nlohmann::json()) : nullptr;
        const nlohmann::json name = child.is_object() ? child.value("name", nlohmann::json()) : nullptr;
        if (!id.is_number_integer() || id < INT32_MIN || id > INT32_MAX) continue;
        children.push_back(
            {id.get<std::int32_t>(), name.is_string() ? name.get<std::string>() : std::string()});
      }
    } else {
      shell.judgement.contradictions.emplace_back(
          "it passed as a shell, but could not be described: its children were not run");
      isListIncomplete = true;
    }
    RunList list = runsOfChildren(shell.run, children, skipped);
    total += list.runs.size() + list.notRun.size();
    for (const NotRun& one : list.notRun) endWithoutRun(one);
    // Each goes before all that are queued, so the last comes first.
    for (auto one = list.runs.rbegin(); one != list.runs.rend(); ++one) start(*one, true);
  }

  void endWithoutRun(const NotRun& one) {
    PluginResult result;
    result.run = one.run;
    result.otherNames = otherNames[one.run.bundle];
    result.judgement.verdict =
        one.why == NotRun::Why::kSkipped ? Verdict::kSkipped : Verdict::kWrongArchitecture;
    result.judgement.cause = one.reason;
    deliver(result);
  }

  void deliver(const Plugin& plugin) {
    const Plugin delivered = plugin;
    underWay.erase(std::remove(underWay.begin(), underWay.end(), delivered), underWay.end());
    deliver(delivered->result);
  }

  void deliver(PluginResult& result) {
    const bool isGood = rowOf(result.judgement.verdict).isGood;
    const bool isFlaky = result.repetitions && result.repetitions->isFlaky();
    result.isWanted = isGood && !isFlaky;
    const auto rows = expected.matching(result.run.bundle, result.run.child);
    for (const PluginRow* one : rows) rowsMet.insert(one->line);
    const PluginRow* row = rows.empty() ? nullptr : rows.front();
    // The list of what to skip has a reason for each; it needs no second one.
    if (row != nullptr && result.judgement.verdict != Verdict::kSkipped) {
      const bool isMet = row->verdict == rowOf(result.judgement.verdict).word &&
                         (!row->step || *row->step == result.judgement.step);
      result.expected = Expectation{row->verdict, row->step, row->reason, isMet};
      result.isWanted = isMet && !isFlaky;
    }
    ++done;
    ++counts[rowOf(result.judgement.verdict).word];
    if (!result.isWanted) ++unwanted;
    json.write(eventLine(result));
    terminal.ended(result);
    // With nobody left to read what comes out, there is nothing to run for.
    const bool isJsonLost = options.jsonFile.empty() || !json.problem().empty();
    if (output.hasFailed && isJsonLost && engineInUse != nullptr) engineInUse->stop();
  }

  void showProgress() {
    const double elapsed = secondsSince1970() - startedAt;
    const double left =
        done > 0 ? elapsed / static_cast<double>(done) * static_cast<double>(total - done) : 0;
    std::vector<std::string> names;
    for (const Plugin& plugin : underWay) names.push_back(nameOf(plugin->result.run, false));
    terminal.progress(done, total, left, names);
  }

  int finish(bool isWhole) {
    terminal.clearProgress();
    ScanEnded ended;
    ended.time = secondsSince1970();
    ended.wallSeconds = ended.time - startedAt;
    ended.counts = counts;
    ended.unwanted = unwanted;
    ended.isInterrupted = !isWhole;
    const bool isComplete = !isWhole || checkRowsWithoutPlugin();
    ended.status = !isWhole                      ? kScanInterrupted
                   : unwanted > 0 || !isComplete ? kScanNotAsWanted
                                                 : kScanAsWanted;
    if (isListIncomplete && ended.status == kScanAsWanted) ended.status = kScanNotAsWanted;
    terminal.ended(ended);
    if (output.hasFailed) {
      complain("the report could not be written: " + output.reason);
      ended.status = kScanCannotGoOn;
    }
    json.write(eventLine(ended));
    if (!json.problem().empty()) {
      complain("the results could not be written: " + json.problem());
      ended.status = kScanCannotGoOn;
    }
    return ended.status;
  }

  /// A plug-in that is expected and was not found has got lost, which nobody would notice otherwise.
  bool checkRowsWithoutPlugin() {
    if (options.shard.parts > 1) return true;
    bool isComplete = true;
    for (const PluginRow& row : expected.rows) {
      if (rowsMet.count(row.line) > 0 || row.pattern.find_first_of("*?[") != std::string::npos) continue;
      if (row.child && *row.child == "*") continue;
      complain(fmt::format("{}, line {}: there was no such plug-in: {}{}", expected.file, row.line,
                           row.pattern, row.child ? "#" + *row.child : ""));
      isComplete = false;
    }
    return isComplete;
  }

  const ScanOptions& options;
  JsonStream json;
  TextOutput output;
  TerminalReport terminal;
  PluginList skipped;
  PluginList expected;
  std::vector<std::string> notes;
  std::map<std::string, std::vector<std::string>> otherNames;
  RunEngine* engineInUse = nullptr;
  std::vector<Plugin> underWay;  ///< Started and not yet delivered.
  std::set<unsigned> rowsMet;
  std::map<std::string, std::size_t> counts;
  std::size_t total = 0;
  std::size_t done = 0;
  std::size_t unwanted = 0;
  bool isListIncomplete = false;
  double startedAt = 0;
};

}  // namespace

int scan(const ScanOptions& options) {
  std::signal(SIGPIPE, SIG_IGN);  // A reader that has gone is a write that fails.
  try {
    return Scan(options).run();
  } catch (const BrokenList& error) {
    complain(error.what());
    return kScanWrongUse;
  } catch (const std::exception& error) {
    complain(error.what());
    return kScanCannotGoOn;
  }
}

}  // namespace scanner
