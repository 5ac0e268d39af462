// SPDX-License-Identifier: MIT
#include "scanner/events/event_json.h"

#include <utility>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "scanner/events/bounded_json.h"

namespace scanner {
namespace {

using Json = nlohmann::ordered_json;

std::string dumped(const Json& value) { return value.dump(-1, ' ', false, Json::error_handler_t::replace); }

std::string line(const Json& event) { return dumped(event) + "\n"; }

/// The text as UTF-8; dump() replaces what is not.
Json text(const std::string& bytes) { return bytes; }

Json texts(const std::vector<std::string>& all) {
  Json array = Json::array();
  for (const std::string& one : all) array.push_back(text(one));
  return array;
}

template <class Value>
Json orNull(const std::optional<Value>& value) {
  return value ? Json(*value) : Json(nullptr);
}

std::string hexadecimal(std::uint64_t number) { return fmt::format("0x{:x}", number); }

std::string systemName(Target::System system) {
  switch (system) {
    case Target::System::kLinux:
      return "linux";
    case Target::System::kMacOs:
      return "macos";
    case Target::System::kWindows:
      return "windows";
  }
  return "";
}

Json targetJson(const Target& target) {
  if (target.processor.empty()) return nullptr;
  return {{"system", systemName(target.system)}, {"processor", target.processor}};
}

Json pluginJson(const Run& run) {
  return {{"bundle", text(run.bundle)},
          {"child", orNull(run.child)},
          {"childName", run.child ? text(run.childName) : Json(nullptr)},
          {"target", targetJson(run.target)}};
}

Json limitsJson(const Limits& limits) {
  return {{"stepInSeconds", limits.stepInSeconds},
          {"runInSeconds", limits.runInSeconds},
          {"memoryInBytes", limits.memoryInBytes},
          {"outputInBytes", limits.outputInBytes},
          {"filesInBytes", limits.filesInBytes}};
}

Json requestJson(const std::optional<RequestSeen>& request) {
  if (!request) return nullptr;
  Json json = {{"kind", request->kind}};
  if (request->kind == "dispatcher") {
    json["opcode"] = request->opcode;
    json["name"] = request->name;
    json["index"] = request->index;
    json["value"] = request->value;
    json["opt"] = request->opt;
  } else if (request->kind == "getParameter") {
    json["index"] = request->index;
  } else if (request->kind == "setParameter") {
    json["index"] = request->index;
    json["opt"] = request->opt;
  }
  return json;
}

Json hostRequestJson(const std::optional<HostRequestSeen>& request) {
  if (!request) return nullptr;
  return {{"opcode", request->opcode},
          {"name", request->name},
          {"index", request->index},
          {"value", request->value},
          {"count", request->count}};
}

Json placeJson(const std::optional<Place>& place) {
  if (!place) return nullptr;
  return {{"module", place->module.empty() ? Json(nullptr) : text(place->module)},
          {"offset", hexadecimal(place->offset)},
          {"address", hexadecimal(place->address)}};
}

Json activityJson(const std::optional<Activity>& activity) {
  if (!activity) return nullptr;
  return {{"processorSeconds", activity->processorSeconds},
          {"wallSeconds", activity->wallSeconds},
          {"state", std::string(1, activity->state)},
          {"systemCall", activity->systemCall.empty() ? Json(nullptr) : Json(activity->systemCall)},
          {"sockets", activity->sockets}};
}

Json stepsJson(const RunSeen& seen, const Judgement& judgement) {
  Json steps = Json::array();
  for (const ProtocolLine& one : seen.lines) {
    if (one.kind != ProtocolLine::Kind::kStep) continue;
    const auto index = static_cast<std::size_t>(one.number - 1);
    const bool isTimed = index < judgement.stepSeconds.size();
    steps.push_back({{"number", one.number},
                     {"text", text(one.text)},
                     {"seconds", isTimed ? Json(judgement.stepSeconds[index]) : Json(nullptr)}});
  }
  return steps;
}

Json printedJson(const RunSeen& seen) {
  Json printed = Json::array();
  for (const PluginText& one : seen.texts) {
    printed.push_back({{"step", one.step},
                       {"stream", one.isStandardError ? "stderr" : "stdout"},
                       {"text", text(one.bytes)}});
  }
  return printed;
}

void addSeen(Json& event, const RunSeen& seen, const Judgement& judgement) {
  event["time"] = seen.startedAt;
  event["wallSeconds"] = seen.wallSeconds;
  event["userSeconds"] = seen.userSeconds;
  event["systemSeconds"] = seen.systemSeconds;
  event["peakMemoryInBytes"] = seen.peakMemoryInBytes;
  event["sandbox"] = seen.wasSandboxed ? "bubblewrap" : "none";
  event["steps"] = stepsJson(seen, judgement);
  event["tests"] = orNull(judgement.testsRun);
  event["printed"] = printedJson(seen);
  event["outputBytes"] = seen.outputBytes;
  event["leftBehind"] = {{"processes", seen.leftBehind.processes},
                         {"sharedMemory", seen.leftBehind.sharedMemory},
                         {"files", texts(seen.leftBehind.files)},
                         {"fileCount", seen.leftBehind.fileCount},
                         {"fileBytes", seen.leftBehind.fileBytes}};
}

Json expectedJson(const std::optional<Expectation>& expected) {
  if (!expected) return nullptr;
  return {{"verdict", expected->verdict},
          {"step", orNull(expected->step)},
          {"reason", text(expected->reason)},
          {"isMet", expected->isMet}};
}

Json repetitionsJson(const std::optional<Repetitions>& repetitions) {
  if (!repetitions) return nullptr;
  return {{"runs", repetitions->runs},
          {"isFlaky", repetitions->isFlaky()},
          {"flakeRate", repetitions->flakeRate()},
          {"verdicts", repetitions->verdicts}};
}

Json comparisonJson(const std::optional<Comparison>& comparison) {
  if (!comparison) return nullptr;
  Json earlier = nullptr;
  if (comparison->earlier) {
    earlier = {{"verdict", comparison->earlier->verdict},
               {"step", orNull(comparison->earlier->step)},
               {"time", comparison->earlier->time}};
  }
  return {{"change", nameOfChange(comparison->change)}, {"earlier", earlier}};
}

Json diagnosisJson(const std::optional<Diagnosis>& diagnosis) {
  if (!diagnosis) return nullptr;
  Json findings = Json::array();
  for (const Diagnosis::Finding& one : diagnosis->findings)
    findings.push_back({{"kind", text(one.kind)},
                        {"text", text(one.text)},
                        {"frames", texts(one.frames)},
                        {"isInPlugin", one.isInPlugin}});
  return {{"tool", text(diagnosis->tool)},
          {"command", texts(diagnosis->command)},
          {"findings", findings},
          {"problem", diagnosis->problem.empty() ? Json(nullptr) : text(diagnosis->problem)},
          {"report", text(diagnosis->report)}};
}

Json shrunkJson(const std::optional<Shrunk>& shrunk) {
  if (!shrunk) return nullptr;
  return {{"from", shrunk->from},
          {"tests", shrunk->tests},
          {"runs", shrunk->runs},
          {"isReproduced", shrunk->isReproduced},
          {"command", texts(shrunk->command)},
          {"problem", shrunk->problem.empty() ? Json(nullptr) : text(shrunk->problem)}};
}

/// A remembered event with what is of this scan.
std::string recordedLine(const PluginResult& result) {
  const Json today = {
      {"otherNames", texts(result.otherNames)},    {"isWanted", result.isWanted},
      {"expected", expectedJson(result.expected)}, {"command", texts(result.command)},
      {"isRemembered", result.isRemembered},       {"comparison", comparisonJson(result.comparison)}};
  std::string line;
  for (const auto& [name, value] : *result.recorded) {
    const auto changed = today.find(name);
    line += line.empty() ? "{\"" : ",\"";
    line += name + "\":";
    line += changed == today.end() ? value : dumped(*changed);
  }
  return line + "}\n";
}

}  // namespace

double Repetitions::flakeRate() const {
  unsigned bad = 0;
  for (const auto& [end, count] : verdicts) {
    const std::optional<Verdict> verdict = verdictOf(std::string_view(end).substr(0, end.find(' ')));
    if (!verdict || !rowOf(*verdict).isGood) bad += count;
  }
  return runs > 0 ? static_cast<double>(bad) / runs : 0;
}

const char* nameOfChange(Comparison::Change change) {
  switch (change) {
    case Comparison::Change::kNone:
      return "none";
    case Comparison::Change::kNew:
      return "new";
    case Comparison::Change::kMended:
      return "mended";
    case Comparison::Change::kStillFailing:
      return "still_failing";
    case Comparison::Change::kFlaky:
      return "flaky";
  }
  return "none";
}

std::string eventLine(const ScanStarted& started) {
  return line({{"event", "scan_started"},
               {"format", kEventFormat},
               {"version", started.version},
               {"time", started.time},
               {"machine", text(started.machine)},
               {"places", texts(started.places)},
               {"shard", {{"part", started.shard.part}, {"parts", started.shard.parts}}},
               {"jobs", started.jobs},
               {"limits", limitsJson(started.limits)},
               {"sandbox", text(started.sandbox)},
               {"plugins", started.plugins},
               {"notes", texts(started.notes)}});
}

std::string eventLine(const Run& runStarted) {
  return line({{"event", "run_started"}, {"plugin", pluginJson(runStarted)}});
}

std::string eventLine(const PluginResult& result) {
  if (result.recorded) return recordedLine(result);
  const Judgement& judgement = result.judgement;
  Json event = {
      {"event", "plugin_ended"},
      {"plugin", pluginJson(result.run)},
      {"otherNames", texts(result.otherNames)},
      {"verdict", rowOf(judgement.verdict).word},
      {"isWanted", result.isWanted},
      {"cause", text(judgement.cause)},
      {"step", judgement.step == 0 ? Json(nullptr)
                                   : Json{{"number", judgement.step}, {"text", text(judgement.stepText)}}},
      {"request", requestJson(judgement.request)},
      {"hostRequest", hostRequestJson(judgement.hostRequest)},
      {"status", orNull(judgement.status)},
      {"signal", judgement.signal
                     ? Json{{"number", *judgement.signal}, {"name", nameOfSignal(*judgement.signal)}}
                     : Json(nullptr)},
      {"place", placeJson(judgement.place)},
      {"activity", activityJson(result.seen ? result.seen->activity : std::nullopt)},
      {"hangs", judgement.isBusy ? Json(*judgement.isBusy ? "busy" : "waiting") : Json(nullptr)},
      {"contradictions", texts(judgement.contradictions)},
      {"expected", expectedJson(result.expected)},
      {"repetitions", repetitionsJson(result.repetitions)},
      {"command", texts(result.command)},
      {"isRemembered", result.isRemembered},
      {"comparison", comparisonJson(result.comparison)},
      {"diagnosis", diagnosisJson(result.diagnosis)},
      {"shrunk", shrunkJson(result.shrunk)},
  };
  if (result.seen) addSeen(event, *result.seen, judgement);
  if (result.description) {
    // The describer ran the plug-in's code, so that this may be anything.
    std::optional<Json> description = parseBounded(*result.description, kDeepestEvent - 1, nullptr);
    if (description) event["description"] = std::move(*description);
  }
  std::string whole = line(event);
  if (whole.size() <= kLongestEventLine || !event.contains("description")) return whole;
  event.erase("description");
  return line(event);
}

std::string eventLine(const ScanEnded& ended) {
  return line({{"event", "scan_ended"},
               {"time", ended.time},
               {"wallSeconds", ended.wallSeconds},
               {"counts", ended.counts},
               {"unwanted", ended.unwanted},
               {"isInterrupted", ended.isInterrupted},
               {"status", ended.status}});
}

std::string pluginText(const Run& run) { return dumped(pluginJson(run)); }

std::string validUtf8(std::string_view bytes) {
  const bool isAscii =
      std::all_of(bytes.begin(), bytes.end(), [](char c) { return static_cast<unsigned char>(c) < 0x80; });
  if (isAscii) return std::string(bytes);
  const std::string quoted =
      nlohmann::json(std::string(bytes)).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
  return nlohmann::json::parse(quoted).get<std::string>();
}

}  // namespace scanner
