// SPDX-License-Identifier: MIT
#include "tests/flight_recorder/record_bytes.h"

#include <cstring>
#include <fstream>
#include <iterator>

RecordBytes RecordBytes::ofFile(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  RecordBytes record;
  record.bytes.assign(std::istreambuf_iterator<char>(file), {});
  record.bytes.resize(4096);
  return record;
}

RecordBytes RecordBytes::ofARun() {
  RecordBytes record;
  record.setText(0, "vstflrec").set32(8, 1).set32(12, 4096).set32(16, 77).set32(20, 8).set32(24, 3);
  record.set32(36, 5).set64(40, 1000).setText(320, "testing setting states");
  for (std::size_t i = 0; i < 5; ++i) record.set64(384 + 8 * i, 2000 + i);
  record.set64(64, 335).set32(72, 1).set32(76, 3).set32(80, 44).set64(88, 1);
  return record;
}

std::uint32_t RecordBytes::number32(std::size_t offset) const {
  std::uint32_t number = 0;
  std::memcpy(&number, bytes.data() + offset, sizeof number);
  return number;
}

std::uint64_t RecordBytes::number64(std::size_t offset) const {
  std::uint64_t number = 0;
  std::memcpy(&number, bytes.data() + offset, sizeof number);
  return number;
}

RecordBytes& RecordBytes::set32(std::size_t offset, std::uint32_t number) {
  std::memcpy(&bytes[offset], &number, sizeof number);
  return *this;
}

RecordBytes& RecordBytes::set64(std::size_t offset, std::uint64_t number) {
  std::memcpy(&bytes[offset], &number, sizeof number);
  return *this;
}

RecordBytes& RecordBytes::setText(std::size_t offset, const std::string& text) {
  bytes.replace(offset, text.size(), text);
  return *this;
}
