// SPDX-License-Identifier: MIT
#include "scanner/scan/baseline_file.h"

#include <algorithm>
#include <stdexcept>
#include <utility>

#include "scanner/events/recorded_stream.h"
#include "scanner/plan/plugin_list.h"
#include "scanner/report/merge.h"
#include "scanner/report/terminal.h"

namespace scanner {

Baseline readBaseline(const std::string& file, std::vector<std::string>& notes) {
  try {
    RecordedStream stream = readStream(file);
    const MergedReport merged = merge(std::move(stream.scans));
    for (const std::vector<std::string>& problems : {stream.problems, merged.problems}) {
      for (const std::string& problem : problems) notes.push_back("baseline: " + problem);
    }
    return Baseline(merged.report.results);
  } catch (const std::runtime_error& error) {
    throw BrokenList(std::string("baseline: ") + error.what());
  }
}

std::vector<std::string> goneInWords(const std::vector<Run>& gone) {
  std::vector<std::string> notes;
  for (const Run& run : gone) notes.push_back("gone since the baseline: " + nameOf(run, true));
  return notes;
}

BaselineInUse::BaselineInUse(const std::string& file, std::vector<std::string>& notes) {
  if (!file.empty()) baseline = readBaseline(file, notes);
}

void BaselineInUse::begin(const std::vector<Module>& modules, ScanStarted& started) {
  if (!baseline) return;
  places = started.places;
  shard = started.shard;
  std::vector<Run> runs;
  for (const Module& module : modules) {
    Run& run = runs.emplace_back();
    run.bundle = module.bundle;
    run.target = module.target;
    found.push_back(keyOf(run));
  }
  baseline->locate(runs);
  std::vector<Run> gone = baseline->gone(found, places, shard);
  gone.erase(std::remove_if(gone.begin(), gone.end(), [](const Run& run) { return run.child.has_value(); }),
             gone.end());
  for (const std::string& note : goneInWords(gone)) started.notes.push_back(note);
}

void BaselineInUse::apply(PluginResult& result) {
  if (!baseline) return;
  baseline->apply(result);
  if (result.run.child) found.push_back(keyOf(result.run));
}

std::vector<std::string> BaselineInUse::goneChildren() const {
  if (!baseline) return {};
  std::vector<Run> gone = baseline->gone(found, places, shard);
  gone.erase(std::remove_if(gone.begin(), gone.end(), [](const Run& run) { return !run.child.has_value(); }),
             gone.end());
  return goneInWords(gone);
}

}  // namespace scanner
