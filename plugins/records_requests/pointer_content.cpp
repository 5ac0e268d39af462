// SPDX-License-Identifier: MIT
// What a pointer from the host points to, as text that is the same in every run.
#include "plugins/records_requests/pointer_content.h"

#include <algorithm>
#include <cstddef>
#include <cstdio>

#include "vst2/effect_opcodes.h"
#include "vst2/properties.h"
#include "vst2/speakers.h"

namespace sample_plugins {
namespace {

std::string hex(const void* data, std::size_t size) {
  static const char* const kDigits = "0123456789abcdef";
  std::string text;
  const auto* bytes = static_cast<const unsigned char*>(data);
  std::for_each(bytes, bytes + size, [&text](unsigned byte) {
    text += kDigits[byte / 16];
    text += kDigits[byte % 16];
  });
  return text;
}

/// "zero" if all bytes are zero, otherwise the bytes.
std::string zeroOrHex(const void* data, std::size_t size) {
  const auto* bytes = static_cast<const unsigned char*>(data);
  return std::all_of(bytes, bytes + size, [](unsigned byte) { return byte == 0; }) ? "zero" : hex(data, size);
}

std::string arrangement(const void* data) {
  const auto* channels = static_cast<const VstSpeakerArrangement*>(data);
  std::string text = "arrangement " + std::to_string(channels->type) + ":";
  const VstSpeakerProperties* speakers = channels->speakers;
  for (VstInt32 i = 0; i < channels->numChannels; ++i) text += ' ' + std::to_string(speakers[i].type);
  return text;
}

}  // namespace

std::string numberText(float number) {
  char text[32];
  std::snprintf(text, sizeof text, "%.9g", static_cast<double>(number));
  return text;
}

std::string describePointer(VstInt32 opcode, VstIntPtr value, const void* ptr) {
  if (ptr == nullptr) return "null";
  switch (opcode) {
    case effSetProgramName:
    case effString2Parameter:
    case effCanDo:
      return std::string("text \"") + static_cast<const char*>(ptr) + '"';
    case effSetChunk:
      return "chunk " + hex(ptr, static_cast<std::size_t>(value));
    case effGetProgramName:
    case effGetParamLabel:
    case effGetParamDisplay:
    case effGetParamName:
    case effGetProgramNameIndexed:
    case effGetEffectName:
    case effGetVendorString:
    case effGetProductString:
    case effShellGetNextPlugin:
      return "buffer " + zeroOrHex(ptr, 64);
    case effGetInputProperties:
    case effGetOutputProperties:
      return "pin " + zeroOrHex(ptr, sizeof(VstPinProperties));
    case effGetParameterProperties:
      return "properties " + zeroOrHex(ptr, sizeof(VstParameterProperties));
    case effGetChunk:
      return "place";
    case effSetSpeakerArrangement:
    case effGetSpeakerArrangement:
      return arrangement(ptr);
    default:
      return "pointer";
  }
}

std::string describeValue(VstInt32 opcode, VstIntPtr value) {
  const bool isPointer = opcode == effSetSpeakerArrangement || opcode == effGetSpeakerArrangement;
  if (isPointer && value != 0) return arrangement(reinterpret_cast<const void*>(value));
  return std::to_string(value);
}

}  // namespace sample_plugins
