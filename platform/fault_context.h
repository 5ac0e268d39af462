// SPDX-License-Identifier: MIT
// What a signal handler can tell about the fault that it was called for. All of it is safe in a signal
// handler.
#pragma once

#include <csignal>
#include <cstdint>

/// The next instruction of the interrupted code, from the handler's third argument; 0 where this system or
/// processor is not known.
std::uint64_t programCounterOf(const void* context);

/// The address that the fault is about, for a signal that the system itself raised (a memory access, an
/// instruction); 0 for one that a process has sent.
std::uint64_t faultAddressOf(const siginfo_t& info);

/// An executable file in memory.
struct LoadedImage {
  std::uint64_t address;  ///< Where its first byte is: what to subtract from a program counter.
  char path[1024];        ///< A longer path is cut at the front.
};

/// The image that this address lies in; false where there is none, or it cannot be found out.
bool findLoadedImage(std::uint64_t address, LoadedImage& image);
