// SPDX-License-Identifier: MIT
// Compiles only if every field of the plug-in interface's records is where plug-ins expect it; nothing of it
// runs. tests/macos/check_build.py compiles it for macOS, too.
#include "tests/vst2/record_layout.h"

namespace {

template <std::size_t count>
constexpr bool allInPlace(const record_layout::Offset (&table)[count]) {
  for (const record_layout::Offset& row : table)
    if (row.actual != row.expected) return false;
  return true;
}

static_assert(allInPlace(record_layout::kEffect), "AEffect");
static_assert(allInPlace(record_layout::kOtherRecords), "pins, parameters, speakers, presets");

// The types of the values that a plug-in and this program exchange.
static_assert(sizeof(VstInt16) == 2 && sizeof(VstInt32) == 4 && sizeof(VstIntPtr) == sizeof(void*));
static_assert(VstInt16(-1) < 0 && VstInt32(-1) < 0 && VstIntPtr(-1) < 0);

}  // namespace
