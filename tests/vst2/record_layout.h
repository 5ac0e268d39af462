// SPDX-License-Identifier: MIT
// Where plug-ins expect the fields of the interface's records, as literals.
//
// All are constant expressions: record_layout_check.cpp checks them in the compiler, also for systems whose
// programs do not run here.
#pragma once

#include <cstddef>

#include "vst2/aeffect.h"
#include "vst2/preset_data.h"
#include "vst2/properties.h"
#include "vst2/speakers.h"

namespace record_layout {

/// The offset of a field, or the size of a record, in bytes: the actual one, and the one that plug-ins
/// expect.
struct Offset {
  constexpr Offset(const char* name, std::size_t found, std::size_t on32, std::size_t on64)
      : field(name), actual(found), expected(sizeof(void*) == 8 ? on64 : on32) {}
  constexpr Offset(const char* name, std::size_t found, std::size_t onBoth)
      : Offset(name, found, onBoth, onBoth) {}

  const char* field;
  std::size_t actual;
  std::size_t expected;
};

constexpr Offset kEffect[] = {
    {"magic", offsetof(AEffect, magic), 0, 0},
    {"dispatcher", offsetof(AEffect, dispatcher), 4, 8},
    {"process", offsetof(AEffect, process), 8, 16},
    {"setParameter", offsetof(AEffect, setParameter), 12, 24},
    {"getParameter", offsetof(AEffect, getParameter), 16, 32},
    {"numPrograms", offsetof(AEffect, numPrograms), 20, 40},
    {"numParams", offsetof(AEffect, numParams), 24, 44},
    {"numInputs", offsetof(AEffect, numInputs), 28, 48},
    {"numOutputs", offsetof(AEffect, numOutputs), 32, 52},
    {"flags", offsetof(AEffect, flags), 36, 56},
    {"resvd1", offsetof(AEffect, resvd1), 40, 64},
    {"resvd2", offsetof(AEffect, resvd2), 44, 72},
    {"initialDelay", offsetof(AEffect, initialDelay), 48, 80},
    {"realQualities", offsetof(AEffect, realQualities), 52, 84},
    {"offQualities", offsetof(AEffect, offQualities), 56, 88},
    {"ioRatio", offsetof(AEffect, ioRatio), 60, 92},
    {"object", offsetof(AEffect, object), 64, 96},
    {"user", offsetof(AEffect, user), 68, 104},
    {"uniqueID", offsetof(AEffect, uniqueID), 72, 112},
    {"version", offsetof(AEffect, version), 76, 116},
    {"processReplacing", offsetof(AEffect, processReplacing), 80, 120},
    {"processDoubleReplacing", offsetof(AEffect, processDoubleReplacing), 84, 128},
    {"future", offsetof(AEffect, future), 88, 136},
    {"(size)", sizeof(AEffect), 144, 192},
};

// The same for both word sizes.
constexpr Offset kOtherRecords[] = {
    {"pin label", offsetof(VstPinProperties, label), 0},
    {"pin flags", offsetof(VstPinProperties, flags), 64},
    {"pin arrangementType", offsetof(VstPinProperties, arrangementType), 68},
    {"pin shortLabel", offsetof(VstPinProperties, shortLabel), 72},
    {"pin future", offsetof(VstPinProperties, future), 80},
    {"pin (size)", sizeof(VstPinProperties), 128},
    {"parameter stepFloat", offsetof(VstParameterProperties, stepFloat), 0},
    {"parameter smallStepFloat", offsetof(VstParameterProperties, smallStepFloat), 4},
    {"parameter largeStepFloat", offsetof(VstParameterProperties, largeStepFloat), 8},
    {"parameter label", offsetof(VstParameterProperties, label), 12},
    {"parameter flags", offsetof(VstParameterProperties, flags), 76},
    {"parameter minInteger", offsetof(VstParameterProperties, minInteger), 80},
    {"parameter maxInteger", offsetof(VstParameterProperties, maxInteger), 84},
    {"parameter stepInteger", offsetof(VstParameterProperties, stepInteger), 88},
    {"parameter largeStepInteger", offsetof(VstParameterProperties, largeStepInteger), 92},
    {"parameter shortLabel", offsetof(VstParameterProperties, shortLabel), 96},
    {"parameter displayIndex", offsetof(VstParameterProperties, displayIndex), 104},
    {"parameter category", offsetof(VstParameterProperties, category), 106},
    {"parameter numParametersInCategory", offsetof(VstParameterProperties, numParametersInCategory), 108},
    {"parameter reserved", offsetof(VstParameterProperties, reserved), 110},
    {"parameter categoryLabel", offsetof(VstParameterProperties, categoryLabel), 112},
    {"parameter future", offsetof(VstParameterProperties, future), 136},
    {"parameter (size)", sizeof(VstParameterProperties), 152},
    {"speaker azimuth", offsetof(VstSpeakerProperties, azimuth), 0},
    {"speaker elevation", offsetof(VstSpeakerProperties, elevation), 4},
    {"speaker radius", offsetof(VstSpeakerProperties, radius), 8},
    {"speaker reserved", offsetof(VstSpeakerProperties, reserved), 12},
    {"speaker name", offsetof(VstSpeakerProperties, name), 16},
    {"speaker type", offsetof(VstSpeakerProperties, type), 80},
    {"speaker future", offsetof(VstSpeakerProperties, future), 84},
    {"speaker (size)", sizeof(VstSpeakerProperties), 112},
    {"arrangement type", offsetof(VstSpeakerArrangement, type), 0},
    {"arrangement numChannels", offsetof(VstSpeakerArrangement, numChannels), 4},
    {"arrangement speakers", offsetof(VstSpeakerArrangement, speakers), 8},
    {"arrangement (size)", sizeof(VstSpeakerArrangement), 904},
    {"program chunkMagic", offsetof(fxProgram, chunkMagic), 0},
    {"program byteSize", offsetof(fxProgram, byteSize), 4},
    {"program fxMagic", offsetof(fxProgram, fxMagic), 8},
    {"program version", offsetof(fxProgram, version), 12},
    {"program fxID", offsetof(fxProgram, fxID), 16},
    {"program fxVersion", offsetof(fxProgram, fxVersion), 20},
    {"program numParams", offsetof(fxProgram, numParams), 24},
    {"program prgName", offsetof(fxProgram, prgName), 28},
    {"program (header)", sizeof(fxProgram), 56},
    {"bank chunkMagic", offsetof(fxBank, chunkMagic), 0},
    {"bank byteSize", offsetof(fxBank, byteSize), 4},
    {"bank fxMagic", offsetof(fxBank, fxMagic), 8},
    {"bank version", offsetof(fxBank, version), 12},
    {"bank fxID", offsetof(fxBank, fxID), 16},
    {"bank fxVersion", offsetof(fxBank, fxVersion), 20},
    {"bank numPrograms", offsetof(fxBank, numPrograms), 24},
    {"bank future", offsetof(fxBank, future), 28},
    {"bank (header)", sizeof(fxBank), 156},
};

}  // namespace record_layout
