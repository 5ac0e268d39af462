// SPDX-License-Identifier: MIT
// Preset and bank data as a test writes it down: byte by byte, from texts and numbers in reading order. Uses
// none of the program's own offsets and swaps.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace preset_bytes {

/// The bytes of hex digits; blanks between them do not count.
std::string hex(const std::string& digits);

/// Bytes as hex digits in groups of four bytes. Tests compare these, so that a failure is readable.
std::string inHex(const std::string& bytes);

/// Four bytes, the most significant first.
std::string word(std::int64_t number);

/// The first 28 bytes of every form, as the plug-in 'Demo' of version 1 writes them.
std::string header(const std::string& formMagic, std::int64_t count, std::int64_t formatVersion = 1);

/// A program with parameter values ('FxCk'), the values given as their 32 bits.
std::string program(const std::string& name, const std::vector<std::uint32_t>& values);

/// A bank of such programs ('FxBk').
std::string bank(const std::vector<std::string>& programs);

/// A program ('FPCh') or a bank ('FBCh') with a chunk. `claimedSize` is the size field, if it is not the size
/// of the chunk.
std::string programChunk(const std::string& name, const std::string& chunk);
std::string programChunk(const std::string& name, const std::string& chunk, std::int64_t claimedSize);
std::string bankChunk(const std::string& chunk);
std::string bankChunk(const std::string& chunk, std::int64_t claimedSize);

/// The same data with other bytes from `at` on.
std::string with(std::string data, std::size_t at, const std::string& bytes);

}  // namespace preset_bytes
