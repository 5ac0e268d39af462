// SPDX-License-Identifier: MIT
// What this program uses of the Mach kernel's services, declared from general knowledge: ports are numbers.
#pragma once

typedef int kern_return_t;
typedef unsigned int mach_port_t;

#define KERN_SUCCESS 0
#define KERN_ABORTED 14

#ifdef __cplusplus
extern "C" {
#endif

extern mach_port_t mach_task_self_;
#define mach_task_self() mach_task_self_

#ifdef __cplusplus
}
#endif

#include <mach/semaphore.h>
#include <mach/task.h>
