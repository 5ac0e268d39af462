// SPDX-License-Identifier: MIT
// Preset and bank data, written by hand.
#include "tests/host/preset_bytes.h"

#include <cstdio>

namespace preset_bytes {
namespace {

std::string name28(std::string name) {
  name.resize(28);
  return name;
}

}  // namespace

std::string hex(const std::string& digits) {
  std::string bytes;
  std::string pair;
  for (const char digit : digits) {
    if (digit == ' ') continue;
    pair += digit;
    if (pair.size() < 2) continue;
    bytes += static_cast<char>(std::stoi(pair, nullptr, 16));
    pair.clear();
  }
  return bytes;
}

std::string inHex(const std::string& bytes) {
  std::string text;
  for (std::size_t i = 0; i < bytes.size(); ++i) {
    char digits[3];
    std::snprintf(digits, sizeof digits, "%02X", static_cast<unsigned>(static_cast<unsigned char>(bytes[i])));
    if (i > 0 && i % 4 == 0) text += i % 32 == 0 ? '\n' : ' ';
    text += digits;
  }
  return text;
}

std::string word(std::int64_t number) {
  std::string bytes;
  for (int shift = 24; shift >= 0; shift -= 8) bytes += static_cast<char>((number >> shift) & 0xFF);
  return bytes;
}

std::string header(const std::string& formMagic, std::int64_t count, std::int64_t formatVersion) {
  return "CcnK" + word(0) + formMagic + word(formatVersion) + "Demo" + word(1) + word(count);
}

std::string program(const std::string& name, const std::vector<std::uint32_t>& values) {
  std::string data = header("FxCk", static_cast<std::int64_t>(values.size())) + name28(name);
  for (const std::uint32_t value : values) data += word(value);
  return data;
}

std::string bank(const std::vector<std::string>& programs) {
  std::string data = header("FxBk", static_cast<std::int64_t>(programs.size())) + std::string(128, '\0');
  for (const std::string& one : programs) data += one;
  return data;
}

std::string programChunk(const std::string& name, const std::string& chunk) {
  return programChunk(name, chunk, static_cast<std::int64_t>(chunk.size()));
}

std::string programChunk(const std::string& name, const std::string& chunk, std::int64_t claimedSize) {
  return header("FPCh", 1) + name28(name) + word(claimedSize) + chunk;
}

std::string bankChunk(const std::string& chunk) {
  return bankChunk(chunk, static_cast<std::int64_t>(chunk.size()));
}

std::string bankChunk(const std::string& chunk, std::int64_t claimedSize) {
  return header("FBCh", 1) + std::string(128, '\0') + word(claimedSize) + chunk;
}

std::string with(std::string data, std::size_t at, const std::string& bytes) {
  return data.replace(at, bytes.size(), bytes);
}

}  // namespace preset_bytes
