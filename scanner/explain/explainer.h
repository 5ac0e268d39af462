// SPDX-License-Identifier: MIT
// Runs a plug-in again to find out more: with shorter lists of tests, and under a tool.
//
// The verdict stays that of the usual run. All further runs go through the engine, one at a time for each plug-in, and
// before all that is queued.
#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "scanner/engine/run_engine.h"
#include "scanner/events/result.h"
#include "scanner/explain/explain_tool.h"

namespace scanner {

struct ExplainOptions {
  std::optional<ExplainTool> tool = {};  ///< --under
  bool shrinks = false;                  ///< --shrink
};

/// Under a tool a run takes longer: so many times the time limits.
constexpr double kTimesUnderATool = 50;
/// When the plug-in hangs anyway,
constexpr double kTimesForAHang = 5;
/// and under gdb, which slows down little.
constexpr double kTimesUnderGdb = 5;

/// Whether a run with a list of tests has failed as the first one did: with the same verdict in the same request of
/// the host; where that is not known, by the same signal in the same module.
bool failsInTheSameWay(const Judgement& first, const Judgement& again);

class Explainer {
 public:
  /// `engine` and `options` outlive this. `limits` are those of the usual run.
  Explainer(RunEngine& engine, const ExplainOptions& options, const Limits& limits);

  /// Whether nothing is missing because the engine was interrupted.
  using Done = std::function<void(bool isWhole)>;

  /// Fills in `shrunk` and `diagnosis`, as far as the options ask for them and the verdict allows, and then calls
  /// `done`, at once where there is nothing to do. `environment` is what the run had that gave the verdict. The result
  /// must live until then. When the engine is interrupted, `done` may never be called; what is known by then is in
  /// the result.
  void explain(PluginResult& result, std::vector<std::string> environment, Done done);

 private:
  struct Case;
  using Open = std::shared_ptr<Case>;

  void shrink(const Open& open);
  void runNextList(const Open& open);
  void diagnose(const Open& open);
  void diagnosed(const Open& open, const RunSeen& seen, const std::vector<int>& tests);
  [[nodiscard]] Job workerJob(const Case& open, const std::vector<int>& tests) const;
  [[nodiscard]] Limits limitsUnder(const Judgement& judgement) const;

  RunEngine& engine;
  const ExplainOptions& options;
  Limits limits;
};

}  // namespace scanner
