// SPDX-License-Identifier: MIT
// The bytes of a flight record, by the offsets of docs/FLIGHT_RECORD.md.
#pragma once

#include <cstdint>
#include <string>

class RecordBytes {
 public:
  /// All zeros: what a file holds before a run has begun.
  RecordBytes() : bytes(4096, '\0') {}
  /// As they are now.
  static RecordBytes ofFile(const std::string& path);

  /// A record that makes sense: process 77, step 5 "testing setting states", effSetBypass (44) value 1 under
  /// way as request 335.
  static RecordBytes ofARun();

  [[nodiscard]] std::uint32_t number32(std::size_t offset) const;
  [[nodiscard]] std::uint64_t number64(std::size_t offset) const;
  /// Up to the first zero byte.
  [[nodiscard]] std::string text(std::size_t offset) const { return bytes.c_str() + offset; }

  RecordBytes& set32(std::size_t offset, std::uint32_t number);
  RecordBytes& set64(std::size_t offset, std::uint64_t number);
  RecordBytes& setText(std::size_t offset, const std::string& text);

  std::string bytes;
};
