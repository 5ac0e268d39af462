// SPDX-License-Identifier: MIT
#include "tests/scanner/module_bytes.h"

namespace {

/// Numbers and texts one after the other, in one byte order.
class Bytes {
 public:
  explicit Bytes(bool isBigEndian_) : isBigEndian(isBigEndian_) {}

  Bytes& number(std::uint64_t value, unsigned size) {
    for (unsigned i = 0; i < size; ++i) {
      const unsigned shift = 8 * (isBigEndian ? size - 1 - i : i);
      content += static_cast<char>(shift < 64 ? value >> shift & 0xFF : 0);
    }
    return *this;
  }
  Bytes& u8(std::uint64_t value) { return number(value, 1); }
  Bytes& u16(std::uint64_t value) { return number(value, 2); }
  Bytes& u32(std::uint64_t value) { return number(value, 4); }
  Bytes& text(const std::string& bytes) {
    content += bytes;
    return *this;
  }
  Bytes& fillTo(std::size_t size) {
    content.resize(size, '\0');
    return *this;
  }
  [[nodiscard]] std::size_t size() const { return content.size(); }

  std::string content = {};

 private:
  bool isBigEndian;
};

std::uint32_t olderHash(const std::string& name) {
  std::uint32_t hash = 0;
  for (const char c : name) {
    hash = (hash << 4) + static_cast<unsigned char>(c);
    const std::uint32_t high = hash & 0xF0000000;
    hash = (hash ^ (high >> 24)) & ~high;
  }
  return hash;
}

std::uint32_t gnuHash(const std::string& name) {
  std::uint32_t hash = 5381;
  for (const char c : name) hash = hash * 33 + static_cast<unsigned char>(c);
  return hash;
}

}  // namespace

std::string elfBytes(const ElfForm& form) {
  const unsigned word = form.is64Bit ? 8 : 4;
  const std::size_t headerSize = form.is64Bit ? 64 : 52;
  const std::size_t segmentSize = form.is64Bit ? 56 : 32;
  const unsigned segments = form.hasInterpreter ? 3 : 2;
  // Addresses are not offsets: the image begins at this one.
  constexpr std::uint64_t kBase = 0x10000;
  const std::size_t dynamic = headerSize + segments * segmentSize;
  const std::size_t dynamicSize = 4 * 2 * word;
  const std::size_t symbols = dynamic + dynamicSize;
  const std::size_t names = symbols + 2 * (form.is64Bit ? 24 : 16);
  const std::size_t hash = (names + 1 + form.symbol.size() + 1 + 7) / 8 * 8;
  const std::size_t end = hash + (form.hasGnuHash ? 16 + word + 4 + 4 : 8 + 12 + 8);

  Bytes file(form.isBigEndian);
  file.text(
          "\x7F"
          "ELF")
      .u8(form.is64Bit ? 2 : 1)
      .u8(form.isBigEndian ? 2 : 1)
      .u8(1)
      .fillTo(16);
  file.u16(form.fileType).u16(form.machine).u32(1).number(0, word).number(headerSize, word).number(0, word);
  file.u32(0).u16(headerSize).u16(segmentSize).u16(segments).u16(0).u16(0).u16(0);

  const auto segment = [&](std::uint32_t type, std::uint64_t offset, std::uint64_t size) {
    file.u32(type);
    if (form.is64Bit) file.u32(5);
    for (const std::uint64_t value : {offset, kBase + offset, kBase + offset, size, size})
      file.number(value, word);
    if (!form.is64Bit) file.u32(5);
    file.number(4096, word);
  };
  segment(1, 0, end);
  segment(2, dynamic, dynamicSize);
  if (form.hasInterpreter) segment(3, names, 1);

  file.number(5, word).number(kBase + names, word);
  file.number(6, word).number(kBase + symbols, word);
  file.number(form.hasGnuHash ? 0x6ffffef5 : 4, word).number(kBase + hash, word);
  file.number(0, 2 * word);

  file.fillTo(names - (form.is64Bit ? 24 : 16));
  const unsigned info = 1 << 4 | form.symbolType;
  const unsigned section = form.isDefined ? 1 : 0;
  file.u32(1);
  if (form.is64Bit) {
    file.u8(info).u8(0).u16(section).number(kBase, 8).number(0, 8);
  } else {
    file.u32(kBase).u32(0).u8(info).u8(0).u16(section);
  }
  file.u8(0).text(form.symbol).u8(0).fillTo(hash);

  if (form.hasGnuHash) {
    file.u32(1).u32(1).u32(1).u32(6).number(~std::uint64_t{0}, word).u32(1).u32(gnuHash(form.symbol) | 1);
  } else {
    file.u32(3).u32(2);
    for (unsigned bucket = 0; bucket < 3; ++bucket) file.u32(olderHash(form.symbol) % 3 == bucket ? 1 : 0);
    file.u32(0).u32(0);
  }
  return file.content;
}

std::string machBytes(const MachForm& form) {
  const std::size_t headerSize = form.is64Bit ? 32 : 28;
  const std::size_t symbols = headerSize + 24;
  const std::size_t names = symbols + (form.is64Bit ? 16 : 12);
  Bytes file(form.isBigEndian);
  file.u32(form.is64Bit ? 0xFEEDFACF : 0xFEEDFACE).u32(form.processor).u32(3).u32(form.fileType);
  file.u32(1).u32(24).u32(0).fillTo(headerSize);
  file.u32(2).u32(24).u32(symbols).u32(1).u32(names).u32(2 + form.symbol.size());
  file.u32(1).u8(form.symbolFlags).u8(1).u16(0).fillTo(names);
  return file.u8(0).text(form.symbol).u8(0).content;
}

std::string fatMachBytes(const std::vector<std::string>& images, bool is64Bit) {
  Bytes file(true);
  file.u32(is64Bit ? 0xCAFEBABF : 0xCAFEBABE).u32(images.size());
  std::size_t offset = 4096;
  for (const std::string& image : images) {
    file.u32(0).u32(0).number(offset, is64Bit ? 8 : 4).number(image.size(), is64Bit ? 8 : 4).u32(12);
    if (is64Bit) file.u32(0);
    offset += 4096;
  }
  offset = 4096;
  for (const std::string& image : images) {
    file.fillTo(offset).text(image);
    offset += 4096;
  }
  return file.content;
}

std::string peBytes(const PeForm& form) {
  constexpr std::size_t kHeader = 64;
  const std::size_t optionalSize = (form.is64Bit ? 112 : 96) + 8;
  const std::size_t section = kHeader + 24 + optionalSize;
  const std::size_t raw = section + 40;
  // The section is loaded elsewhere than it lies in the file.
  constexpr std::size_t kAddress = 0x2000;
  Bytes file(false);
  file.text("MZ").fillTo(0x3C).u32(kHeader).fillTo(kHeader);
  file.u32(0x00004550).u16(form.machine).u16(1).u32(0).u32(0).u32(0).u16(optionalSize);
  file.u16(form.isLibrary ? 0x2022 : 0x0022);
  file.u16(form.is64Bit ? 0x20B : 0x10B).fillTo(section - 8).u32(kAddress).u32(40);
  file.text(".edata").fillTo(section + 8).u32(256).u32(kAddress).u32(256).u32(raw).fillTo(raw);
  file.fillTo(raw + 24).u32(1).u32(kAddress + 40).u32(kAddress + 40).u32(kAddress + 40);
  file.u32(kAddress + 44).text(form.symbol).u8(0);
  return file.content;
}
