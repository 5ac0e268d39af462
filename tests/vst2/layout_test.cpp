// SPDX-License-Identifier: MIT
// Offsets, sizes and numbers of the plug-in interface, as literals: plug-ins were compiled with these.
#include "gtest/gtest.h"
#include "tests/vst2/record_layout.h"
#include "vst2/aeffect.h"
#include "vst2/basic_types.h"
#include "vst2/effect_opcodes.h"
#include "vst2/host_opcodes.h"
#include "vst2/properties.h"

namespace {

TEST(RecordLayout, EveryFieldIsWherePluginsExpectIt) {
  for (const auto& row : record_layout::kEffect) EXPECT_EQ(row.actual, row.expected) << row.field;
  for (const auto& row : record_layout::kOtherRecords) EXPECT_EQ(row.actual, row.expected) << row.field;
}

TEST(FourCharacterCode, PutsTheFirstCharacterAsAnUnsignedByteIntoTheMostSignificantByte) {
  EXPECT_EQ(fourCharacterCode('N', 'I', 'D', 'U'), 1313424469);
  EXPECT_EQ(fourCharacterCode('\x01', '\xFF', '\x80', '\xFE'), 0x01FF80FE);
  EXPECT_EQ(fourCharacterCode('\xFF', '\xFF', '\xFF', '\xFF'), -1);
  EXPECT_EQ(kEffectMagic, 0x56737450);
}

struct Number {
  VstInt32 actual;
  VstInt32 expected;
};

constexpr Number kEffectOpcodes[] = {
    {effOpen, 0},
    {effClose, 1},
    {effSetProgram, 2},
    {effGetProgram, 3},
    {effSetProgramName, 4},
    {effGetProgramName, 5},
    {effGetParamLabel, 6},
    {effGetParamDisplay, 7},
    {effGetParamName, 8},
    {effSetSampleRate, 10},
    {effSetBlockSize, 11},
    {effMainsChanged, 12},
    {effIdentify, 22},
    {effGetChunk, 23},
    {effSetChunk, 24},
    {effCanBeAutomated, 26},
    {effString2Parameter, 27},
    {effGetProgramNameIndexed, 29},
    {effConnectInput, 31},
    {effConnectOutput, 32},
    {effGetInputProperties, 33},
    {effGetOutputProperties, 34},
    {effGetPlugCategory, 35},
    {effSetSpeakerArrangement, 42},
    {effSetBypass, 44},
    {effGetEffectName, 45},
    {effGetVendorString, 47},
    {effGetProductString, 48},
    {effCanDo, 51},
    {effGetTailSize, 52},
    {effGetParameterProperties, 56},
    {effGetVstVersion, 58},
    {effGetSpeakerArrangement, 69},
    {effShellGetNextPlugin, 70},
    {effGetNumMidiOutputChannels, 79},
};

constexpr Number kHostOpcodes[] = {
    {audioMasterAutomate, 0},
    {audioMasterVersion, 1},
    {audioMasterCurrentId, 2},
    {audioMasterIdle, 3},
    {audioMasterWantMidi, 6},
    {audioMasterGetTime, 7},
    {audioMasterProcessEvents, 8},
    {audioMasterIOChanged, 13},
    {audioMasterSizeWindow, 15},
    {audioMasterGetSampleRate, 16},
    {audioMasterGetBlockSize, 17},
    {audioMasterGetCurrentProcessLevel, 23},
    {audioMasterGetAutomationState, 24},
    {audioMasterGetVendorString, 32},
    {audioMasterGetProductString, 33},
    {audioMasterGetVendorVersion, 34},
    {audioMasterVendorSpecific, 35},
    {audioMasterCanDo, 37},
    {audioMasterGetLanguage, 38},
    {audioMasterGetDirectory, 41},
    {audioMasterUpdateDisplay, 42},
    {audioMasterBeginEdit, 43},
    {audioMasterEndEdit, 44},
};

constexpr Number kFlags[] = {
    {effFlagsHasEditor, 1},
    {effFlagsCanReplacing, 16},
    {effFlagsProgramChunks, 32},
    {effFlagsIsSynth, 256},
    {effFlagsNoSoundInStop, 512},
    {effFlagsCanDoubleReplacing, 4096},
    {kVstPinIsActive, 1},
    {kVstPinIsStereo, 2},
    {kVstPinUseSpeaker, 4},
    {kVstParameterIsSwitch, 1},
    {kVstParameterUsesIntegerMinMax, 2},
    {kVstParameterUsesFloatStep, 4},
    {kVstParameterUsesIntStep, 8},
    {kVstParameterSupportsDisplayIndex, 16},
    {kVstParameterSupportsDisplayCategory, 32},
    {kVstParameterCanRamp, 64},
};

constexpr Number kCategories[] = {
    {kPlugCategUnknown, 0},        {kPlugCategEffect, 1},    {kPlugCategSynth, 2},
    {kPlugCategAnalysis, 3},       {kPlugCategMastering, 4}, {kPlugCategSpacializer, 5},
    {kPlugCategRoomFx, 6},         {kPlugSurroundFx, 7},     {kPlugCategRestoration, 8},
    {kPlugCategOfflineProcess, 9}, {kPlugCategShell, 10},    {kPlugCategGenerator, 11},
};

template <std::size_t count>
void expectInterfaceNumbers(const Number (&table)[count]) {
  for (const Number& row : table) EXPECT_EQ(row.actual, row.expected);
}

TEST(InterfaceNumbers, OpcodesFlagsAndCategoriesAreThoseThatPluginsUse) {
  expectInterfaceNumbers(kEffectOpcodes);
  expectInterfaceNumbers(kHostOpcodes);
  expectInterfaceNumbers(kFlags);
  expectInterfaceNumbers(kCategories);
}

}  // namespace
