// SPDX-License-Identifier: MIT
// Sizes of data whose counts come from a plug-in, computed without overflow.
#pragma once

#include <cstdint>
#include <limits>

/// `fixed` + `count` x `each`, in bytes. Throws the int -1 where that is more than a buffer can hold.
/// `count` is at least 0; `fixed` and `each` are below 2^32.
inline int sizeOrFail(std::int64_t fixed, std::int32_t count, std::int64_t each) {
  constexpr std::int64_t kMax = std::numeric_limits<int>::max();
  if (fixed > kMax || (count > 0 && each > (kMax - fixed) / count)) throw -1;
  return static_cast<int>(fixed + count * each);
}
