// SPDX-License-Identifier: MIT
#include "platform/thread_number.h"

#include <sys/syscall.h>
#include <unistd.h>

std::uint32_t currentThreadNumber() {
  // Kept, since a plug-in may call its host for each frame. A forked process still sees the number of the
  // thread that forked it.
  static thread_local std::uint32_t number = 0;
  if (number == 0) number = static_cast<std::uint32_t>(syscall(SYS_gettid));
  return number;
}
