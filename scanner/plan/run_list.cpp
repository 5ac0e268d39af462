// SPDX-License-Identifier: MIT
#include "scanner/plan/run_list.h"

#include <algorithm>
#include <set>

namespace scanner {
namespace {

/// FNV-1a: the same on every machine.
std::uint64_t hashOf(const std::string& text) {
  std::uint64_t hash = 14695981039346656037U;
  for (const char c : text) hash = (hash ^ static_cast<unsigned char>(c)) * 1099511628211U;
  return hash;
}

std::string systemInWords(Target::System system) {
  switch (system) {
    case Target::System::kLinux:
      return "Linux";
    case Target::System::kMacOs:
      return "macOS";
    case Target::System::kWindows:
      return "Windows";
  }
  return "";
}

}  // namespace

bool isInShard(const Shard& shard, const std::string& bundle) {
  return hashOf(bundle) % shard.parts == shard.part - 1;
}

RunList planRuns(const std::vector<Module>& modules, const WorkersByProcessor& workers,
                 const std::string& ownProcessor, const PluginList& skipped, const Shard& shard,
                 const std::function<double(const Module&)>& secondsOf) {
  RunList list;
  std::vector<std::pair<double, Run>> timed;
  for (const Module& module : modules) {
    if (!isInShard(shard, module.bundle)) continue;
    Run run{module.bundle, {}, {}, module.target, module.identity, {}};
    if (const PluginRow* row = skipped.find(module.bundle, {})) {
      list.notRun.push_back({run, NotRun::Why::kSkipped, row->reason});
      continue;
    }
    auto worker = workers.find(module.target.processor.empty() ? ownProcessor : module.target.processor);
    if (module.target.processor.empty() && worker == workers.end()) worker = workers.begin();
    const bool isOfThisSystem = module.target.system == Target::System::kLinux;
    if (!isOfThisSystem || worker == workers.end()) {
      const std::string target = systemInWords(module.target.system) + " on " + module.target.processor;
      list.notRun.push_back({run, NotRun::Why::kWrongArchitecture,
                             isOfThisSystem ? "built for " + target + ", for which no worker is installed"
                                            : "built for " + target});
      continue;
    }
    run.workers = worker->second;
    timed.emplace_back(secondsOf(module), run);
  }
  std::stable_sort(timed.begin(), timed.end(), [](const auto& a, const auto& b) {
    const bool isNewA = a.first <= 0;
    const bool isNewB = b.first <= 0;
    if (isNewA != isNewB) return isNewA;
    return a.first > b.first;
  });
  for (auto& [seconds, run] : timed) list.runs.push_back(std::move(run));
  return list;
}

RunList runsOfChildren(const Run& shell, const std::vector<Child>& children, const PluginList& skipped) {
  RunList list;
  std::set<std::int32_t> known;
  for (const Child& child : children) {
    if (!known.insert(child.id).second) continue;
    Run run = shell;
    run.child = child.id;
    run.childName = child.name;
    if (const PluginRow* row = skipped.find(shell.bundle, child.id)) {
      list.notRun.push_back({run, NotRun::Why::kSkipped, row->reason});
    } else {
      list.runs.push_back(run);
    }
  }
  return list;
}

}  // namespace scanner
