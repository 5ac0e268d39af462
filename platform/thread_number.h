// SPDX-License-Identifier: MIT
// The number under which the system knows a thread.
#pragma once

#include <cstdint>

/// The calling thread's number, as tools of the system show it. On Linux the first thread has the number of
/// its process. Safe in a signal handler.
std::uint32_t currentThreadNumber();
