// SPDX-License-Identifier: MIT
// Reads the lines of an event stream back into events.
//
// A recorded stream may be anything: cut off, edited by hand, from another version, or no stream at all. A line is
// read whole or not at all, and nothing in it can make the reader throw, crash, or use much more memory or time than
// the line's length accounts for.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <variant>

#include "scanner/events/result.h"

namespace scanner {

/// A process is started for this plug-in.
struct RunStarted {
  Run run;
};

using Event = std::variant<ScanStarted, RunStarted, PluginResult, ScanEnded>;

/// The event of one line, with or without its newline. Every line that eventLine() writes is read back so that
/// eventLine() writes it again to the byte. What is not in a line (the flight record, the worker, the identity of the
/// file, lines of the protocol other than steps) keeps its default; a step without a time is NaN in
/// Judgement::stepSeconds, or missing at its end.
///
/// Members that are unknown are ignored. Nothing for a line that is no event; `problem` then is a phrase that says
/// why, without control characters: "it is no JSON", "\"verdict\" is \"pased\", which is no verdict".
std::optional<Event> readEvent(std::string_view line, std::string* problem = nullptr);

/// The line, whichever event it is.
std::string eventLine(const Event& event);

}  // namespace scanner
