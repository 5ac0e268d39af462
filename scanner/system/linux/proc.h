// SPDX-License-Identifier: MIT
// Reading /proc. Everything there may be gone the next moment: what cannot be read is empty.
#pragma once

#include <string>
#include <vector>

#include "scanner/system/system.h"

namespace scanner::system {

/// A file below /proc, such as "123/stat".
std::string readProc(const std::string& name);

/// The children of a process, by all of its threads.
std::vector<int> childrenOf(int process);

/// The descendants of a process, parents before their children, without itself.
std::vector<int> descendantsOf(int process);

/// The numbers of the threads of a process.
std::vector<int> threadsOf(int process);

/// The fields of a stat file that follow the name in brackets; [0] is the state.
std::vector<std::string> statFields(const std::string& stat);

/// The mark that a process carries; 0 without one.
Mark markOf(int process);

/// Kills the process if it carries one of the marks and has not ended yet. Its number may be used again meanwhile:
/// nobody else is killed then. True when it was killed.
bool killIfMarked(int process, const Marks& marks);

/// The descriptors that a process has open.
std::vector<int> descriptorsOf(int process);

/// Every process there is.
std::vector<int> allProcesses();

}  // namespace scanner::system
