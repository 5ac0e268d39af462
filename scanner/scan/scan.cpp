// SPDX-License-Identifier: MIT
#include "scanner/scan/scan.h"

#include <algorithm>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <map>
#include <memory>
#include <set>
#include <stdexcept>

#include <fmt/format.h>
#include <nlohmann/json.hpp>
#include <sys/utsname.h>
#include <unistd.h>

#include "scanner/events/event_json.h"
#include "scanner/find/find_modules.h"
#include "scanner/plan/time_left.h"
#include "scanner/report/terminal.h"
#include "scanner/scan/baseline_file.h"
#include "scanner/scan/json_stream.h"
#include "scanner/scan/remembering.h"
#include "scanner/scan/text_output.h"
#include "scanner/scan/whole_reports.h"
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

class Scan {
 public:
  explicit Scan(const ScanOptions& options_)
      : options(options_),
        output(options.jsonFile == "-" || options.reports.useStandardOutput() ? STDERR_FILENO
                                                                              : STDOUT_FILENO),
        terminal(terminalOptions(options, output.descriptor),
                 [this](const std::string& text) { return output.write(text); }),
        baseline(options.baselineFile, notes),
        wholeReports(options.reports),
        remembering(options, [this](const std::string& sentence) {
          terminal.clearProgress();
          complain(sentence);
        }) {
    if (!options.skipFile.empty()) skipped = readSkipList(options.skipFile);
    if (!options.expectFile.empty()) expected = readExpectations(options.expectFile, verdictWords());
  }

  int run() {
    FindResult found;
    if (!find(found)) return kScanWrongUse;
    const WorkersByProcessor workers =
        findWorkers(options.workerFolders, notes,
                    [this](const std::string& program) { return remembering.versionOf(program); });
    if (workers.empty()) {
      for (const std::string& note : notes) complain(note);
      complain(fmt::format("there is no vsttorture-worker; looked in {}",
                           fmt::join(workerFolders(options.workerFolders), ", ")));
      return kScanCannotGoOn;
    }
    for (const Module& module : found.modules) otherNames[module.bundle] = module.otherNames;
    RunList list = planRuns(found.modules, workers, ownProcessor(), skipped, options.shard,
                            [this](const Module& module) { return remembering.secondsOf(module); });
    total = list.runs.size() + list.notRun.size();
    const Remembering::Recollection recollection = remembering.recall(list.runs, skipped);
    if (!recollection.unknown.empty()) makeEngine();
    json.openFile(options.jsonFile);
    begin(found);
    for (const NotRun& one : list.notRun) endWithoutRun(one);
    total += recollection.known.size() + recollection.unknown.size() + recollection.notRun.size() -
             list.runs.size();
    take(recollection, false);
    const bool isWhole = !engine || engine->run();
    // Of several runs the later ones may have been left out by the interruption.
    for (const auto& plugin : std::vector(underWay)) {
      plugin->isStopped = true;
      if (plugin->runsDone > 0) deliver(plugin);
    }
    engine.reset();
    return finish(isWhole);
  }

 private:
  /// A plug-in that is being run, once or several times.
  struct UnderWay {
    PluginResult result;
    unsigned runsDone = 0;
    double earlierSeconds = 0;  ///< How long a run took in an earlier scan; 0 for unknown.
    std::optional<std::vector<Child>> children = {};  ///< Of a shell that could be described.
    bool isStopped = false;                     ///< It was interrupted, so that the result is not whole.
    std::vector<std::string> environment = {};  ///< Of the run that speaks for it.
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

  void makeEngine() {
    engine = std::make_unique<RunEngine>(options.engine);
    engine->onTick([this] { showProgress(); });
    explainer.emplace(*engine, options.explain, options.engine.limits);
  }

  void begin(const FindResult& found) {
    startedAt = secondsSince1970();
    ScanStarted started;
    started.version = VSTTORTURE_VERSION;
    started.time = startedAt;
    started.machine = machineName();
    started.places = found.places;
    started.shard = options.shard;
    started.jobs = options.engine.jobs;
    started.limits = options.engine.limits;
    started.sandbox = !engine                 ? "none (not needed: nothing has to be run)"
                      : engine->isSandboxed() ? "bubblewrap"
                                              : "none (" + engine->whyNotSandboxed() + ")";
    started.plugins = total;
    started.notes = notes;
    baseline.begin(found.modules, started);
    json.write(eventLine(started));
    terminal.started(started);
    wholeReports.begin(started);
    remembering.begin(started);
  }

  /// Delivers what is known and queues the rest. Urgent runs go before all that are queued.
  void take(const Remembering::Recollection& recollection, bool isUrgent) {
    for (const Remembering::Known& one : recollection.known) {
      std::optional<PluginResult> result = remembering.resultOf(one);
      if (result) {
        result->otherNames = otherNames[one.run.bundle];
        const bool hasVariable = result->command.size() > 2 && result->command.front() == "env";
        result->command.resize(hasVariable ? 2 : 0);
        for (const std::string& argument : commandOf(one.run)) result->command.push_back(argument);
        deliver(*result);
      } else {
        start({one.run, one.answer.wallSeconds}, isUrgent);
      }
    }
    for (const NotRun& one : recollection.notRun) endWithoutRun(one);
    const std::vector<Remembering::Unknown>& unknown = recollection.unknown;
    if (!isUrgent) {
      for (const Remembering::Unknown& one : unknown) start(one, false);
    } else {
      // Each goes before all that are queued, so the last comes first.
      for (auto one = unknown.rbegin(); one != unknown.rend(); ++one) start(*one, true);
    }
  }

  [[nodiscard]] static std::vector<std::string> commandOf(const Run& run) {
    std::vector<std::string> command = {run.workers.worker, run.bundle};
    if (run.child) command.push_back(std::to_string(*run.child));
    return command;
  }

  [[nodiscard]] Job workerJob(const Run& run, unsigned repetition) const {
    Job job;
    job.program = run.workers.worker;
    job.arguments = {"--", run.bundle};
    if (run.child) job.arguments.push_back(std::to_string(*run.child));
    if (repetition > 0) job.environment.push_back(memoryFilling(repetition));
    return job;
  }

  void start(const Remembering::Unknown& one, bool isUrgent) {
    if (!engine) makeEngine();  // A remembered result could not be read.
    const auto plugin = std::make_shared<UnderWay>();
    plugin->result.run = one.run;
    plugin->result.otherNames = otherNames[one.run.bundle];
    plugin->result.command = commandOf(one.run);
    plugin->earlierSeconds = one.seconds * options.repeat;
    timeLeft.expect(plugin->earlierSeconds);
    startRepetition(plugin, isUrgent);
  }

  void startRepetition(const Plugin& plugin, bool isUrgent) {
    engine->add(
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
    plugin->isStopped = seen.limitHit == LimitHit::kInterrupted;
    if (plugin->isStopped && !isFirst) {  // It says nothing; the earlier ones do.
      deliver(plugin);
      return;
    }
    if (options.repeat > 1) countRepetition(result, judgement);
    // Of several runs the first that is not good speaks for the plug-in.
    if (isFirst || (rowOf(result.judgement.verdict).isGood && !rowOf(judgement.verdict).isGood)) {
      result.judgement = judgement;
      result.seen = seen;
      if (!isFirst) {
        plugin->environment = {memoryFilling(plugin->runsDone - 1)};
        result.command = commandOf(result.run);
        result.command.insert(result.command.begin(), {"env", plugin->environment.front()});
      }
    }
    if (plugin->runsDone < options.repeat && !plugin->isStopped) {
      startRepetition(plugin, true);
      return;
    }
    if (plugin->isStopped) {
      deliver(plugin);
    } else {
      explainer->explain(result, plugin->environment, [this, plugin](bool isWhole) {
        plugin->isStopped = !isWhole;
        explained(plugin);
      });
    }
  }

  void explained(const Plugin& plugin) {
    const PluginResult& result = plugin->result;
    const bool isShell = result.judgement.verdict == Verdict::kShell;
    const bool isDescribable =
        isShell || (options.describes && result.judgement.verdict != Verdict::kNotLoadable &&
                    result.judgement.verdict != Verdict::kRefused);
    if (isDescribable && !plugin->isStopped) {
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
    engine->add(
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
          plugin->isStopped = seen.limitHit == LimitHit::kInterrupted;
          if (isShell && !plugin->isStopped) addChildren(*plugin, description);
          deliver(plugin);
        },
        true);
  }

  void addChildren(UnderWay& plugin, const nlohmann::json& description) {
    PluginResult& shell = plugin.result;
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
      plugin.children = children;
    } else {
      shell.judgement.contradictions.emplace_back(
          "it passed as a shell, but could not be described: its children were not run");
      isListIncomplete = true;
    }
    RunList list = runsOfChildren(shell.run, children, skipped);
    total += list.runs.size() + list.notRun.size();
    for (const NotRun& one : list.notRun) endWithoutRun(one);
    take(remembering.recall(list.runs, skipped), true);
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
    const auto& seen = delivered->result.seen;
    timeLeft.ended(delivered->earlierSeconds, seen ? seen->wallSeconds * delivered->runsDone : 0);
    deliver(delivered->result, delivered.get());
  }

  /// `plugin`: of a run of this scan, which is remembered.
  void deliver(PluginResult& result, const UnderWay* plugin = nullptr) {
    result.isWanted = rowOf(result.judgement.verdict).isGood && !result.isFlaky() && !result.hasFindings();
    const auto rows = expected.matching(result.run.bundle, result.run.child);
    for (const PluginRow* one : rows) rowsMet.insert(one->line);
    const PluginRow* row = rows.empty() ? nullptr : rows.front();
    // The list of what to skip has a reason for each; it needs no second one.
    if (row != nullptr && result.judgement.verdict != Verdict::kSkipped) {
      const bool isMet = row->verdict == rowOf(result.judgement.verdict).word &&
                         (!row->step || *row->step == result.judgement.step);
      result.expected = Expectation{row->verdict, row->step, row->reason, isMet};
      result.isWanted = isMet && !result.isFlaky();
    }
    if (plugin != nullptr || result.isRemembered) remembering.compareWithLast(result);
    if (plugin != nullptr && !plugin->isStopped) remembering.save(result, plugin->children);
    // Where there is a baseline, it is what reports compare with.
    baseline.apply(result);
    ++done;
    ++counts[rowOf(result.judgement.verdict).word];
    if (!result.isWanted) ++unwanted;
    if (json.isOpen()) json.write(eventLine(result));
    terminal.ended(result);
    wholeReports.add(result);
    if (isNobodyLeft() && engine) engine->stop();
  }

  /// With nobody left to read what comes out, there is nothing to run for. A program that has read the events
  /// is all that they were for; a full disk leaves the report for people.
  [[nodiscard]] bool isNobodyLeft() const {
    if (wholeReports.areWanted()) return false;
    const bool hasEvents = !options.jsonFile.empty() && json.problem().empty();
    return json.hasLostReader() || (output.hasFailed && !hasEvents);
  }

  void showProgress() {
    std::vector<std::string> names;
    for (const Plugin& plugin : underWay) names.push_back(nameOf(plugin->result.run, false));
    terminal.setColumns(textColumns(output.descriptor));  // The window may have been resized.
    terminal.progress(done, total, timeLeft.seconds(options.engine.jobs), names);
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
    remembering.end(ended);
    terminal.ended(ended);
    if (output.hasFailed) {
      complain("the report could not be written: " + output.reason);
      ended.status = kScanCannotGoOn;
    }
    for (const std::string& note : isWhole ? baseline.goneChildren() : std::vector<std::string>()) {
      complain(note);
      wholeReports.addNote(note);
    }
    for (const std::string& problem : wholeReports.finish(ended)) {
      complain("a report could not be written: " + problem);
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
      const std::string note = fmt::format("{}, line {}: there was no such plug-in: {}{}", expected.file,
                                           row.line, row.pattern, row.child ? "#" + *row.child : "");
      complain(note);
      wholeReports.addNote(note);
      isComplete = false;
    }
    return isComplete;
  }

  const ScanOptions& options;
  std::vector<std::string> notes;
  JsonStream json;
  TextOutput output;
  TerminalReport terminal;
  PluginList skipped;
  PluginList expected;
  BaselineInUse baseline;
  WholeReports wholeReports;
  std::map<std::string, std::vector<std::string>> otherNames;
  Remembering remembering;
  TimeLeft timeLeft;
  std::unique_ptr<RunEngine> engine;   ///< Made when something has to be run,
  std::optional<Explainer> explainer;  ///< and this with it.
  std::vector<Plugin> underWay;        ///< Started and not yet delivered.
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
  std::signal(SIGPIPE, SIG_IGN);  // A reader that has gone is a write that fails,
  std::signal(SIGXFSZ, SIG_IGN);  // and so is a file that has become too large.
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
