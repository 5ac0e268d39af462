// SPDX-License-Identifier: MIT
// How requests are made from a call, made as expectations, and compared.
#include "tests/shared/request.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace doubles {
namespace {

// The host's own buffer sizes, and the sizes of the interface's records.
std::size_t roomSizeOf(VstInt32 opcode) {
  switch (opcode) {
    case effGetProgramName:
    case effGetParamLabel:
    case effGetParamDisplay:
    case effGetProgramNameIndexed:
      return 256;
    case effGetParamName:
      return 500;
    case effGetEffectName:
    case effGetVendorString:
    case effGetProductString:
    case effShellGetNextPlugin:
      return 114;
    case effGetInputProperties:
    case effGetOutputProperties:
      return 128;
    case effGetParameterProperties:
      return 152;
    case effGetChunk:
      return sizeof(void*);
    default:
      return 0;
  }
}

bool bringsText(VstInt32 opcode) {
  return opcode == effSetProgramName || opcode == effString2Parameter || opcode == effCanDo;
}

Pointee text(const std::string& content) { return {Pointee::Kind::kText, content}; }
Pointee bytes(const std::string& content) { return {Pointee::Kind::kBytes, content}; }
Pointee room(std::size_t size, std::size_t zeroBytes) { return {Pointee::Kind::kRoom, "", size, zeroBytes}; }
Pointee address(const void* ptr) { return {Pointee::Kind::kAddress, "", 0, 0, const_cast<void*>(ptr)}; }

Pointee readPointee(VstInt32 opcode, VstIntPtr value, void* ptr) {
  if (ptr == nullptr) return {};
  const char* const start = static_cast<const char*>(ptr);
  if (bringsText(opcode)) return text(start);
  if (opcode == effSetChunk)
    return bytes(std::string(start, value > 0 ? static_cast<std::size_t>(value) : 0));
  const std::size_t size = roomSizeOf(opcode);
  if (size == 0) return address(ptr);
  return room(size, static_cast<std::size_t>(std::count(start, start + size, '\0')));
}

bool sameBits(float a, float b) { return std::memcmp(&a, &b, sizeof a) == 0; }

Request withPointee(VstEffectOpcode opcode, VstInt32 index, VstIntPtr value, Pointee pointee) {
  return {Request::Kind::kDispatch, opcode, index, value, std::move(pointee)};
}

}  // namespace

bool Pointee::operator==(const Pointee& other) const {
  return kind == other.kind && content == other.content && roomSize == other.roomSize &&
         zeroBytes == other.zeroBytes && (kind != Kind::kAddress || address == other.address);
}

bool Request::operator==(const Request& other) const {
  return kind == other.kind && opcode == other.opcode && index == other.index && value == other.value &&
         pointee == other.pointee && sameBits(opt, other.opt);
}

Request Request::withZeroBytes(std::size_t zeroBytes) const {
  Request changed = *this;
  changed.pointee.zeroBytes = zeroBytes;
  return changed;
}

Request receivedRequest(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) {
  Pointee pointee = readPointee(opcode, value, ptr);
  pointee.address = ptr;
  return {Request::Kind::kDispatch, opcode, index, value, std::move(pointee), opt};
}

Request request(VstEffectOpcode opcode, VstInt32 index, VstIntPtr value, float opt) {
  const std::size_t size = roomSizeOf(opcode);
  return {Request::Kind::kDispatch, opcode, index, value, size == 0 ? Pointee{} : room(size, size), opt};
}

Request setProgram(VstIntPtr program) { return request(effSetProgram, 0, program); }
Request setProgramName(const std::string& name) { return withPointee(effSetProgramName, 0, 0, text(name)); }
Request programNameIndexed(VstInt32 program) { return request(effGetProgramNameIndexed, program, -1); }
Request connectInput(VstInt32 pin, VstIntPtr on) { return request(effConnectInput, pin, on); }
Request canDo(const std::string& capability) { return withPointee(effCanDo, 0, 0, text(capability)); }
Request canParameterBeSetFromText(VstInt32 parameter) { return request(effString2Parameter, parameter); }
Request setParameterFromText(VstInt32 parameter, const std::string& value) {
  return withPointee(effString2Parameter, parameter, 0, text(value));
}
Request getChunk(VstInt32 index) { return request(effGetChunk, index); }
Request setChunk(VstInt32 index, const std::string& content) {
  return withPointee(effSetChunk, index, static_cast<VstIntPtr>(content.size()), bytes(content));
}
Request speakerArrangement(const void* input, const void* output) {
  return withPointee(effGetSpeakerArrangement, 0, reinterpret_cast<VstIntPtr>(input),
                     output == nullptr ? Pointee{} : address(output));
}

Request getParameterOf(VstInt32 parameter) { return {Request::Kind::kGetParameter, 0, parameter}; }
Request setParameterTo(VstInt32 parameter, float value) {
  return {Request::Kind::kSetParameter, 0, parameter, 0, {}, value};
}

}  // namespace doubles
