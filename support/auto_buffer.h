// SPDX-License-Identifier: MIT
// An owned block of bytes, for preset, bank and chunk data and for saved parameter values.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdlib>

#include "support/exceptions.h"

/// Owns one block made with malloc and frees it. Not copied.
template <class Byte>
class AutoBuffer {
  static_assert(sizeof(Byte) == 1, "sizes are in bytes");

 public:
  AutoBuffer() = default;
  ~AutoBuffer() { std::free(block); }
  AutoBuffer(const AutoBuffer&) = delete;
  AutoBuffer& operator=(const AutoBuffer&) = delete;

  /// Allocates `sizeInBytes` bytes and stores their number in `sizeOut`. The caller owns the block and frees
  /// it with free(). Throws the int -1 when there is no memory, and for a negative size; `sizeOut` is then
  /// unchanged.
  static Byte* NewBuffer(int sizeInBytes, std::int32_t& sizeOut) {
    // NOLINTNEXTLINE(clang-analyzer-optin.portability.UnixAPI): a block of 0 bytes is allowed
    void* made = sizeInBytes < 0 ? nullptr : std::malloc(static_cast<std::size_t>(sizeInBytes));
    nidu_FailNULL(made);
    sizeOut = sizeInBytes;
    return static_cast<Byte*>(made);
  }

  /// Makes room for exactly `sizeInBytes` bytes, uninitialised.
  /// On purpose: the old contents are not copied. This makes room, it does not resize.
  /// Throws the int -1 when there is no memory; the old block is then still owned.
  void setSize(int sizeInBytes) {
    Byte* old = block;
    block = NewBuffer(sizeInBytes, sizeInUse);
    std::free(old);
  }

  /// In bytes, as last requested.
  [[nodiscard]] std::int32_t size() const { return sizeInUse; }
  /// The block; null before the first setSize(). Borrowed.
  [[nodiscard]] Byte* data() { return block; }
  [[nodiscard]] const Byte* data() const { return block; }

 private:
  std::int32_t sizeInUse = 0;
  Byte* block = nullptr;
};
