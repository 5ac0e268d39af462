// SPDX-License-Identifier: MIT
// The runs of a scan: which module, which child, by which worker, or why none.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "scanner/find/module.h"
#include "scanner/plan/plugin_list.h"

namespace scanner {

/// The programs that load plug-ins of one processor.
struct Workers {
  std::string worker;    ///< vsttorture-worker
  std::string describe;  ///< vsttorture-describe
};

/// By processor, as in Target::processor.
using WorkersByProcessor = std::map<std::string, Workers>;

/// One plug-in to try: a bundle, or one child of a shell.
struct Run {
  std::string bundle;
  std::optional<std::int32_t> child = {};
  std::string childName = {};
  Target target = {};
  FileIdentity identity = {};
  Workers workers = {};
};

/// A plug-in that is not run.
struct NotRun {
  enum class Why { kSkipped, kWrongArchitecture };
  Run run;
  Why why = Why::kSkipped;
  std::string reason;  ///< The skip list's, or which worker is missing.
};

/// This machine's part of a scan: K of N, counted from 1. The same plug-ins fall to the same part on every
/// machine, as the part is chosen by the bundle's path alone; the children of a shell go with it.
struct Shard {
  unsigned part = 1;
  unsigned parts = 1;
};

struct RunList {
  std::vector<Run> runs;  ///< In the order in which to start them.
  std::vector<NotRun> notRun;
};

/// Whether the part has this bundle.
bool isInShard(const Shard& shard, const std::string& bundle);

/// Plans one run for each module; children of shells are added when the shell has been described (see
/// runsOfChildren()). `ownProcessor` is the scan's own, whose worker gets the files that are no modules and
/// says what is wrong with them. `secondsOf` gives the duration of an earlier run, 0 where none is known;
/// runs without one come first, then the longest first.
RunList planRuns(const std::vector<Module>& modules, const WorkersByProcessor& workers,
                 const std::string& ownProcessor, const PluginList& skipped, const Shard& shard,
                 const std::function<double(const Module&)>& secondsOf);

struct Child {
  std::int32_t id = 0;
  std::string name;
};

/// A run for each child of a shell that has been run, each identifier once, in the shell's order.
RunList runsOfChildren(const Run& shell, const std::vector<Child>& children, const PluginList& skipped);

}  // namespace scanner
