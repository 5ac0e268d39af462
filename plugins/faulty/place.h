// SPDX-License-Identifier: MIT
// Where a fault happens, as the environment variable FAULT_PLACE says:
//
//   load                the module is being loaded
//   entry               the entry point is called
//   dispatch:OPCODE     a request arrives, by its number
//   getParameter        a parameter is read
//   setParameter        a parameter is set
//
// All but the first two may end in :N for the N-th time in the life of the process, over all instances.
#pragma once

#include "vst2/basic_types.h"

namespace sample_plugins {

enum class Moment { load, entry, dispatch, getParameter, setParameter };

/// Whether the fault happens when a parameter is set.
bool waitsForSetParameter();
/// Whether the fault happens when this request arrives.
bool waitsForRequest(VstInt32 opcode);

/// Reports that the plug-in has reached this moment. The fault is committed when this is its place and turn.
/// `opcode` tells requests apart; other moments have none.
void reach(Moment moment, VstInt32 opcode = 0);

}  // namespace sample_plugins
