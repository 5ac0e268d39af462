// SPDX-License-Identifier: MIT
// Lists of plug-ins in a text file: those to skip (--skip), and how each is expected to end (--expect).
//
// One row a plug-in, fields separated by tabs; empty lines and lines that begin with # do not count.
//
//   skip list:          PATTERN[#CHILD] <tab> REASON
//   expectations:       PATTERN[#CHILD] <tab> VERDICT <tab> STEP or - <tab> REASON or nothing
//
// PATTERN is a path as the shell's patterns are (*, ?, [...]). One that begins with a slash is compared with
// the whole path, and its * matches slashes too. Any other is compared with as many of the path's last parts
// as it has: effect.so and vst/effect.so match /usr/lib/vst/effect.so. #CHILD is the identifier of a shell's
// child, or * for all of them.
#pragma once

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

namespace scanner {

/// A list that cannot be used. what() says the file, the line (counted from 1), and what is wrong with it.
class BrokenList : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

struct PluginRow {
  std::string pattern;
  std::optional<std::string> child = {};  ///< An identifier in decimal or "*"; nothing for the bundle itself.
  std::string verdict = {};               ///< Expectations only.
  std::optional<int> step = {};           ///< Expectations only; nothing for any step.
  std::string reason = {};
  unsigned line = 0;  ///< Counted from 1.

  /// Whether the row is about this child of this bundle, or, with nothing for a child, about the bundle
  /// itself.
  bool matches(const std::string& bundle, const std::optional<std::int32_t>& wantedChild) const;
};

class PluginList {
 public:
  PluginList() = default;
  explicit PluginList(std::string file_) : file(std::move(file_)) {}

  void add(const PluginRow& row);

  /// All rows that match, in their order. Owned by the list. Fast also with a row for each of many plug-ins, as long as
  /// the rows end with a file name rather than a pattern.
  [[nodiscard]] std::vector<const PluginRow*> matching(const std::string& bundle,
                                                       const std::optional<std::int32_t>& child) const;
  /// The first of them, which decides, or null.
  [[nodiscard]] const PluginRow* find(const std::string& bundle,
                                      const std::optional<std::int32_t>& child) const;

  std::string file = {};
  std::vector<PluginRow> rows = {};  ///< Changed by add() alone.

 private:
  std::unordered_map<std::string, std::vector<std::size_t>> rowsByFileName;
  std::vector<std::size_t> rowsWithPattern;  ///< Those that do not end with a file name.
};

/// Read the file at `path`. Throw BrokenList. A verdict word is checked against those of judge/verdict.h by
/// the caller, who gives them.
PluginList readSkipList(const std::string& path);
PluginList readExpectations(const std::string& path, const std::vector<std::string>& verdictWords);

}  // namespace scanner
