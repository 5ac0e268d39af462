// SPDX-License-Identifier: MIT
#include "platform/parent_death.h"

#include <csignal>

#include <sys/prctl.h>
#include <unistd.h>

bool endWithParent(pid_t parent) {
  const pid_t expected = parent == 0 ? getppid() : parent;
  if (prctl(PR_SET_PDEATHSIG, SIGKILL) != 0) return false;
  // A parent that ended before the request sends nothing any more.
  if (getppid() != expected) raise(SIGKILL);
  return true;
}
