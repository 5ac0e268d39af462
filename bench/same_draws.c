// SPDX-License-Identifier: MIT
// Preloaded into programs whose runs are compared: the tool seeds its draws by the processor time that it has used, and
// with the same time in all runs they draw the same tests.
#include <time.h>

clock_t clock(void) { return 4242; }
