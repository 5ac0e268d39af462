// SPDX-License-Identifier: MIT
// Waiting on and signalling a semaphore of the Mach kernel.
#pragma once

#include <mach/mach.h>

typedef mach_port_t semaphore_t;

#ifdef __cplusplus
extern "C" {
#endif

kern_return_t semaphore_signal(semaphore_t semaphore);
kern_return_t semaphore_wait(semaphore_t semaphore);

#ifdef __cplusplus
}
#endif
