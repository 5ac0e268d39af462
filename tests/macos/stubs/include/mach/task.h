// SPDX-License-Identifier: MIT
// Semaphores as property of a task of the Mach kernel.
#pragma once

#include <mach/mach.h>
#include <mach/semaphore.h>

typedef mach_port_t task_t;

#ifdef __cplusplus
extern "C" {
#endif

kern_return_t semaphore_create(task_t task, semaphore_t* semaphore, int policy, int value);
kern_return_t semaphore_destroy(task_t task, semaphore_t semaphore);

#ifdef __cplusplus
}
#endif
