// SPDX-License-Identifier: MIT
#include "scanner/plan/plugin_list.h"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstring>
#include <fstream>

#include <fmt/format.h>
#include <fnmatch.h>

namespace scanner {
namespace {

std::vector<std::string> fieldsOf(const std::string& line) {
  std::vector<std::string> fields;
  std::size_t at = 0;
  for (;;) {
    const std::size_t tab = line.find('\t', at);
    fields.push_back(line.substr(at, tab == std::string::npos ? tab : tab - at));
    if (tab == std::string::npos) return fields;
    at = tab + 1;
  }
}

std::optional<std::int32_t> numberIn(const std::string& text) {
  std::int32_t number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  const bool isNumber = error == std::errc() && end == text.data() + text.size();
  return isNumber ? std::optional(number) : std::nullopt;
}

std::string fileNameOf(const std::string& path) { return path.substr(path.rfind('/') + 1); }

[[noreturn]] void fail(const std::string& file, unsigned line, const std::string& what) {
  throw BrokenList(fmt::format("{}, line {}: {}", file, line, what));
}

/// Calls `take` with the fields of each row and its line.
template <class Take>
PluginList readList(const std::string& path, Take take) {
  std::ifstream input(path, std::ios::binary);
  if (!input) throw BrokenList(fmt::format("{}: {}", path, std::strerror(errno)));
  PluginList list(path);
  unsigned number = 0;
  for (std::string line; std::getline(input, line);) {
    ++number;
    if (!line.empty() && line.back() == '\r') line.pop_back();
    if (line.find_first_not_of(" \t") == std::string::npos || line[0] == '#') continue;
    const std::vector<std::string> fields = fieldsOf(line);
    PluginRow row;
    row.line = number;
    row.pattern = fields[0];
    const std::size_t mark = row.pattern.rfind('#');
    if (mark != std::string::npos) {
      const std::string child = row.pattern.substr(mark + 1);
      const std::optional<std::int32_t> identifier = numberIn(child);
      if (child == "*" || identifier) {
        row.child = identifier ? std::to_string(*identifier) : child;
        row.pattern.erase(mark);
      }
    }
    // A shell completes the name of a folder with a slash.
    while (row.pattern.size() > 1 && row.pattern.back() == '/') row.pattern.pop_back();
    if (row.pattern.empty()) fail(path, number, "no plug-in is named");
    take(fields, row);
    list.add(row);
  }
  if (input.bad()) throw BrokenList(fmt::format("{}: {}", path, std::strerror(errno)));
  return list;
}

}  // namespace

bool PluginRow::matches(const std::string& bundle, const std::optional<std::int32_t>& wantedChild) const {
  if (child.has_value() != wantedChild.has_value()) return false;
  if (child && *child != "*" && *child != std::to_string(*wantedChild)) return false;
  if (pattern[0] == '/') return fnmatch(pattern.c_str(), bundle.c_str(), 0) == 0;
  // As many parts of the path as the pattern has.
  const auto slashes = std::count(pattern.begin(), pattern.end(), '/');
  std::size_t begin = bundle.rfind('/');
  for (auto i = slashes; i > 0 && begin != std::string::npos && begin > 0; --i)
    begin = bundle.rfind('/', begin - 1);
  if (begin == std::string::npos) return slashes == 0 && fnmatch(pattern.c_str(), bundle.c_str(), 0) == 0;
  return fnmatch(pattern.c_str(), bundle.c_str() + begin + 1, FNM_PATHNAME) == 0;
}

void PluginList::add(const PluginRow& row) {
  const std::string name = fileNameOf(row.pattern);
  // Brackets may hold a slash, so they are looked for in the whole pattern.
  const bool isPattern =
      name.find_first_of("*?") != std::string::npos || row.pattern.find_first_of("[\\") != std::string::npos;
  (isPattern ? rowsWithPattern : rowsByFileName[name]).push_back(rows.size());
  rows.push_back(row);
}

std::vector<const PluginRow*> PluginList::matching(const std::string& bundle,
                                                   const std::optional<std::int32_t>& child) const {
  std::vector<std::size_t> candidates = rowsWithPattern;
  const auto named = rowsByFileName.find(fileNameOf(bundle));
  if (named != rowsByFileName.end())
    candidates.insert(candidates.end(), named->second.begin(), named->second.end());
  std::sort(candidates.begin(), candidates.end());
  std::vector<const PluginRow*> found;
  for (const std::size_t one : candidates) {
    if (rows[one].matches(bundle, child)) found.push_back(&rows[one]);
  }
  return found;
}

const PluginRow* PluginList::find(const std::string& bundle, const std::optional<std::int32_t>& child) const {
  const std::vector<const PluginRow*> found = matching(bundle, child);
  return found.empty() ? nullptr : found.front();
}

PluginList readSkipList(const std::string& path) {
  return readList(path, [&](const std::vector<std::string>& fields, PluginRow& row) {
    if (fields.size() != 2 || fields[1].empty()) {
      fail(path, row.line, "a row is PLUG-IN, a tab, and the reason why it is skipped");
    }
    row.reason = fields[1];
  });
}

PluginList readExpectations(const std::string& path, const std::vector<std::string>& verdictWords) {
  return readList(path, [&](const std::vector<std::string>& fields, PluginRow& row) {
    if (fields.size() < 2 || fields.size() > 4) {
      fail(path, row.line, "a row is PLUG-IN, VERDICT, STEP or -, and a reason, with tabs between them");
    }
    row.verdict = fields[1];
    if (std::find(verdictWords.begin(), verdictWords.end(), row.verdict) == verdictWords.end()) {
      fail(path, row.line, fmt::format("\"{}\" is no verdict", row.verdict));
    }
    if (fields.size() > 2 && fields[2] != "-" && !fields[2].empty()) {
      row.step = numberIn(fields[2]);
      if (!row.step || *row.step < 0) fail(path, row.line, fmt::format("\"{}\" is no step", fields[2]));
    }
    if (fields.size() > 3) row.reason = fields[3];
  });
}

}  // namespace scanner
