// Byte order.
#pragma once

namespace Endian {

/// Reverses the order of the `n` bytes at `p`, in place. An `n` of 0 or 1 changes nothing.
void Swap(void* p, int n);

}  // namespace Endian
