// SPDX-License-Identifier: MIT
// What a process may take, laid down before it loads anything.
#pragma once

#include <string>

#include "worker/command_line.h"

/// Takes the limits of the options for this process and all that it starts. They cannot be raised again; one
/// that is lower already stays. Also ends the process with its parent, where that is wanted. False for what
/// the system refuses, with a sentence about it in `whyNot`.
bool limitThisProcess(const WorkerOptions& options, std::string& whyNot);
