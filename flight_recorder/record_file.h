// SPDX-License-Identifier: MIT
// The file that a flight record is kept in.
#pragma once

#include <string>

#include "flight_recorder/flight_record.h"

/// Maps a flight record to a file, which is made if there is none and filled with zeros. Writes to the record
/// are in the file at once, and stay there whatever becomes of the process. The mapping lasts as long as the
/// process. Null where that fails, with the reason in `whyNot`: the file cannot be opened or written, is no
/// regular file, or has a size other than 0 or 4096 bytes, and so is something else that must not be
/// overwritten.
FlightRecord* mapRecordFile(const std::string& path, std::string& whyNot);

/// Lets this process write to the record from now on, and none that it forks.
void observeThisProcess(FlightRecord& record);
