// SPDX-License-Identifier: MIT
// Writes one JSON document into a string.
//
// Written here and not taken from a library: what stands in the process of a plug-in needs nothing but the
// C++ runtime and the system.
//
// Texts are taken as UTF-8. A text that is not UTF-8 is taken as Latin-1, and its place is remembered.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

class JsonWriter {
 public:
  /// Call these in the order of the document: a key before each member of an object, none in an array.
  /// Nothing checks that.
  void beginObject();
  void endObject();
  void beginArray();
  void endArray();
  void key(std::string_view name);

  void text(std::string_view value);
  void integer(std::int64_t value);
  /// The shortest form that gives the same 32-bit float again; null for what JSON cannot say (infinities, NaN).
  void real(float value);
  void boolean(bool value);
  void null();

  /// The document so far.
  [[nodiscard]] const std::string& document() const { return out; }

  /// JSON pointers ("/parameters/3/label") to the texts that were taken as Latin-1, in document order.
  [[nodiscard]] const std::vector<std::string>& latin1Texts() const { return latin1; }

 private:
  struct Level {
    bool isArray;
    std::size_t elements = 0;
    std::string lastKey = {};
  };

  void beginValue();
  void open(char bracket, bool isArray);
  void close(char bracket);
  void newLine();
  void quote(std::string_view utf8);
  [[nodiscard]] std::string pointerToHere() const;

  std::string out;
  std::vector<Level> levels;
  std::vector<std::string> latin1;
};
