// SPDX-License-Identifier: MIT
// The order in which threads that wait on a Mach semaphore are served.
#pragma once

#define SYNC_POLICY_FIFO 0x0
