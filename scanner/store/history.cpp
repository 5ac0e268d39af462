// SPDX-License-Identifier: MIT
#include "scanner/store/history.h"

#include <nlohmann/json.hpp>

#include "scanner/store/open_database.h"

namespace scanner {
namespace {

constexpr const char* kLastScans =
    "SELECT id, time, machine, toolVersion, endedAt IS NOT NULL, isInterrupted, remembered, counts, changes "
    "FROM scans"
    " ORDER BY id DESC LIMIT ?1";
constexpr const char* kCountsOfScan =
    "SELECT verdict, count(*) FROM results WHERE scan = ?1 GROUP BY verdict";
constexpr const char* kResults =
    "SELECT bundle, processor, child, childName, time, wallSeconds, verdict, isFlaky, cause, toolVersion "
    "FROM results"
    " WHERE ";
constexpr const char* kOrder = " ORDER BY bundle, processor, child, id DESC";

std::map<std::string, std::size_t> countsOf(const std::string& text) {
  std::map<std::string, std::size_t> counts;
  const nlohmann::json object = nlohmann::json::parse(text, nullptr, false);
  if (!object.is_object()) return counts;
  for (const auto& [word, count] : object.items()) {
    if (count.is_number_unsigned()) counts[word] = count.get<std::size_t>();
  }
  return counts;
}

}  // namespace

History::History(const std::string& file) : database(openUpToDate(file)) {}

std::vector<EarlierScan> History::lastScans(std::size_t most) {
  std::vector<EarlierScan> scans;
  Statement row(*database, kLastScans);
  row.bind(1, static_cast<std::int64_t>(most));
  while (row.step()) {
    EarlierScan& scan = scans.emplace_back();
    scan.time = row.real(1);
    scan.machine = row.text(2);
    scan.toolVersion = row.text(3);
    scan.hasEnded = row.number(4) != 0;
    scan.isInterrupted = row.number(5) != 0;
    scan.remembered = static_cast<std::size_t>(row.number(6));
    scan.counts = countsOf(row.text(7));
    scan.changes = countsOf(row.text(8));
    if (scan.hasEnded) continue;
    Statement counts(*database, kCountsOfScan);
    counts.bind(1, row.number(0));
    while (counts.step()) scan.counts[counts.text(0)] = static_cast<std::size_t>(counts.number(1));
  }
  return scans;
}

std::vector<EarlierResult> History::resultsOf(const std::string& name) {
  for (const char* condition : {"bundle = ?1", "instr(bundle, ?1) > 0"}) {
    std::vector<EarlierResult> results;
    Statement row(*database, std::string(kResults) + condition + kOrder);
    row.bindBytes(1, name);
    while (row.step()) {
      EarlierResult& result = results.emplace_back();
      result.bundle = row.text(0);
      result.processor = row.text(1);
      if (!row.isNull(2)) result.child = static_cast<std::int32_t>(row.number(2));
      result.childName = row.text(3);
      result.time = row.real(4);
      result.wallSeconds = row.real(5);
      result.verdict = row.text(6);
      result.isFlaky = row.number(7) != 0;
      result.cause = row.text(8);
      result.toolVersion = row.text(9);
    }
    if (!results.empty()) return results;
  }
  return {};
}

}  // namespace scanner
