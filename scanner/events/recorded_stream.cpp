// SPDX-License-Identifier: MIT
#include "scanner/events/recorded_stream.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <string_view>
#include <utility>

#include <fcntl.h>
#include <fmt/format.h>
#include <unistd.h>

#include "scanner/events/event_json.h"
#include "scanner/events/event_reader.h"

namespace scanner {
namespace {

constexpr std::size_t kMostProblems = 20;

/// Puts a stream together, line by line.
class Reading {
 public:
  explicit Reading(std::string source_) : source(std::move(source_)) {}

  void take(std::string_view line) {
    ++number;
    if (line.find_first_not_of(" \t\r\n") == std::string_view::npos) return;
    std::string problem;
    std::optional<Event> event = readEvent(line, &problem);
    if (!event) {
      complain(problem);
    } else if (auto* started = std::get_if<ScanStarted>(&*event)) {
      stream.scans.push_back({source, {std::move(*started), {}, {}}, {}});
      isOpen = true;
    } else if (!isOpen) {
      complain("no scan is under way there");
    } else {
      takeInScan(*event, stream.scans.back());
    }
  }

  /// The line goes on for longer than any event does.
  void takeTooLong() {
    ++number;
    complain(fmt::format("it is longer than {} MiB; nothing behind it is read", kLongestEventLine >> 20));
  }

  RecordedStream finish() {
    if (stream.scans.empty())
      throw std::runtime_error(
          source + " is no stream of events: " + (firstProblem.empty() ? "it is empty" : firstProblem));
    if (problemCount > kMostProblems)
      stream.problems.push_back(
          fmt::format("{}: {} further lines are no events", source, problemCount - kMostProblems));
    return std::move(stream);
  }

 private:
  void complain(const std::string& problem) {
    const std::string where = fmt::format("line {}: {}", number, problem);
    if (firstProblem.empty()) firstProblem = where;
    if (++problemCount <= kMostProblems) stream.problems.push_back(source + ", " + where);
  }

  void takeInScan(Event& event, RecordedScan& scan) {
    if (auto* started = std::get_if<RunStarted>(&event)) {
      scan.underWay.push_back(std::move(started->run));
    } else if (auto* result = std::get_if<PluginResult>(&event)) {
      const auto isIt = [result](const Run& run) {
        return run.bundle == result->run.bundle && run.child == result->run.child;
      };
      scan.underWay.erase(std::remove_if(scan.underWay.begin(), scan.underWay.end(), isIt),
                          scan.underWay.end());
      scan.report.results.push_back(std::move(*result));
    } else if (auto* ended = std::get_if<ScanEnded>(&event)) {
      scan.report.ended = std::move(*ended);
      isOpen = false;
    }
  }

  std::string source;
  RecordedStream stream;
  std::size_t number = 0;  ///< Of the line, from 1.
  bool isOpen = false;     ///< A scan has begun and not ended.
  std::size_t problemCount = 0;
  std::string firstProblem;
};

}  // namespace

RecordedStream readStream(const std::string& source,
                          const std::function<std::size_t(char* buffer, std::size_t size)>& read) {
  Reading reading(source);
  std::vector<char> buffer(std::size_t{1} << 16);
  std::string pending;  // The beginning of a line.
  while (const std::size_t count = read(buffer.data(), buffer.size())) {
    std::string_view piece(buffer.data(), count);
    for (std::size_t end = piece.find('\n'); end != std::string_view::npos; end = piece.find('\n')) {
      pending += piece.substr(0, end);
      reading.take(pending);
      pending.clear();
      piece.remove_prefix(end + 1);
    }
    pending += piece;
    if (pending.size() > kLongestEventLine) {
      reading.takeTooLong();
      return reading.finish();
    }
  }
  if (!pending.empty()) reading.take(pending);
  return reading.finish();
}

RecordedStream readStream(const std::string& file) {
  const bool isStandardInput = file == "-";
  const std::string source = isStandardInput ? "standard input" : file;
  const auto fails = [&source]() -> std::size_t {
    throw std::runtime_error(source + ": " + std::strerror(errno));
  };
  const int descriptor = isStandardInput ? STDIN_FILENO : open(file.c_str(), O_RDONLY | O_CLOEXEC);
  if (descriptor < 0) fails();
  const auto close = [&] {
    if (!isStandardInput) ::close(descriptor);
  };
  try {
    RecordedStream stream = readStream(source, [&](char* bytes, std::size_t size) {
      for (;;) {
        const ssize_t count = ::read(descriptor, bytes, size);
        if (count >= 0) return static_cast<std::size_t>(count);
        if (errno != EINTR) return fails();
      }
    });
    close();
    return stream;
  } catch (...) {
    close();
    throw;
  }
}

}  // namespace scanner
