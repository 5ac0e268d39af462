// SPDX-License-Identifier: MIT
// The atomic addition that locks are counted with: macOS has one, elsewhere it is written here.
#pragma once

#if defined(__APPLE__)

// The system marks its function as old; it is still the one that every macOS has.
#define OSATOMIC_DEPRECATED 0
#include <libkern/OSAtomic.h>

#else

#include <cstdint>

/// Adds `amount` to *value in one step, with a full memory barrier, and returns the new value. An overflow
/// wraps around.
// NOLINTNEXTLINE(readability-non-const-parameter): the linter does not see that the builtin writes.
inline std::int32_t OSAtomicAdd32Barrier(std::int32_t amount, volatile std::int32_t* value) {
  return __atomic_add_fetch(value, amount, __ATOMIC_SEQ_CST);
}

#endif
