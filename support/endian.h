// Byte order. In the header, so that the reversal of one field compiles to one instruction.
#pragma once

#include <algorithm>

namespace Endian {

/// Reverses the order of the `n` bytes at `p`, in place. An `n` of 0 or 1 changes nothing.
inline void Swap(void* p, int n) {
  auto* bytes = static_cast<unsigned char*>(p);
  if (n > 1) std::reverse(bytes, bytes + n);
}

}  // namespace Endian
