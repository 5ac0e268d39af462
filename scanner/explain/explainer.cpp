// SPDX-License-Identifier: MIT
#include "scanner/explain/explainer.h"

#include <algorithm>
#include <csignal>
#include <utility>

#include <fmt/format.h>

#include "scanner/explain/gdb.h"
#include "scanner/explain/list_shrinker.h"
#include "scanner/explain/memcheck.h"

namespace scanner {
namespace {

/// The random tests begin behind this step. They are others in each run, unless they are listed.
constexpr int kLastFixedStep = 15;
constexpr std::uint64_t kTimesTheMemory = 4;
constexpr double kPatienceWithGdbInSeconds = 30;

std::string listText(const std::vector<int>& tests) { return fmt::format("{}", fmt::join(tests, ",")); }

/// The worker's arguments, without its own options.
std::vector<std::string> operands(const Run& run, const std::vector<int>& tests) {
  std::vector<std::string> arguments;
  if (!tests.empty()) arguments = {"--tests", listText(tests)};
  arguments.push_back(run.bundle);
  if (run.child) arguments.push_back(std::to_string(*run.child));
  return arguments;
}

/// What a person types.
std::vector<std::string> commandLine(const std::vector<std::string>& environment,
                                     const std::vector<std::string>& tool, const Run& run,
                                     const std::vector<int>& tests) {
  std::vector<std::string> command;
  if (!environment.empty()) command.emplace_back("env");
  command.insert(command.end(), environment.begin(), environment.end());
  command.insert(command.end(), tool.begin(), tool.end());
  command.push_back(run.workers.worker);
  for (const std::string& argument : operands(run, tests)) command.push_back(argument);
  return command;
}

bool isRun(Verdict verdict) {
  switch (verdict) {
    case Verdict::kNotLoadable:
    case Verdict::kWrongArchitecture:
    case Verdict::kRefused:
    case Verdict::kSkipped:
    case Verdict::kNotRun:
      return false;
    default:
      return true;
  }
}

std::string endInWords(const RunSeen& seen) {
  if (seen.limitHit == LimitHit::kStep || seen.limitHit == LimitHit::kRun)
    return "took longer than its limit";
  if (seen.limitHit != LimitHit::kNone) return "used more than it may";
  if (seen.end.kind == End::Kind::kNotEnded) return "did not end";
  if (seen.end.kind == End::Kind::kSignalled) return "was ended by " + nameOfSignal(seen.end.signal);
  return fmt::format("ended with status {}", seen.end.status);
}

void addProblem(Diagnosis& diagnosis, const std::string& sentence) {
  diagnosis.problem += (diagnosis.problem.empty() ? "" : "; ") + sentence;
}

/// Everything that was printed, its end.
std::string printedText(const RunSeen& seen) {
  std::string printed;
  for (const PluginText& text : seen.texts) printed += text.bytes;
  return printed.substr(printed.size() - std::min(printed.size(), Diagnosis::kMostBytesOfReport));
}

}  // namespace

bool failsInTheSameWay(const Judgement& first, const Judgement& again) {
  if (again.verdict != first.verdict) return false;
  if (first.verdict == Verdict::kExited && again.status != first.status) return false;
  if (first.request) {
    return again.request && again.request->kind == first.request->kind &&
           again.request->opcode == first.request->opcode;
  }
  const auto moduleOf = [](const Judgement& one) { return one.place ? one.place->module : std::string(); };
  return !again.request && again.signal == first.signal && moduleOf(again) == moduleOf(first);
}

/// A plug-in that is looked into.
struct Explainer::Case {
  PluginResult& result;
  std::vector<std::string> environment;
  Done done;
  std::vector<int> tests = {};  ///< That the failing run had begun.
  bool isInTest = false;        ///< Whether it failed in one of them, or behind the last one.
  std::optional<ListShrinker> shrinker = {};
};

Explainer::Explainer(RunEngine& engine_, const ExplainOptions& options_, const Limits& limits_)
    : engine(engine_), options(options_), limits(limits_) {}

void Explainer::explain(PluginResult& result, std::vector<std::string> environment, Done done) {
  const Verdict verdict = result.judgement.verdict;
  if (!result.seen || !isRun(verdict) || (!options.tool && !options.shrinks)) {
    done(true);
    return;
  }
  const auto open = std::make_shared<Case>(Case{result, std::move(environment), std::move(done)});
  const int step = result.judgement.step;
  open->tests = testsBegun(*result.seen, step);
  open->isInTest = open->tests.size() > testsBegun(*result.seen, step - 1).size();
  if (options.shrinks && !rowOf(verdict).isGood) {
    shrink(open);
  } else {
    diagnose(open);
  }
}

// ---- Shorter lists ----------------------------------------------------------------------------------------

void Explainer::shrink(const Open& open) {
  Shrunk shrunk;
  shrunk.command = open->result.command;
  if (open->isInTest && open->result.judgement.verdict != Verdict::kNoInstance) {
    shrunk.from = shrunk.tests = listText(open->tests);
    open->result.shrunk = shrunk;
    open->shrinker.emplace(open->tests);
    runNextList(open);
    return;
  }
  shrunk.problem = open->tests.empty()
                       ? "it fails before the first test, whatever the tests are"
                       : "it fails when it is created a second time, which a list of tests does not do";
  open->result.shrunk = shrunk;
  diagnose(open);
}

void Explainer::runNextList(const Open& open) {
  const ListShrinker& shrinker = *open->shrinker;
  Shrunk& shrunk = *open->result.shrunk;
  shrunk.runs = shrinker.runs();
  shrunk.isReproduced = shrinker.isReproduced();
  if (shrunk.isReproduced) {
    shrunk.tests = listText(shrinker.best());
    shrunk.command = commandLine(open->environment, {}, open->result.run, shrinker.best());
  }
  if (!shrinker.next()) {
    if (!shrunk.isReproduced)
      shrunk.problem = fmt::format("it did not fail again in this way in {} runs with a list", shrunk.runs);
    else if (shrinker.isCutOff())
      shrunk.problem = fmt::format("{} runs were not enough to try each test's absence", shrunk.runs);
    diagnose(open);
    return;
  }
  const std::vector<int> tests = *shrinker.next();
  engine.add(
      workerJob(*open, tests),
      [this, open, tests](const RunSeen& seen) {
        if (seen.limitHit == LimitHit::kInterrupted) {
          open->result.shrunk->problem = "interrupted";
          open->done(false);
          return;
        }
        const Judgement judgement = judge(seen, limits, tests.size());
        const std::size_t begun = testsBegun(seen, judgement.step).size();
        open->shrinker->answer(begun > 0 && failsInTheSameWay(open->result.judgement, judgement), begun);
        runNextList(open);
      },
      true);
}

// ---- Under a tool -----------------------------------------------------------------------------------------

void Explainer::diagnose(const Open& open) {
  PluginResult& result = open->result;
  if (!options.tool) {
    open->done(true);
    return;
  }
  const ExplainTool& tool = *options.tool;
  Diagnosis diagnosis;
  diagnosis.tool = tool.name;
  if (tool.kind == ExplainTool::Kind::kGdb && !canStopAt(result.judgement, diagnosis.problem)) {
    if (!diagnosis.problem.empty()) result.diagnosis = diagnosis;
    open->done(true);
    return;
  }
  // The whole run finds the most. What failed in its random part is not in another one.
  std::vector<int> tests;
  const bool isGood = rowOf(result.judgement.verdict).isGood;
  if (!isGood && open->isInTest) {
    if (result.judgement.step > kLastFixedStep) tests = open->tests;
    const bool isShort = open->shrinker && open->shrinker->isReproduced();
    if (isShort && tool.kind != ExplainTool::Kind::kMemcheck) tests = open->shrinker->best();
  }

  Job job = workerJob(*open, tests);
  job.limits = limitsUnder(result.judgement);
  job.tool.emplace();
  job.tool->needsAddressSpace = true;
  switch (tool.kind) {
    case ExplainTool::Kind::kMemcheck:
      diagnosis.command = commandLine(open->environment, memcheckCommand("valgrind"), result.run, tests);
      job.tool->command = [valgrind = tool.command.front()](const std::string& folder) {
        return memcheckCommand(valgrind, folder);
      };
      job.tool->files = {kMemcheckErrors, kMemcheckLog};
      break;
    case ExplainTool::Kind::kGdb:
      diagnosis.command =
          commandLine(open->environment, gdbCommand("gdb", result.judgement), result.run, tests);
      job.tool->command = [gdb = tool.command.front(), judgement = result.judgement](
                              const std::string& folder) { return gdbCommand(gdb, judgement, folder); };
      // gdb quotes the worker's arguments for the shell that it starts the worker with.
      job.environment.emplace_back("SHELL=/bin/sh");
      job.tool->files = {kGdbLog};
      job.tool->endSignal = SIGINT;
      job.tool->patienceInSeconds = kPatienceWithGdbInSeconds;
      break;
    case ExplainTool::Kind::kCommand:
      diagnosis.command = commandLine(open->environment, tool.command, result.run, tests);
      job.tool->command = [command = tool.command](const std::string&) { return command; };
      break;
  }
  if (tool.kind != ExplainTool::Kind::kMemcheck && limits.memoryInBytes > 0) {
    // The tool may use more, the plug-in may not.
    const std::vector<std::string> limit = {"--memory-limit", std::to_string(limits.memoryInBytes)};
    job.arguments.insert(job.arguments.begin(), limit.begin(), limit.end());
  }
  result.diagnosis = std::move(diagnosis);
  result.diagnosis->problem = "interrupted";  // Until it is over.
  engine.add(
      std::move(job), [this, open, tests](const RunSeen& seen) { diagnosed(open, seen, tests); }, true);
}

void Explainer::diagnosed(const Open& open, const RunSeen& seen, const std::vector<int>& tests) {
  const PluginResult& result = open->result;
  Diagnosis& diagnosis = *open->result.diagnosis;
  if (seen.limitHit == LimitHit::kInterrupted) {
    open->done(false);
    return;
  }
  diagnosis.problem.clear();
  if (seen.end.kind == End::Kind::kNotStarted) {
    diagnosis.problem = "it could not be started: " + seen.end.reason;
    open->done(true);
    return;
  }
  switch (options.tool->kind) {
    case ExplainTool::Kind::kMemcheck: {
      readMemcheck(seen.toolFiles.at(0), seen.toolFiles.at(1), diagnosis);
      const Judgement judgement = judge(seen, limitsUnder(result.judgement), tests.size());
      if (judgement.verdict != result.judgement.verdict && judgement.verdict != Verdict::kNotRun) {
        addProblem(diagnosis, fmt::format("the run ended otherwise, {}{}{}", rowOf(judgement.verdict).word,
                                          judgement.cause.empty() ? "" : ": ", judgement.cause));
      }
      break;
    }
    case ExplainTool::Kind::kGdb:
      readGdb(seen.toolFiles.at(0), result.judgement, diagnosis);
      break;
    case ExplainTool::Kind::kCommand: {
      diagnosis.report = printedText(seen);
      const std::string end = endInWords(seen);
      const std::string usual = endInWords(*result.seen);
      if (end != usual)
        diagnosis.findings.push_back({"status", fmt::format("The run {}; without it, it {}", end, usual)});
      break;
    }
  }
  open->done(true);
}

Job Explainer::workerJob(const Case& open, const std::vector<int>& tests) const {
  Job job;
  job.program = open.result.run.workers.worker;
  if (!tests.empty()) job.arguments = {"--tests", listText(tests)};
  job.arguments.emplace_back("--");
  for (const std::string& argument : operands(open.result.run, {})) job.arguments.push_back(argument);
  job.environment = open.environment;
  return job;
}

Limits Explainer::limitsUnder(const Judgement& judgement) const {
  const bool isGdb = options.tool->kind == ExplainTool::Kind::kGdb;
  const bool isHung = judgement.verdict == Verdict::kHung;
  double times = isHung ? kTimesForAHang : kTimesUnderATool;
  if (isGdb) times = isHung ? 1 : kTimesUnderGdb;
  Limits under = limits;
  under.stepInSeconds *= times;
  under.runInSeconds *= times;
  under.memoryInBytes *= kTimesTheMemory;
  return under;
}

}  // namespace scanner
