// SPDX-License-Identifier: MIT
// Neither the interrupted code's place nor its image is told here: finding an image takes locks of the loader
// that the interrupted code may hold. The system's own crash report has both.
#include "platform/fault_context.h"

std::uint64_t programCounterOf(const void*) { return 0; }

std::uint64_t faultAddressOf(const siginfo_t& info) {
  const bool isMemoryFault = info.si_signo == SIGSEGV || info.si_signo == SIGBUS;
  return isMemoryFault && info.si_code > 0 ? reinterpret_cast<std::uintptr_t>(info.si_addr) : 0;
}

bool findLoadedImage(std::uint64_t, LoadedImage&) { return false; }
