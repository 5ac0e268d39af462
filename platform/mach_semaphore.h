// SPDX-License-Identifier: MIT
// Counting semaphores of the Mach kernel.
//
// On macOS these are the system's own; elsewhere this header declares the few that the program uses and
// platform/linux/mach_semaphore.cpp supplies them.
//
// Order:     a token given while threads wait goes to the one that has waited longest, and to no other: the
//            thread that signals cannot take it back.
// Ownership: whoever creates a semaphore destroys it. No call may begin to use it after that.
// Threads:   any. A signal happens before the return of the wait that receives its token.
#pragma once

#if defined(__APPLE__)

#include <mach/mach.h>
#include <mach/semaphore.h>
#include <mach/sync_policy.h>
#include <mach/task.h>

#else

using kern_return_t = int;
using task_t = unsigned int;
using semaphore_t = struct MachSemaphore*;  // null: no semaphore

constexpr kern_return_t KERN_SUCCESS = 0;
constexpr kern_return_t KERN_INVALID_ARGUMENT = 4;
constexpr kern_return_t KERN_RESOURCE_SHORTAGE = 6;
constexpr kern_return_t KERN_ABORTED = 14;
constexpr kern_return_t KERN_TERMINATED = 37;

constexpr int SYNC_POLICY_FIFO = 0;

extern "C" {

/// The process itself, as the owner of semaphores.
task_t mach_task_self();

/// Creates a semaphore that holds `value` tokens (0 or more). KERN_INVALID_ARGUMENT for another task than
/// mach_task_self(), another policy than SYNC_POLICY_FIFO or a negative value; KERN_RESOURCE_SHORTAGE when
/// memory runs out. Every failure sets *semaphore to null.
kern_return_t semaphore_create(task_t task, semaphore_t* semaphore, int policy, int value);

/// Destroys a semaphore. Threads that wait on it wake up with KERN_TERMINATED. KERN_INVALID_ARGUMENT for a
/// null semaphore or another task.
kern_return_t semaphore_destroy(task_t task, semaphore_t semaphore);

/// Takes one token, sleeping until there is one. KERN_ABORTED when a signal handler installed without
/// SA_RESTART ran meanwhile: no token was taken and the place in the queue is lost. KERN_TERMINATED when the
/// semaphore was destroyed meanwhile, KERN_INVALID_ARGUMENT for a null semaphore.
kern_return_t semaphore_wait(semaphore_t semaphore);

/// Gives one token: to the thread that has waited longest, or to a later wait. Does not wait for other
/// threads beyond a short lock. KERN_INVALID_ARGUMENT for a null semaphore.
kern_return_t semaphore_signal(semaphore_t semaphore);

}  // extern "C"

#endif
