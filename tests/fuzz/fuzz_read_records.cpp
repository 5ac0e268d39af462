// SPDX-License-Identifier: MIT
// Fuzz target: reads the identity records from a stream that takes its values from the input.
//
// The first byte of an operation decides its outcome: 0xFE makes it fail, 0xFF makes it throw, with any other
// byte it succeeds. A text is a byte n and 2 * n + 1 bytes, or as many as the record allows. At the end of
// the input every operation fails. A record that was read is written and read once more, and must stay the
// same.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <string>

#include "loader/plugin_identity.h"
#include "loader/stream.h"

namespace {

constexpr std::uint8_t kFails = 0xFE;
constexpr std::uint8_t kThrows = 0xFF;

struct StreamThrew {};

void require(bool condition) {
  if (!condition) std::abort();
}

class FuzzStream : public INiduStream {
 public:
  FuzzStream(const std::uint8_t* input, std::size_t size) : at(input), left(size) {}

  void writeString(AutoNiduException*, const char*) override { std::abort(); }
  void writeBool(AutoNiduException*, bool) override { std::abort(); }
  void writeInt32(AutoNiduException*, std::int32_t) override { std::abort(); }

  void readString(AutoNiduException* error, char* buffer, int maxLength) override {
    if (!begins(error)) return;
    const std::size_t wanted = static_cast<std::size_t>(byte()) * 2 + 1;
    const std::size_t length = std::min({wanted, left, static_cast<std::size_t>(maxLength)});
    if (length > 0) std::memcpy(buffer, at, length);
    buffer[length] = '\0';
    at += length;
    left -= length;
  }

  char readBool(AutoNiduException* error) override {
    return begins(error) ? static_cast<char>(byte()) : '\x7F';
  }

  std::int32_t readInt32(AutoNiduException* error) override {
    if (!begins(error)) return 0x7F7F7F7F;
    std::uint32_t value = 0;
    for (int i = 0; i < 4; ++i) value = value << 8 | byte();
    return static_cast<std::int32_t>(value);
  }

 private:
  std::uint8_t byte() {
    if (left == 0) return 0;
    --left;
    return *at++;
  }

  bool begins(AutoNiduException* error) {
    const std::uint8_t outcome = left == 0 ? kFails : byte();
    if (outcome == kThrows) throw StreamThrew();
    if (outcome == kFails) error->record.errorCode = 1 + static_cast<std::int32_t>(left);
    return outcome != kFails;
  }

  const std::uint8_t* at;
  std::size_t left;
};

/// Returns the values that were written, in the same order.
class MemoryStream : public INiduStream {
 public:
  void writeString(AutoNiduException*, const char* text) override { texts.emplace_back(text); }
  void writeBool(AutoNiduException*, bool value) override { numbers.push_back(value ? 1 : 0); }
  void writeInt32(AutoNiduException*, std::int32_t value) override { numbers.push_back(value); }
  void readString(AutoNiduException*, char* buffer, int maxLength) override {
    require(texts.front().size() <= static_cast<std::size_t>(maxLength));
    std::strcpy(buffer, texts.front().c_str());
    texts.pop_front();
  }
  char readBool(AutoNiduException*) override { return static_cast<char>(next()); }
  std::int32_t readInt32(AutoNiduException*) override { return next(); }

 private:
  std::int32_t next() {
    const std::int32_t number = numbers.front();
    numbers.pop_front();
    return number;
  }

  std::deque<std::string> texts;
  std::deque<std::int32_t> numbers;
};

void requireSame(const VST_loadID& a, const VST_loadID& b) {
  require(a.hasChildID == b.hasChildID && a.childID == b.childID);
}

void requireSame(const VST_ChildSpec& a, const VST_ChildSpec& b) {
  requireSame(static_cast<const VST_loadID&>(a), static_cast<const VST_loadID&>(b));
  require(a.childName == b.childName && !(a < b) && !(b < a));
}

void requireSame(const VST_DLL_Info& a, const VST_DLL_Info& b) {
  require(a.path == b.path && a.effectName == b.effectName && a.dllTag == b.dllTag);
}

void requireSame(const VST_Class_Spec& a, const VST_Class_Spec& b) {
  requireSame(static_cast<const VST_DLL_Info&>(a), static_cast<const VST_DLL_Info&>(b));
  requireSame(a.child, b.child);
  require(a.getEffectName() == b.getEffectName());
}

void readFrom(INiduStream& stream, VST_Class_Spec& record) { record.getFrom(&stream, 0); }
template <typename Record>
void readFrom(INiduStream& stream, Record& record) {
  record.getFrom(&stream);
}

template <typename Record>
void readWriteAndReadAgain(const Record& blank, const std::uint8_t* input, std::size_t size) {
  FuzzStream stream(input, size);
  Record record = blank;
  try {
    readFrom(stream, record);
  } catch (const NiduException& failure) {
    require(failure.errorCode != 0);
    return;
  } catch (const StreamThrew&) {
    return;
  }
  MemoryStream memory;
  record.putTo(&memory);
  Record again = blank;
  readFrom(memory, again);
  requireSame(record, again);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* input, std::size_t size) {
  const VST_DLL_Info bundle("", "");
  readWriteAndReadAgain(VST_loadID(), input, size);
  readWriteAndReadAgain(VST_ChildSpec(), input, size);
  readWriteAndReadAgain(bundle, input, size);
  readWriteAndReadAgain(VST_Class_Spec(bundle, VST_ChildSpec()), input, size);
  return 0;
}
