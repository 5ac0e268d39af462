// SPDX-License-Identifier: MIT
// Opens the results' database for those who only read it.
#pragma once

#include <memory>
#include <string>

#include "scanner/store/database.h"

namespace scanner {

/// Opens `file`, which must exist and must have the schema of this program, without changing it. Works on a copy
/// in a folder that cannot be written to, and while a scan writes. Throws DatabaseError and NotOurDatabase; an
/// older version of the schema is DatabaseError::Kind::kReadOnly.
std::unique_ptr<Database> openForReading(const std::string& file);

/// The same, but takes an older version up to this program's where the file can be written to.
std::unique_ptr<Database> openUpToDate(const std::string& file);

/// Whether there is such a file; with `mustHoldBytes` one that is not empty.
bool isThere(const std::string& path, bool mustHoldBytes);

/// What went wrong, to stand behind "FILE: ".
std::string reasonInWords(const DatabaseError& error);

}  // namespace scanner
