// SPDX-License-Identifier: MIT
// The bundles that are refused by name.
#pragma once

#include <string>

/// True when the bundle's file name is on the list, whatever the case of its letters; `matched` then is true
/// as well, else false. The integer is not looked at. On purpose: a path without a slash, or with one at its
/// end, has no file name and is never refused.
bool IsBlackListed(const std::string& path, int, bool& matched);

/// Compares without regard to case, as 8-bit characters: 0 when equal, else the first difference.
int my_stricmp(const char* a, const char* b);

/// What follows the last slash; empty when there is none, or nothing follows it.
std::string bundleFileName(const std::string& path);
