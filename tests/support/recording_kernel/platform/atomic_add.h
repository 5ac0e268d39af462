// SPDX-License-Identifier: MIT
// Stands in for the program's header of this name, so that the test of the lock sees each addition.
#pragma once

#include <cstdint>

/// Defined in lock_calls_test.cpp.
std::int32_t OSAtomicAdd32Barrier(std::int32_t amount, volatile std::int32_t* value);
