// SPDX-License-Identifier: MIT
// The atomic addition for the counter of a lock: the system's on macOS, elsewhere the function below.
#pragma once

#if defined(__APPLE__)

// The system marks its function as deprecated; it is the one that every macOS version has.
#define OSATOMIC_DEPRECATED 0
#include <libkern/OSAtomic.h>

#else

#include <cstdint>

/// Adds `amount` to *value in one step, with a full memory barrier, and returns the new value. An overflow
/// wraps around.
// NOLINTNEXTLINE(readability-non-const-parameter): the linter takes the builtin for a read
inline std::int32_t OSAtomicAdd32Barrier(std::int32_t amount, volatile std::int32_t* value) {
  return __atomic_add_fetch(value, amount, __ATOMIC_SEQ_CST);
}

#endif
