// SPDX-License-Identifier: MIT
// The bundles that are refused by name.
#pragma once

#include <string>

/// True when the bundle's file name is on the list; the case of letters does not matter. `matched` receives
/// the same value. The integer is ignored.
/// On purpose: a path without a slash, or with a slash at its end, has no file name and is never refused.
bool IsBlackListed(const std::string& path, int, bool& matched);

/// Compares two texts and ignores the case of letters. 0 when they are equal, else the difference of the
/// first two characters that differ, as a signed 8-bit number.
int my_stricmp(const char* a, const char* b);

/// The part of the path behind its last slash; empty without a slash, or with one at the end.
std::string bundleFileName(const std::string& path);
