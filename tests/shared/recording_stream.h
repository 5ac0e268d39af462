// SPDX-License-Identifier: MIT
// A stream of typed values in memory: what is written to it can be read from it, and it records each
// operation.
//
//   RecordingStream stream;
//   record.putTo(&stream);
//   EXPECT_THAT(stream.operations(), ElementsAre("write bool true", "write int32 5"));
//   stream.failAt(2, error);                    // ... and the second operation from here on fails
//   EXPECT_THROW(other.getFrom(&stream), NiduException);
//
// Every operation writes a text and a mode, but no error, into its error slot, so that a second use of the
// slot is found. A read operation that fails returns a wrong value: "garbage", true, 0x5A5A5A5A. Reading when
// no value is left, or a value of another type, fails the test.
#pragma once

#include <cstdint>
#include <deque>
#include <string>
#include <vector>

#include "loader/stream.h"

namespace doubles {

/// What the stream throws after throwAt().
struct StreamBroke {
  int operation;  ///< Which one it was, from 1.
};

class RecordingStream : public INiduStream {
 public:
  // ---- What the stream holds, for reading: behind what was written, in order ----

  void addString(const std::string& text) { values.push_back({'s', text, 0}); }
  /// Any value but 0 is true.
  void addBool(char value) { values.push_back({'b', "", value}); }
  void addInt32(std::int32_t value) { values.push_back({'i', "", value}); }

  /// How many values are not read yet.
  std::size_t valuesLeft() const { return values.size(); }

  // ---- How it fails ----

  /// The n-th operation from here on, counted from 1, fails: its error slot becomes `failure`.
  void failAt(int n, const NiduException& failure);
  /// The n-th operation from here on throws a StreamBroke, its error slot already set to an error.
  void throwAt(int n);

  // ---- What was done ----

  /// Each operation in order, also the one that failed, with its argument:
  ///   write string "/b.vst", write bool true, write int32 -1, read string 499, read bool, read int32
  const std::vector<std::string>& operations() const { return done; }
  void forgetOperations() { done.clear(); }

  /// The error slots that were not fresh: the number of the operation, and whether text, error or mode was
  /// set.
  const std::vector<std::string>& usedSlots() const { return used; }

  void writeString(AutoNiduException* error, const char* text) override;
  void writeBool(AutoNiduException* error, bool value) override;
  void writeInt32(AutoNiduException* error, std::int32_t value) override;
  void readString(AutoNiduException* error, char* buffer, int maxLength) override;
  char readBool(AutoNiduException* error) override;
  std::int32_t readInt32(AutoNiduException* error) override;

 private:
  struct Value {
    char type;  // s, b or i
    std::string text;
    std::int32_t number;
  };
  enum class Trouble { kNone, kFail, kThrow };

  // Records the operation and looks at its slot; true when it fails.
  bool fails(AutoNiduException* error, const std::string& operation);
  void throwIfTold() const;
  Value next(char type);

  std::deque<Value> values;
  std::vector<std::string> done;
  std::vector<std::string> used;
  Trouble trouble = Trouble::kNone;
  int operationsUntilTrouble = 0;
  NiduException failureToReport{};
};

}  // namespace doubles
