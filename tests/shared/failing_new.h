// SPDX-License-Identifier: MIT
// An operator new that fails once, when it is told to. For test programs of their own: it replaces the real
// one in the whole program.
//
// The nothrow form does not count: who asks in this way lives without. The lock does, while nobody waits for
// it.
//
// Threads: one.
#pragma once

namespace host_tests {

/// The next `count` allocations succeed, the one after them throws std::bad_alloc, and later ones succeed.
void failAfterAllocations(int count);

/// Lets all allocations succeed again. True when the one that was to fail has not come.
bool stopFailing();

}  // namespace host_tests
