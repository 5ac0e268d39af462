// SPDX-License-Identifier: MIT
#include "platform/thread_number.h"

#include <pthread.h>

std::uint32_t currentThreadNumber() { return pthread_mach_thread_np(pthread_self()); }
