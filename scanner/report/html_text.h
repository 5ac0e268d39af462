// SPDX-License-Identifier: MIT
// Texts and numbers as the HTML report shows them.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace scanner {

enum class LineBreaks {
  kShown,  ///< As a sign: the text stays on one line.
  kKept,   ///< For an element that keeps lines and tabs.
};

/// `bytes` for the content of an element or for an attribute in quotes: nothing of it is markup.
///
/// What cannot be seen becomes visible, so that no text looks like another: control characters become the signs
/// that Unicode has for them, other invisible ones and those that turn the direction of writing become
/// "[U+202E]". Bytes that are no UTF-8 become U+FFFD. The result is ASCII, which browsers read fastest.
std::string escaped(std::string_view bytes, LineBreaks lineBreaks = LineBreaks::kShown);

/// The same for one line of an element's content; its direction of writing does not reach what stands beside it.
std::string isolated(std::string_view bytes);

/// The first `most` characters, followed by an ellipsis where there are more. `text` is UTF-8.
std::string clipped(std::string_view text, std::size_t most);

/// "322 bytes", "15.2 MiB".
std::string sizeInWords(std::uint64_t bytes);

/// "2026-11-21 22:50:22 UTC", or with a "T" between and "Z" behind for the attribute datetime. Empty for a time
/// that no calendar has.
std::string timeInWords(double secondsSince1970);
std::string timeForMachines(double secondsSince1970);

}  // namespace scanner
