// SPDX-License-Identifier: MIT
// The end of a process together with the one that started it.
#pragma once

#include <sys/types.h>

/// From now on the system kills this process (SIGKILL) when the thread that started it ends. With `parent` 0
/// that is whoever is the parent now; with its number a parent that has ended meanwhile is noticed as well,
/// and this process ends here in the same way. False where this system cannot do it.
bool endWithParent(pid_t parent);
