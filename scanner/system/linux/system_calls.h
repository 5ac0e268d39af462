// SPDX-License-Identifier: MIT
// Names of the system calls that a process may sleep in.
#pragma once

#include <string>

namespace scanner::system {

/// The name for what /proc/PID/task/TID/syscall says: "" for "running" and what cannot be read,
/// "system call N" for one without a name here.
std::string systemCallName(const std::string& line, bool is32Bit);

/// Whether the program that a process runs is a 32-bit one, which numbers its system calls differently.
bool is32Bit(int process);

}  // namespace scanner::system
