// SPDX-License-Identifier: MIT
// Preset and bank data as a test writes it down: byte by byte, from texts and numbers in reading order.
//
// Nothing here uses the program's own offsets or swaps.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace preset_bytes {

/// The bytes of hex digits; blanks and line ends between them do not count.
std::string hex(const std::string& digits);

/// The same the other way round, in groups of four bytes: what tests compare, so that a failure can be read.
std::string inHex(const std::string& bytes);

/// Four bytes, the most significant first.
std::string word(std::int64_t number);

/// A name in its 28 bytes, the rest of them zero.
std::string name28(const std::string& name);

/// The first 28 bytes of every form, as the plug-in 'Demo' of version 1 writes them.
std::string header(const std::string& formMagic, std::int64_t count, std::int64_t formatVersion = 1,
                   const std::string& chunkMagic = "CcnK");

/// A program with parameter values ('FxCk'), the values given as their 32 bits.
std::string program(const std::string& name, const std::vector<std::uint32_t>& values);

/// A bank of such programs ('FxBk').
std::string bank(const std::vector<std::string>& programs);

/// A program ('FPCh') or a bank ('FBCh') with a chunk, which claims a size of its own if `claimedSize` is
/// given.
std::string programChunk(const std::string& name, const std::string& chunk);
std::string programChunk(const std::string& name, const std::string& chunk, std::int64_t claimedSize);
std::string bankChunk(const std::string& chunk);
std::string bankChunk(const std::string& chunk, std::int64_t claimedSize);

/// The same data with other bytes from `at` on.
std::string with(std::string data, std::size_t at, const std::string& bytes);

}  // namespace preset_bytes
