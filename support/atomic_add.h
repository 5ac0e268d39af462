// SPDX-License-Identifier: MIT
// The atomic addition for the counter of the lock.
#pragma once

#include <cstdint>

#include "platform/atomic_add.h"

/// Adds `amount` to *target in one step, with a full memory barrier. Returns the value before the addition.
/// An overflow wraps around.
inline std::int32_t AtomicAdd32Implementation(volatile std::int32_t* target, std::int32_t amount) {
  const std::int32_t after = OSAtomicAdd32Barrier(amount, target);
  return static_cast<std::int32_t>(static_cast<std::uint32_t>(after) - static_cast<std::uint32_t>(amount));
}
