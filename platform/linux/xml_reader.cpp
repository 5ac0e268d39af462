// SPDX-License-Identifier: MIT
// A small reader of XML: elements and their text, nothing else.
#include "platform/linux/xml_reader.h"

#include <cstddef>
#include <optional>
#include <utility>

#include "platform/linux/xml_entities.h"

namespace core_foundation {
namespace {

using Kind = XmlEvent::Kind;

constexpr std::string_view kCommentStart = "<!--";
constexpr std::string_view kLiteralTextStart = "<![CDATA[";
constexpr std::string_view kLiteralTextEnd = "]]>";
constexpr std::string_view kWhiteSpace = " \t\r\n";

bool startsWith(std::string_view text, std::string_view start) {
  return text.substr(0, start.size()) == start;
}

// The size of the tag at the front of `text` with both its angle brackets, those in quotes not counted;
// npos when it does not end.
std::size_t tagSize(std::string_view text) {
  char quote = '\0';
  for (std::size_t i = 1; i < text.size(); ++i) {
    const char c = text[i];
    if (quote != '\0') {
      if (c == quote) quote = '\0';
    } else if (c == '"' || c == '\'') {
      quote = c;
    } else if (c == '>') {
      return i + 1;
    } else if (c == '<') {
      break;
    }
  }
  return std::string_view::npos;
}

}  // namespace

XmlEvent XmlReader::fail() {
  failed = true;
  return {Kind::kError, {}};
}

bool XmlReader::skipPast(std::string_view end) {
  const std::size_t position = rest.find(end);
  if (position == std::string_view::npos) return false;
  rest.remove_prefix(position + end.size());
  return true;
}

bool XmlReader::skipDocumentType() {
  // What a document type defines stands in brackets: all of it is passed over, and its entities stay unknown.
  const std::size_t position = rest.find_first_of("[>");
  if (position == std::string_view::npos) return false;
  const bool hasDefinitions = rest[position] == '[';
  rest.remove_prefix(position + 1);
  return !hasDefinitions || (skipPast("]") && skipPast(">"));
}

XmlEvent XmlReader::readTag() {
  const std::size_t size = tagSize(rest);
  if (size == std::string_view::npos) return fail();
  std::string_view tag = rest.substr(1, size - 2);
  rest.remove_prefix(size);

  const bool closing = startsWith(tag, "/");
  if (closing) tag.remove_prefix(1);
  closesAtOnce = !closing && !tag.empty() && tag.back() == '/';
  if (closesAtOnce) tag.remove_suffix(1);
  const std::string_view name = tag.substr(0, tag.find_first_of(kWhiteSpace));
  if (name.empty()) return fail();

  if (!closing) {
    openElements.push_back(name);
    return {Kind::kOpen, std::string(name)};
  }
  if (openElements.empty() || openElements.back() != name) return fail();
  openElements.pop_back();
  return {Kind::kClose, std::string(name)};
}

XmlEvent XmlReader::readText() {
  const std::size_t size = rest.find('<');
  std::optional<std::string> text = resolveEntities(rest.substr(0, size));
  if (!text) return fail();
  rest.remove_prefix(size == std::string_view::npos ? rest.size() : size);
  return {Kind::kText, std::move(*text)};
}

XmlEvent XmlReader::next() {
  if (failed) return fail();
  if (closesAtOnce) {
    closesAtOnce = false;
    std::string name(openElements.back());
    openElements.pop_back();
    return {Kind::kClose, std::move(name)};
  }
  while (!rest.empty()) {
    bool skipped = true;
    if (startsWith(rest, kCommentStart)) {
      rest.remove_prefix(kCommentStart.size());
      skipped = skipPast("-->");
    } else if (startsWith(rest, "<?")) {
      skipped = skipPast("?>");
    } else if (startsWith(rest, kLiteralTextStart)) {
      rest.remove_prefix(kLiteralTextStart.size());
      const std::string_view text = rest.substr(0, rest.find(kLiteralTextEnd));
      return skipPast(kLiteralTextEnd) ? XmlEvent{Kind::kText, std::string(text)} : fail();
    } else if (startsWith(rest, "<!")) {
      skipped = skipDocumentType();
    } else {
      return rest.front() == '<' ? readTag() : readText();
    }
    if (!skipped) return fail();
  }
  return openElements.empty() ? XmlEvent{Kind::kEnd, {}} : fail();
}

}  // namespace core_foundation
