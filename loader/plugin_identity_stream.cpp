// SPDX-License-Identifier: MIT
// The stream form of the identity records.
#include <cstdint>
#include <string>

#include "loader/plugin_identity.h"
#include "loader/stream.h"

namespace {

constexpr int kMaxTextLength = 499;

void put(INiduStream* stream, const std::string& text) {
  AutoNiduException error;
  stream->writeString(&error, text.c_str());
  error.doCheck();
}

void put(INiduStream* stream, bool value) {
  AutoNiduException error;
  stream->writeBool(&error, value);
  error.doCheck();
}

void put(INiduStream* stream, std::int32_t value) {
  AutoNiduException error;
  stream->writeInt32(&error, value);
  error.doCheck();
}

void get(INiduStream* stream, char (&buffer)[kMaxTextLength + 1], std::string& text) {
  AutoNiduException error;
  stream->readString(&error, buffer, kMaxTextLength);
  error.doCheck();
  text = buffer;
}

void get(INiduStream* stream, bool& value) {
  AutoNiduException error;
  const char answer = stream->readBool(&error);
  error.doCheck();
  value = answer != 0;
}

std::int32_t getInt32(INiduStream* stream) {
  AutoNiduException error;
  const std::int32_t answer = stream->readInt32(&error);
  error.doCheck();
  return answer;
}

}  // namespace

void VST_loadID::putTo(INiduStream* stream) const {
  put(stream, hasChildID);
  put(stream, childID);
}

void VST_loadID::getFrom(INiduStream* stream) {
  get(stream, hasChildID);
  childID = getInt32(stream);
}

void VST_ChildSpec::putTo(INiduStream* stream) const {
  VST_loadID::putTo(stream);
  put(stream, childName);
}

void VST_ChildSpec::getFrom(INiduStream* stream) {
  VST_loadID::getFrom(stream);
  char buffer[kMaxTextLength + 1] = {};
  get(stream, buffer, childName);
}

void VST_DLL_Info::putTo(INiduStream* stream) const {
  put(stream, path);
  put(stream, effectName);
  put(stream, static_cast<std::int32_t>(static_cast<std::uint64_t>(dllTag) & 0xFFFFFFFFu));
}

void VST_DLL_Info::getFrom(INiduStream* stream) {
  char buffer[kMaxTextLength + 1] = {};
  get(stream, buffer, path);
  get(stream, buffer, effectName);
  dllTag = getInt32(stream);
}

void VST_Class_Spec::putTo(INiduStream* stream) const {
  VST_DLL_Info::putTo(stream);
  child.putTo(stream);
}

void VST_Class_Spec::getFrom(INiduStream* stream, int /*version*/) {
  VST_DLL_Info::getFrom(stream);
  child.getFrom(stream);
}
