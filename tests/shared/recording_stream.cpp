// SPDX-License-Identifier: MIT
// The stream in memory: values in a queue.
#include "tests/shared/recording_stream.h"

#include <algorithm>
#include <cstring>

#include "gtest/gtest.h"

namespace doubles {
namespace {

// The fields that differ from those of a fresh error slot.
std::string useOf(const NiduException& slot) {
  std::string use;
  if (slot.textA[0] != '\0' || slot.textB[0] != '\0' || slot.textC[0] != '\0') use += " text";
  if (slot.errorCode != 0) use += " error";
  if (slot.mode != 1) use += " mode";
  return use;
}

}  // namespace

void RecordingStream::failAt(int n, const NiduException& failure) {
  trouble = Trouble::kFail;
  operationsUntilTrouble = n;
  failureToReport = failure;
}

void RecordingStream::throwAt(int n) {
  trouble = Trouble::kThrow;
  operationsUntilTrouble = n;
}

bool RecordingStream::fails(AutoNiduException* error, const std::string& operation) {
  done.push_back(operation);
  const std::string use = useOf(error->record);
  if (!use.empty()) used.push_back(std::to_string(done.size()) + ":" + use);
  std::strcpy(error->record.textA, "dirt");
  error->record.mode = 99;

  if (trouble == Trouble::kNone || --operationsUntilTrouble != 0) return false;
  if (trouble == Trouble::kFail) error->record = failureToReport;
  if (trouble == Trouble::kThrow) error->record.errorCode = -99;
  return true;
}

void RecordingStream::throwIfTold() const {
  if (trouble == Trouble::kThrow) throw StreamBroke{static_cast<int>(done.size())};
}

RecordingStream::Value RecordingStream::next(char type) {
  if (values.empty() || values.front().type != type) {
    ADD_FAILURE() << "read of a value that is not there: '" << type << "' of " << values.size() << " values";
    return {type, "", 0};
  }
  Value value = values.front();
  values.pop_front();
  return value;
}

void RecordingStream::writeString(AutoNiduException* error, const char* text) {
  if (fails(error, std::string("write string \"") + text + '"')) return throwIfTold();
  addString(text);
}

void RecordingStream::writeBool(AutoNiduException* error, bool value) {
  if (fails(error, value ? "write bool true" : "write bool false")) return throwIfTold();
  addBool(value ? 1 : 0);
}

void RecordingStream::writeInt32(AutoNiduException* error, std::int32_t value) {
  if (fails(error, "write int32 " + std::to_string(value))) return throwIfTold();
  addInt32(value);
}

void RecordingStream::readString(AutoNiduException* error, char* buffer, int maxLength) {
  if (fails(error, "read string " + std::to_string(maxLength))) {
    std::strcpy(buffer, "garbage");
    return throwIfTold();
  }
  const std::string text = next('s').text.substr(0, static_cast<std::size_t>(std::max(maxLength, 0)));
  std::memcpy(buffer, text.c_str(), text.size() + 1);
}

char RecordingStream::readBool(AutoNiduException* error) {
  if (fails(error, "read bool")) {
    throwIfTold();
    return 1;
  }
  return static_cast<char>(next('b').number);
}

std::int32_t RecordingStream::readInt32(AutoNiduException* error) {
  if (fails(error, "read int32")) {
    throwIfTold();
    return 0x5A5A5A5A;
  }
  return next('i').number;
}

}  // namespace doubles
