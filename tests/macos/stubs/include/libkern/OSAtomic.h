// SPDX-License-Identifier: MIT
// The atomic addition of macOS, declared from general knowledge; old, unless the including source says that
// it knows.
#pragma once

#include <stdint.h>

#ifndef OSATOMIC_DEPRECATED
#define OSATOMIC_DEPRECATED 1
#endif

#if OSATOMIC_DEPRECATED
#define OSATOMIC_IS_OLD __attribute__((deprecated("use an atomic of the language")))
#else
#define OSATOMIC_IS_OLD
#endif

#ifdef __cplusplus
extern "C" {
#endif

OSATOMIC_IS_OLD int32_t OSAtomicAdd32Barrier(int32_t amount, volatile int32_t* value);

#ifdef __cplusplus
}
#endif
