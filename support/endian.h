// SPDX-License-Identifier: MIT
// Byte order.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace Endian {

/// Reverses the order of the `n` bytes at `p`, in place. An `n` of 0 or 1 changes nothing.
inline void Swap(void* p, int n) {
  auto* bytes = static_cast<unsigned char*>(p);
  if (n == 4) {  // The size that every caller uses. Compilers make one instruction of this form.
    std::uint32_t word = 0;
    std::memcpy(&word, bytes, sizeof word);
    word = word << 24 | (word & 0xFF00) << 8 | (word >> 8 & 0xFF00) | word >> 24;
    std::memcpy(bytes, &word, sizeof word);
  } else if (n > 1) {
    std::reverse(bytes, bytes + n);
  }
}

}  // namespace Endian
