// SPDX-License-Identifier: MIT
#include "scanner/report/html.h"

#include <algorithm>
#include <map>
#include <set>
#include <string_view>
#include <tuple>

#include <fmt/format.h>

#include "scanner/report/html_details.h"
#include "scanner/report/html_template.h"
#include "scanner/report/html_text.h"
#include "scanner/report/words.h"

namespace scanner {
namespace {

/// Longer names and causes are cut in the row; the details have all of them.
constexpr std::size_t kCharactersOfACell = 300;

/// The details of so many failures are elements from the beginning.
constexpr std::size_t kMostUnpacked = 500;

using Change = Comparison::Change;

const char* wordOf(const PluginResult& result) { return rowOf(result.judgement.verdict).word; }

/// "new" and the like for the column; empty for no change worth a word.
std::string changeOf(const PluginResult& result) {
  if (endsDifferently(result)) return changeWord(Change::kFlaky);
  return result.comparison ? changeWord(result.comparison->change) : "";
}

/// How much a result asks to be looked at: the class of its row.
const char* toneOf(const PluginResult& result) {
  const VerdictRow& row = rowOf(result.judgement.verdict);
  if (result.isWanted) return row.verdict == Verdict::kPassed ? "good" : "calm";
  switch (row.verdict) {
    case Verdict::kPassed:
    case Verdict::kShell:
    case Verdict::kSkipped:
    case Verdict::kNotLoadable:
    case Verdict::kWrongArchitecture:
    case Verdict::kRefused:
    case Verdict::kNotRun:
      return "warn";
    default:
      return "bad";
  }
}

int rankOfChange(const std::string& change) {
  if (change == "new") return 0;
  if (change == "flaky") return 1;
  if (change == "still failing") return 2;
  return change == "mended" ? 3 : 4;
}

const char* toneOfChange(const std::string& change) {
  if (change == "mended") return "good";
  return change == "still failing" ? "calm" : "bad";
}

std::size_t rankOfVerdict(Verdict verdict) {
  const std::vector<VerdictRow>& table = verdictTable();
  const auto row = std::find_if(table.begin(), table.end(),
                                [verdict](const VerdictRow& one) { return one.verdict == verdict; });
  // Behind those that are not good.
  return static_cast<std::size_t>(row - table.begin()) + (row->isGood ? table.size() : 0);
}

/// Pointers into the report, failures first.
std::vector<const PluginResult*> sorted(const std::vector<PluginResult>& results) {
  using Key = std::tuple<bool, int, std::size_t, std::string_view, std::int64_t, const PluginResult*>;
  std::vector<Key> keys;
  keys.reserve(results.size());
  for (const PluginResult& one : results) {
    const std::int64_t child = one.run.child ? std::int64_t{*one.run.child} : INT64_MIN;
    keys.emplace_back(one.isWanted, rankOfChange(changeOf(one)), rankOfVerdict(one.judgement.verdict),
                      one.run.bundle, child, &one);
  }
  std::sort(keys.begin(), keys.end());
  std::vector<const PluginResult*> all;
  all.reserve(keys.size());
  for (const Key& key : keys) all.push_back(std::get<const PluginResult*>(key));
  return all;
}

struct Path {
  std::string folder;
  std::string file;
};

Path split(const std::string& path) {
  const std::size_t end = path.find_last_not_of('/');
  const std::string bare = path.substr(0, end == std::string::npos ? path.size() : end + 1);
  const std::size_t slash = bare.rfind('/');
  if (slash == std::string::npos || slash + 1 == bare.size()) return {{}, bare};
  return {bare.substr(0, std::max<std::size_t>(slash, 1)), bare.substr(slash + 1)};
}

std::string anchorOf(const Run& run) {
  std::string anchor = "plugin-";
  for (const char c : clipped(split(run.bundle).file, 80)) {
    const bool isHarmless = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ||
                            c == '.' || c == '-' || c == '_';
    anchor += isHarmless ? c : '_';
  }
  return run.child ? fmt::format("{}.{}", anchor, *run.child) : anchor;
}

/// A name for each plug-in, with which links point to it. It depends on the plug-ins alone and not on how they
/// ended, so that a link still fits the next report.
std::map<const PluginResult*, std::string> anchorsOf(const std::vector<PluginResult>& results) {
  std::vector<const PluginResult*> byPath;
  byPath.reserve(results.size());
  for (const PluginResult& result : results) byPath.push_back(&result);
  std::sort(byPath.begin(), byPath.end(), [](const PluginResult* one, const PluginResult* other) {
    return std::tie(one->run.bundle, one->run.child, one) <
           std::tie(other->run.bundle, other->run.child, other);
  });
  std::map<std::string, unsigned> uses;
  std::map<const PluginResult*, std::string> anchors;
  for (const PluginResult* result : byPath) {
    const std::string anchor = anchorOf(result->run);
    const unsigned use = ++uses[anchor];
    // "~" is in no anchor of a plug-in's own.
    anchors[result] = use == 1 ? anchor : fmt::format("{}~{}", anchor, use);
  }
  return anchors;
}

std::string cellText(const std::string& text) { return isolated(clipped(text, kCharactersOfACell)); }

void appendRow(std::string& out, const PluginResult& result, const std::string& anchor, bool isPacked) {
  const Run& run = result.run;
  const Path path = split(run.bundle);
  std::string name = cellText(path.file);
  if (run.child) {
    name += fmt::format(" <span class=\"child\">#{}", *run.child);
    if (!run.childName.empty()) name += " " + cellText(run.childName);
    name += "</span>";
  }
  const char* word = wordOf(result);
  const bool isGood = rowOf(result.judgement.verdict).isGood;
  const bool isAsExpected = result.expected && result.expected->isMet && !isGood;
  const std::string change = changeOf(result);
  const bool hasStep = !isGood && result.judgement.step > 0;
  out += fmt::format("<tbody role=\"rowgroup\" id=\"{}\" class=\"{}{}\">", anchor, toneOf(result),
                     result.isWanted ? "" : " unwanted");
  out += fmt::format("<tr role=\"row\" class=\"row\"><td role=\"cell\"><b class=\"tag\">{}</b>{}</td>", word,
                     isAsExpected ? " <small>as expected</small>" : "");
  out += fmt::format("<td role=\"cell\">{} <small>{}</small></td>", name, cellText(path.folder));
  // A good verdict has no cause; that it counts as a failure all the same has a reason.
  const std::string cause = isGood && !result.isWanted ? whyNotWanted(result) : result.judgement.cause;
  out += fmt::format("<td role=\"cell\">{}</td>", cellText(cause));
  out += fmt::format("<td role=\"cell\">{}</td>", hasStep ? std::to_string(result.judgement.step) : "");
  if (result.seen) {
    out += fmt::format("<td role=\"cell\" data-seconds=\"{:.6f}\">{}</td>", result.seen->wallSeconds,
                       escaped(durationInWords(result.seen->wallSeconds)));
  } else {
    out += "<td role=\"cell\"></td>";
  }
  out += fmt::format(
      "<td role=\"cell\">{}</td></tr>\n",
      change.empty() ? "" : fmt::format("<span class=\"change {}\">{}</span>", toneOfChange(change), change));
  out += fmt::format(
      "<tr role=\"row\" class=\"more\"><td role=\"cell\" colspan=\"6\"><details><summary>Details of "
      "{}</summary>\n",
      cellText(path.file));
  // The parser of a browser that runs scripts makes no elements of what is in <noscript>; the script does so when
  // the row is opened. Thousands of rows load in a fraction of the time, and without scripts nothing is missing.
  out += isPacked ? "<noscript>" + htmlDetails(result) + "</noscript>" : htmlDetails(result);
  out += "</details></td></tr></tbody>\n";
}

/// One item of the list of counts.
std::string countItem(const char* group, const std::string& word, std::size_t count, const char* tone) {
  return fmt::format("<li class=\"{}\" data-{}=\"{}\"><b>{}</b> {}</li>\n", tone, group, word, count, word);
}

class Page {
 public:
  explicit Page(const ScanReport& report_) : report(report_) {
    for (const PluginResult& result : report.results) {
      ++counts[result.judgement.verdict];
      ++changes[changeOf(result)];
      if (result.isWanted) continue;
      ++unwanted;
      unwantedOf.insert(result.judgement.verdict);
    }
    changes.erase("");
  }

  [[nodiscard]] std::string heading() const {
    const std::size_t total = report.results.size();
    if (total == 0) return "No plug-in was tried";
    if (total == 1)
      return unwanted == 0 ? "The plug-in ended as it should" : "The plug-in did not end as it should";
    if (unwanted == 0)
      return fmt::format("{} {} plug-ins ended as they should",
                         incompleteness(report).empty() ? "All" : "The", total);
    return fmt::format("{} of {} did not end as {} should", unwanted, countInWords(total, "plug-in"),
                       unwanted == 1 ? "it" : "they");
  }

  [[nodiscard]] std::string verdictItems() const {
    std::vector<VerdictRow> rows = verdictTable();
    std::stable_sort(rows.begin(), rows.end(), [](const VerdictRow& one, const VerdictRow& other) {
      return rankOfVerdict(one.verdict) < rankOfVerdict(other.verdict);
    });
    std::string items;
    for (const VerdictRow& row : rows) {
      const auto found = counts.find(row.verdict);
      if (found == counts.end()) continue;
      PluginResult sample;
      sample.judgement.verdict = row.verdict;
      sample.isWanted = row.isGood || unwantedOf.count(row.verdict) == 0;
      items += countItem("verdict", row.word, found->second, toneOf(sample));
    }
    return items;
  }

  [[nodiscard]] std::string changeItems() const {
    std::vector<std::pair<int, std::string>> words;
    for (const auto& [word, count] : changes) words.emplace_back(rankOfChange(word), word);
    std::sort(words.begin(), words.end());
    std::string items;
    for (const auto& [rank, word] : words)
      items += countItem("change", word, changes.at(word), toneOfChange(word));
    return items;
  }

  /// What went wrong with the scan itself.
  [[nodiscard]] std::string warnings() const {
    std::string items;
    const auto add = [&items](const std::string& sentence) {
      items += "<li>" + escaped(sentence) + "</li>\n";
    };
    const std::size_t total = report.results.size();
    if (!report.ended) {
      add(fmt::format("The scan did not come to its end: it was to try {}, and there are results of {}.",
                      countInWords(report.started.plugins, "plug-in"), total));
    } else if (report.ended->isInterrupted) {
      add(fmt::format("The scan was interrupted: it was to try {}, and there are results of {}.",
                      countInWords(report.started.plugins, "plug-in"), total));
    } else if (const std::string missing = incompleteness(report); !missing.empty()) {
      add(missing);
    }
    for (const std::string& note : report.started.notes) add(note);
    return items.empty() ? "" : "<ul class=\"warnings\">\n" + items + "</ul>\n";
  }

  [[nodiscard]] std::string scanLine() const {
    constexpr const char* kDot = " &#xb7; ";
    const ScanStarted& started = report.started;
    std::string line = isolated(started.machine);
    if (const std::string time = timeInWords(started.time); !time.empty())
      line += fmt::format("{}<time datetime=\"{}\">{}</time>", kDot, timeForMachines(started.time), time);
    if (report.ended) line += kDot + ("took " + escaped(durationInWords(report.ended->wallSeconds)));
    return line + kDot + "vsttorture-scan " + escaped(started.version);
  }

  [[nodiscard]] std::string scanFacts() const {
    const ScanStarted& started = report.started;
    const Limits& limits = started.limits;
    std::string facts;
    const auto fact = [&facts](const char* name, const std::string& text) {
      if (!text.empty()) facts += fmt::format("<dt>{}</dt><dd>{}</dd>\n", name, escaped(text));
    };
    fact("Searched", fmt::format("{}", fmt::join(started.places, ", ")));
    if (started.shard.parts > 1)
      fact("Part", fmt::format("{} of {}", started.shard.part, started.shard.parts));
    fact("Sandbox", started.sandbox);
    fact("At a time", countInWords(started.jobs, "plug-in"));
    fact("Limits", fmt::format("{} a step, {} a run, {}, {} of output, {} of files",
                               durationInWords(limits.stepInSeconds), durationInWords(limits.runInSeconds),
                               limits.memoryInBytes == 0 ? "no limit of memory"
                                                         : sizeInWords(limits.memoryInBytes) + " of memory",
                               sizeInWords(limits.outputInBytes), sizeInWords(limits.filesInBytes)));
    return facts;
  }

  [[nodiscard]] std::string rows() const {
    std::string out;
    const std::map<const PluginResult*, std::string> anchors = anchorsOf(report.results);
    std::size_t unpacked = 0;
    for (const PluginResult* result : sorted(report.results)) {
      const bool isPacked = result->isWanted || unpacked == kMostUnpacked;
      if (!isPacked) ++unpacked;
      appendRow(out, *result, anchors.at(result), isPacked);
    }
    return out;
  }

  [[nodiscard]] const char* tableClass() const {
    return changes.empty() ? "without-changes" : "with-changes";
  }

 private:
  const ScanReport& report;
  std::map<Verdict, std::size_t> counts;
  std::set<Verdict> unwantedOf;  ///< Verdicts of which one or more are not as wanted.
  std::map<std::string, std::size_t> changes;
  std::size_t unwanted = 0;
};

/// The template with each "{{name}}" replaced. What is put in is not looked at again.
std::string filled(std::string_view text, const std::map<std::string_view, std::string>& values) {
  std::size_t size = text.size();
  for (const auto& [name, value] : values) size += value.size();
  std::string out;
  out.reserve(size);
  for (;;) {
    const std::size_t begin = text.find("{{");
    const std::size_t end = begin == std::string_view::npos ? begin : text.find("}}", begin);
    if (end == std::string_view::npos) return out.append(text);
    out.append(text.substr(0, begin));
    const auto value = values.find(text.substr(begin + 2, end - begin - 2));
    if (value != values.end()) out += value->second;
    text.remove_prefix(end + 2);
  }
}

}  // namespace

std::string htmlReport(const ScanReport& report) {
  const Page page(report);
  return filled(kHtmlTemplate, {{"title", escaped(page.heading()) + " - vsttorture-scan"},
                                {"heading", escaped(page.heading())},
                                {"scan", page.scanLine()},
                                {"warnings", page.warnings()},
                                {"verdicts", page.verdictItems()},
                                {"changes", page.changeItems()},
                                {"facts", page.scanFacts()},
                                {"table class", page.tableClass()},
                                {"rows", page.rows()}});
}

}  // namespace scanner
