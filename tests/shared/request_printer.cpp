// SPDX-License-Identifier: MIT
// How requests print in the messages of failing tests.
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ostream>
#include <string>

#include "flight_recorder/opcode_names.h"
#include "tests/shared/request.h"

namespace doubles {
namespace {

/// "opcode N" for a number without a name.
std::string opcodeName(VstInt32 opcode) {
  const char* const name = effectOpcodeName(opcode);
  return name != nullptr ? name : "opcode " + std::to_string(opcode);
}

bool sameBits(float a, float b) { return std::memcmp(&a, &b, sizeof a) == 0; }

std::string readable(const void* address) {
  char digits[32];
  std::snprintf(digits, sizeof digits, "address %p", address);
  return digits;
}

// The shorter of two forms that reads back as the same number.
std::string readable(float number) {
  char digits[32];
  std::snprintf(digits, sizeof digits, "%g", static_cast<double>(number));
  if (!sameBits(std::strtof(digits, nullptr), number)) {
    std::snprintf(digits, sizeof digits, "%.9g", static_cast<double>(number));
  }
  return digits;
}

std::string readable(const Pointee& pointee) {
  switch (pointee.kind) {
    case Pointee::Kind::kNull:
      return "";
    case Pointee::Kind::kText:
      return '"' + pointee.content + '"';
    case Pointee::Kind::kBytes: {
      std::string hex = std::to_string(pointee.content.size()) + " bytes";
      for (const char byte : pointee.content) {
        char digits[4];
        std::snprintf(digits, sizeof digits, " %02x",
                      static_cast<unsigned>(static_cast<unsigned char>(byte)));
        hex += digits;
      }
      return hex;
    }
    case Pointee::Kind::kRoom:
      if (pointee.zeroBytes == pointee.roomSize) return std::to_string(pointee.roomSize) + " cleared bytes";
      return std::to_string(pointee.roomSize) + " bytes of which " + std::to_string(pointee.zeroBytes) +
             " are zero";
    case Pointee::Kind::kAddress:
      return readable(pointee.address);
  }
  return "";
}

// The value of a request about speaker arrangements is the address of one.
std::string readableValue(const Request& request) {
  const bool isAddress = request.pointee.kind == Pointee::Kind::kAddress;
  return isAddress ? readable(reinterpret_cast<const void*>(request.value)) : std::to_string(request.value);
}

}  // namespace

void PrintTo(const Request& request, std::ostream* stream) {
  if (request.kind == Request::Kind::kGetParameter) {
    *stream << "getParameter(" << request.index << ")";
    return;
  }
  if (request.kind == Request::Kind::kSetParameter) {
    *stream << "setParameter(" << request.index << ", " << readable(request.opt) << ")";
    return;
  }
  std::string arguments;
  const auto add = [&arguments](const std::string& argument) {
    if (!arguments.empty() && !argument.empty()) arguments += ", ";
    arguments += argument;
  };
  if (request.index != 0) add("index " + std::to_string(request.index));
  if (request.value != 0) add("value " + readableValue(request));
  add(readable(request.pointee));
  if (!sameBits(request.opt, 0.0f)) add("opt " + readable(request.opt));
  *stream << opcodeName(request.opcode) << "(" << arguments << ")";
}

}  // namespace doubles
