// SPDX-License-Identifier: MIT
// Sizes of data whose counts come from a plug-in, computed without overflow.
#pragma once

#include <cstdint>
#include <limits>

/// `fixed` + `count` x `each`, in bytes. Throws the int -1 where that is negative or more than an int holds.
inline int sizeOrFail(std::int64_t fixed, std::int32_t count, std::int64_t each) {
  std::int64_t size = 0;
  if (__builtin_mul_overflow(std::int64_t{count}, each, &size)) throw -1;
  if (__builtin_add_overflow(size, fixed, &size)) throw -1;
  if (size < 0 || size > std::numeric_limits<int>::max()) throw -1;
  return static_cast<int>(size);
}
