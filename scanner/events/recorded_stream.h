// SPDX-License-Identifier: MIT
// Reads a recorded event stream: a file of JSON Lines as vsttorture-scan writes it with --json.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "scanner/events/result.h"

namespace scanner {

/// One scan of a stream, from its scan_started on.
struct RecordedScan {
  std::string source;  ///< The file, for sentences.
  ScanReport report;
  std::vector<Run> underWay = {};  ///< Runs that were started and of which no result came.
};

struct RecordedStream {
  std::vector<RecordedScan> scans;  ///< In order: a file may hold several, one after the other.
  /// Sentences about lines that are no events, each with the file and the line's number; the first 20.
  std::vector<std::string> problems;
};

/// Reads the file, or standard input for "-". Lines that are empty do not count. Throws std::runtime_error with a
/// sentence where the file cannot be read, and where no scan begins in it, so that it is no event stream.
RecordedStream readStream(const std::string& file);

/// The same for a stream that comes in pieces: `read` fills the buffer and says how many bytes it got, 0 at the end.
RecordedStream readStream(const std::string& source,
                          const std::function<std::size_t(char* buffer, std::size_t size)>& read);

}  // namespace scanner
