// SPDX-License-Identifier: MIT
// What a pointer from the host points to, as text that is the same in every run.
#pragma once

#include <string>

#include "vst2/basic_types.h"

namespace sample_plugins {

/// Nine significant digits, which identify a 32-bit float.
std::string numberText(float number);

/// What the pointer of a request points to, by opcode:
///   null                          no pointer
///   text "..."                    a text to read (4, 27, 51)
///   chunk HEX                     the bytes to load (24), as many as `value` says
///   buffer zero | buffer HEX      room for a text (5 to 8, 29, 45, 47, 48, 70): its first 64 bytes
///   pin zero | pin HEX            a pin's record (33, 34): 128 bytes
///   properties zero | ... HEX     a parameter's record (56): 152 bytes
///   place                         where the plug-in puts a pointer (23)
///   arrangement TYPE: SPEAKERS    a speaker arrangement (42, 69), its speakers' types
///   pointer                       anything else
std::string describePointer(VstInt32 opcode, VstIntPtr value, const void* ptr);

/// The number; for 42 and 69, whose value is a pointer, the arrangement that it points to.
std::string describeValue(VstInt32 opcode, VstIntPtr value);

}  // namespace sample_plugins
