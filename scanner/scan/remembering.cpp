// SPDX-License-Identifier: MIT
#include "scanner/scan/remembering.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <tuple>

#include <fmt/format.h>
#include <sys/stat.h>

#include "scanner/events/baseline.h"
#include "scanner/events/comparison.h"
#include "scanner/events/event_json.h"
#include "scanner/events/event_members.h"
#include "scanner/events/event_reader.h"
#include "scanner/scan/workers.h"

namespace scanner {
namespace {

/// Changes whenever a library is installed or removed.
constexpr const char* kListOfLibraries = "/etc/ld.so.cache";

std::string identityOf(const std::string& path) {
  struct stat status = {};
  if (stat(path.c_str(), &status) != 0) return "none";
  return fmt::format("{}:{}:{}.{:09}", status.st_ino, status.st_size, status.st_ctim.tv_sec,
                     status.st_ctim.tv_nsec);
}

std::string variable(const char* name) {
  const char* value = std::getenv(name);
  return value == nullptr ? "" : fmt::format(" {}={}", name, value);
}

std::string sandboxWord(SandboxUse use) {
  switch (use) {
    case SandboxUse::kAuto:
      return "auto";
    case SandboxUse::kRequired:
      return "required";
    case SandboxUse::kOff:
      return "off";
  }
  return "";
}

/// Everything of the command line and the environment that has a part in how a run ends, or in what its result
/// holds. The order of runs, lists of plug-ins and reports have none.
std::string optionsThatMatter(const ScanOptions& options) {
  const Limits& limits = options.engine.limits;
  std::string text = fmt::format("step-limit={} limit={} memory={} output={} files={} repeat={}",
                                 limits.stepInSeconds, limits.runInSeconds, limits.memoryInBytes,
                                 limits.outputInBytes, limits.filesInBytes, options.repeat);
  if (options.describes) text += " describe";
  if (options.engine.keepDisplay) text += " display";
  if (options.explain.shrinks) text += " shrink";
  if (options.explain.tool) {
    text += fmt::format(" under={}", options.explain.tool->name);
    for (const std::string& argument : options.explain.tool->command)
      text += fmt::format(" \"{}\"", argument);
    text += variable("VALGRIND_OPTS");
  }
  return text + variable("LD_LIBRARY_PATH") + variable("LD_PRELOAD");
}

}  // namespace

std::string databaseFile(const std::string& cacheOption) {
  if (cacheOption == "off") return {};
  if (cacheOption.empty()) return defaultDatabase(std::getenv("XDG_CACHE_HOME"), std::getenv("HOME"));
  std::error_code error;
  return std::filesystem::absolute(cacheOption, error).string();
}

Remembering::Remembering(const ScanOptions& options_, std::function<void(const std::string&)> say)
    : options(options_) {
  if (options.cacheFile == "off") return;
  const std::string file = databaseFile(options.cacheFile);
  if (file.empty()) {
    say("nothing is remembered: neither XDG_CACHE_HOME nor HOME is set");
    return;
  }
  store = std::make_unique<Store>(file, std::move(say));
  hasEarlierResults = store->hasResults();
  common.options = validUtf8(optionsThatMatter(options));
  common.sandboxWanted = sandboxWord(options.engine.sandbox);
  common.libraries = identityOf(kListOfLibraries);
  common.format = kEventFormat;
  common.toolVersion = VSTTORTURE_VERSION;
}

Circumstances Remembering::circumstancesOf(const Run& run) {
  const auto programIdentity = [this](const std::string& path) -> const std::string& {
    const auto [at, isNew] = identities.try_emplace(path);
    if (isNew) at->second = identityOf(path);
    return at->second;
  };
  Circumstances circumstances = common;
  circumstances.file = run.identity;
  circumstances.worker = programIdentity(run.workers.worker) + " " + programIdentity(run.workers.describe);
  return circumstances;
}

Remembering::Recollection Remembering::recall(const std::vector<Run>& runs, const PluginList& skipped) {
  Recollection recollection;
  for (const Run& run : runs) recall(run, skipped, recollection);
  // In the order in which they were found, rather than in that of their durations.
  std::stable_sort(recollection.known.begin(), recollection.known.end(), [](const Known& a, const Known& b) {
    return std::tie(a.run.bundle, a.run.target.processor) < std::tie(b.run.bundle, b.run.target.processor);
  });
  return recollection;
}

void Remembering::recall(const Run& run, const PluginList& skipped, Recollection& recollection) {
  std::vector<Remembered> results;
  if (store) results = store->resultsOf(run.bundle, run.target.processor, run.child);
  if (!options.isFresh && !results.empty()) {
    const Circumstances wanted = circumstancesOf(run);
    for (const Remembered& one : results) {
      if (whyVoid(one, wanted) != Void::kNot) continue;
      recollection.known.push_back({run, one});
      if (one.verdict != Verdict::kShell) return;
      RunList children = runsOfChildren(run, *one.children, skipped);
      for (const Run& child : children.runs) recall(child, skipped, recollection);
      for (NotRun& child : children.notRun) recollection.notRun.push_back(std::move(child));
      return;
    }
  }
  recollection.unknown.push_back({run, results.empty() ? 0 : results.front().wallSeconds});
}

bool Remembering::fillFromEvent(PluginResult& result, const Known& known, bool isRead) {
  const std::optional<std::string> line = store->eventOf(known.answer.id);
  if (!line) return false;
  // The database may have been set aside meanwhile: the same number is another result's in the new one.
  if (isRead) {
    std::optional<Event> event = readEvent(*line);
    auto* whole = event ? std::get_if<PluginResult>(&*event) : nullptr;
    const bool isOf = whole != nullptr && keyOf(whole->run) == keyOf(known.run);
    if (!isOf || whole->judgement.verdict != known.answer.verdict) return false;
    result = std::move(*whole);
    return true;
  }
  result.recorded = eventMembers(*line);
  const auto has = [&result](const char* name, const std::string& value) {
    const EventMembers::value_type member(name, value);
    return std::find(result.recorded->begin(), result.recorded->end(), member) != result.recorded->end();
  };
  return result.recorded && has("plugin", pluginText(known.run)) &&
         has("verdict", fmt::format("\"{}\"", rowOf(known.answer.verdict).word));
}

std::optional<PluginResult> Remembering::resultOf(const Known& known) {
  const Remembered& answer = known.answer;
  PluginResult result = resultInShort(answer);
  // On the terminal no more is shown of a good result than its verdict, and its event can be written unread.
  const bool isRead =
      options.reports.areWanted() || options.explain.tool || !rowOf(answer.verdict).isGood || answer.isFlaky;
  if ((isRead || !options.jsonFile.empty()) && !fillFromEvent(result, known, isRead)) return std::nullopt;
  result.run = known.run;
  result.otherNames.clear();
  result.expected.reset();
  result.isRemembered = true;
  result.comparison.reset();
  return result;
}

void Remembering::compareWithLast(PluginResult& result) {
  if (result.isRemembered) {
    ++remembered;
    const PluginResult itself = result;
    result.comparison = compare(result, &itself, true);
  } else if (store && hasEarlierResults) {
    const std::vector<Remembered> earlier =
        store->resultsOf(result.run.bundle, result.run.target.processor, result.run.child);
    if (earlier.empty()) {
      result.comparison = compare(result, nullptr, false);
    } else {
      PluginResult last = resultInShort(earlier.front());
      if (result.diagnosis) last.diagnosis = lastDiagnosis(earlier, result.diagnosis->tool);
      const bool isUnchanged = whyVoid(earlier.front(), circumstancesOf(result.run)) == Void::kNot;
      result.comparison = compare(result, &last, isUnchanged);
    }
  }
  if (result.comparison && result.comparison->change != Comparison::Change::kNone)
    ++changes[nameOfChange(result.comparison->change)];
}

std::optional<Diagnosis> Remembering::lastDiagnosis(const std::vector<Remembered>& earlier,
                                                    const std::string& tool) {
  for (const Remembered& one : earlier) {
    const std::optional<std::string> line = store->eventOf(one.id);
    const std::optional<Event> event = line ? readEvent(*line) : std::nullopt;
    const auto* whole = event ? std::get_if<PluginResult>(&*event) : nullptr;
    if (whole != nullptr && whole->diagnosis && whole->diagnosis->tool == tool) return whole->diagnosis;
  }
  return std::nullopt;
}

void Remembering::begin(const ScanStarted& scan) {
  if (store) store->beginScan(scan);
}

void Remembering::save(const PluginResult& result, const std::optional<std::vector<Child>>& children) {
  const bool isOfARun = result.seen && result.judgement.verdict != Verdict::kNotRun;
  if (store && isOfARun && !result.isRemembered) store->save(result, circumstancesOf(result.run), children);
}

void Remembering::end(const ScanEnded& scan) {
  if (store) store->endScan(scan, changes, remembered);
}

double Remembering::secondsOf(const Module& module) {
  return store ? store->secondsOf(module.bundle, module.target.processor) : 0;
}

std::string Remembering::versionOf(const std::string& program) {
  const std::string identity = identityOf(program);
  if (store) {
    if (const std::optional<std::string> known = store->versionOf(program, identity)) return *known;
  }
  std::string version = askVersion(program);
  if (store && !version.empty()) store->saveVersion(program, identity, version);
  return version;
}

}  // namespace scanner
