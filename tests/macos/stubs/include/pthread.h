// SPDX-License-Identifier: MIT
// What macOS adds to the threads of POSIX, as far as the program uses it.
#pragma once

#include <mach/mach.h>
#include_next <pthread.h>

#ifdef __cplusplus
extern "C" {
#endif

mach_port_t pthread_mach_thread_np(pthread_t thread);

#ifdef __cplusplus
}
#endif
