// SPDX-License-Identifier: MIT
// A small reader of XML: elements and their text, nothing else.
//
// Comments, declarations, processing instructions, the document type and attributes are passed over. The
// predefined entities and character references are resolved; entities that a document defines are an error,
// so nothing grows while it is read.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace core_foundation {

/// One step through a document.
struct XmlEvent {
  enum class Kind { kOpen, kClose, kText, kEnd, kError };
  Kind kind;
  std::string text;  ///< The element's name, or the text; empty for kEnd and kError.
};

/// Reads a document from the front to the end. The text must outlive the reader.
class XmlReader {
 public:
  explicit XmlReader(std::string_view document) : rest(document) {}

  /// The next step. Opening and closing tags come in pairs (`<a/>` gives both). kEnd comes once everything
  /// that was opened is closed and no byte is left; kError is final.
  XmlEvent next();

  /// How many elements are open at this moment.
  [[nodiscard]] std::size_t depth() const { return openElements.size(); }

 private:
  XmlEvent fail();
  XmlEvent readTag();
  XmlEvent readText();
  bool skipPast(std::string_view end);
  bool skipDocumentType();

  std::string_view rest;
  std::vector<std::string_view> openElements;
  bool closesAtOnce = false;  // the element opened last was written <a/>
  bool failed = false;
};

}  // namespace core_foundation
