// SPDX-License-Identifier: MIT
// The file that a flight record is kept in.
#pragma once

#include <string>

#include "flight_recorder/flight_record.h"

/// Keeps the flight record of this process in a file, which is made if there is none. Stores are in the file at
/// once, and stay there whatever becomes of the process; a process that this one forks stores nothing.
/// False where that fails, with the reason in `whyNot`: the file cannot be opened or written, is no regular
/// file, or has a size other than 0 or 4096 bytes, and so is something else that must not be overwritten.
bool keepRecordIn(const std::string& path, std::string& whyNot);
