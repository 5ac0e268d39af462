// SPDX-License-Identifier: MIT
// Reads the name of a bundle's executable from its Info.plist.
#include "platform/linux/info_plist.h"

#include <cstddef>

#include "platform/linux/utf8.h"
#include "platform/linux/xml_reader.h"

namespace core_foundation {
namespace {

using Kind = XmlEvent::Kind;

constexpr std::size_t kDepthOfOutermostValues = 3;  // <plist><dict><value>

std::string trimmed(const std::string& text) {
  constexpr char kWhiteSpace[] = " \t\r\n";
  const std::size_t first = text.find_first_not_of(kWhiteSpace);
  if (first == std::string::npos) return {};
  return text.substr(first, text.find_last_not_of(kWhiteSpace) - first + 1);
}

// The element of the outermost dict that is being read.
struct OutermostValue {
  std::string element;
  std::string text;
  bool hasChildren = false;
};

// Walks through a property list and keeps the first string under CFBundleExecutable.
class ExecutableKeyFinder {
 public:
  /// Takes one step; `depth` counts the elements that are open after it.
  void take(const XmlEvent& event, std::size_t depth) {
    if (event.kind == Kind::kOpen) {
      if (depth == 1) isPropertyList = event.text == "plist";
      if (depth == 2) outermostIsDict = isPropertyList && event.text == "dict";
      if (depth == kDepthOfOutermostValues) current = {event.text, {}, false};
      if (depth > kDepthOfOutermostValues) current.hasChildren = true;
    } else if (event.kind == Kind::kText && depth == kDepthOfOutermostValues) {
      current.text += event.text;
    } else if (event.kind == Kind::kClose && depth == kDepthOfOutermostValues - 1) {
      finishValue();
    }
  }

  [[nodiscard]] std::optional<std::string> result() const { return found; }

 private:
  void finishValue() {
    if (!outermostIsDict) return;
    if (current.element == "key") {
      key = trimmed(current.text);
      return;
    }
    const std::string name = trimmed(current.text);
    const bool usable = current.element == "string" && !current.hasChildren && !name.empty();
    if (key == "CFBundleExecutable" && usable && !found) found = name;
    key.clear();
  }

  bool isPropertyList = false;
  bool outermostIsDict = false;
  OutermostValue current;
  std::string key;
  std::optional<std::string> found;
};

}  // namespace

std::optional<std::string> bundleExecutableKey(std::string_view xml) {
  constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
  if (xml.substr(0, kByteOrderMark.size()) == kByteOrderMark) xml.remove_prefix(kByteOrderMark.size());
  if (!isValidUtf8(xml) || xml.find('\0') != std::string_view::npos) return std::nullopt;

  ExecutableKeyFinder finder;
  XmlReader reader(xml);
  for (;;) {
    const XmlEvent event = reader.next();
    if (event.kind == Kind::kError) return std::nullopt;
    if (event.kind == Kind::kEnd) return finder.result();
    finder.take(event, reader.depth());
  }
}

}  // namespace core_foundation
