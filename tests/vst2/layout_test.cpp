// SPDX-License-Identifier: MIT
// Offsets, sizes and numbers of the plug-in interface, as literals: a plug-in was compiled against these.
#include "gtest/gtest.h"
#include "tests/vst2/record_layout.h"
#include "vst2/aeffect.h"
#include "vst2/basic_types.h"
#include "vst2/effect_opcodes.h"
#include "vst2/host_opcodes.h"
#include "vst2/preset_data.h"
#include "vst2/properties.h"
#include "vst2/speakers.h"

namespace {

using record_layout::Offset;

TEST(AEffectLayout, EveryFieldLiesWherePluginsExpectIt) {
  for (const Offset& row : record_layout::kEffect) EXPECT_EQ(row.actual, row.expected()) << row.field;
}

TEST(RecordLayout, TheOtherRecordsAreTheSameForBothWordSizes) {
  for (const Offset& row : record_layout::kOtherRecords) {
    EXPECT_EQ(row.actual, row.expected()) << row.field;
    EXPECT_EQ(row.on32, row.on64) << row.field;
  }
}

TEST(BasicTypes, VstIntPtrIsSignedAndAsWideAsAPointer) {
  EXPECT_EQ(sizeof(VstIntPtr), sizeof(void*));
  EXPECT_LT(static_cast<VstIntPtr>(-1), 0);
}

TEST(FourCharacterCode, PutsTheFirstCharacterIntoTheMostSignificantByte) {
  EXPECT_EQ(fourCharacterCode('N', 'I', 'D', 'U'), 1313424469);
  EXPECT_EQ(fourCharacterCode('V', 's', 't', 'P'), 0x56737450);
  EXPECT_EQ(fourCharacterCode('N', 'v', 'E', 'f'), 0x4E764566);
  EXPECT_EQ(fourCharacterCode('C', 'c', 'n', 'K'), 0x43636E4B);
}

TEST(FourCharacterCode, TakesCharactersAbove127AsUnsignedBytes) {
  EXPECT_EQ(fourCharacterCode('\x01', '\xFF', '\x80', '\xFE'), 0x01FF80FE);
  EXPECT_EQ(fourCharacterCode('\xFF', '\xFF', '\xFF', '\xFF'), -1);
}

TEST(EffectOpcodes, CarryTheNumbersOfTheInterface) {
  EXPECT_EQ(effOpen, 0);
  EXPECT_EQ(effClose, 1);
  EXPECT_EQ(effSetProgram, 2);
  EXPECT_EQ(effGetProgram, 3);
  EXPECT_EQ(effSetProgramName, 4);
  EXPECT_EQ(effGetProgramName, 5);
  EXPECT_EQ(effGetParamLabel, 6);
  EXPECT_EQ(effGetParamDisplay, 7);
  EXPECT_EQ(effGetParamName, 8);
  EXPECT_EQ(effSetSampleRate, 10);
  EXPECT_EQ(effSetBlockSize, 11);
  EXPECT_EQ(effMainsChanged, 12);
  EXPECT_EQ(effIdentify, 22);
  EXPECT_EQ(effGetChunk, 23);
  EXPECT_EQ(effSetChunk, 24);
  EXPECT_EQ(effCanBeAutomated, 26);
  EXPECT_EQ(effString2Parameter, 27);
  EXPECT_EQ(effGetProgramNameIndexed, 29);
  EXPECT_EQ(effConnectInput, 31);
  EXPECT_EQ(effConnectOutput, 32);
  EXPECT_EQ(effGetInputProperties, 33);
  EXPECT_EQ(effGetOutputProperties, 34);
  EXPECT_EQ(effGetPlugCategory, 35);
  EXPECT_EQ(effSetSpeakerArrangement, 42);
  EXPECT_EQ(effSetBypass, 44);
  EXPECT_EQ(effGetEffectName, 45);
  EXPECT_EQ(effGetVendorString, 47);
  EXPECT_EQ(effGetProductString, 48);
  EXPECT_EQ(effCanDo, 51);
  EXPECT_EQ(effGetTailSize, 52);
  EXPECT_EQ(effGetParameterProperties, 56);
  EXPECT_EQ(effGetVstVersion, 58);
  EXPECT_EQ(effGetSpeakerArrangement, 69);
  EXPECT_EQ(effShellGetNextPlugin, 70);
  EXPECT_EQ(effGetNumMidiOutputChannels, 79);
}

TEST(HostOpcodes, CarryTheNumbersOfTheInterface) {
  EXPECT_EQ(audioMasterAutomate, 0);
  EXPECT_EQ(audioMasterVersion, 1);
  EXPECT_EQ(audioMasterCurrentId, 2);
  EXPECT_EQ(audioMasterIdle, 3);
  EXPECT_EQ(audioMasterWantMidi, 6);
  EXPECT_EQ(audioMasterGetTime, 7);
  EXPECT_EQ(audioMasterProcessEvents, 8);
  EXPECT_EQ(audioMasterIOChanged, 13);
  EXPECT_EQ(audioMasterSizeWindow, 15);
  EXPECT_EQ(audioMasterGetSampleRate, 16);
  EXPECT_EQ(audioMasterGetBlockSize, 17);
  EXPECT_EQ(audioMasterGetCurrentProcessLevel, 23);
  EXPECT_EQ(audioMasterGetAutomationState, 24);
  EXPECT_EQ(audioMasterGetVendorString, 32);
  EXPECT_EQ(audioMasterGetProductString, 33);
  EXPECT_EQ(audioMasterGetVendorVersion, 34);
  EXPECT_EQ(audioMasterVendorSpecific, 35);
  EXPECT_EQ(audioMasterCanDo, 37);
  EXPECT_EQ(audioMasterGetLanguage, 38);
  EXPECT_EQ(audioMasterGetDirectory, 41);
  EXPECT_EQ(audioMasterUpdateDisplay, 42);
  EXPECT_EQ(audioMasterBeginEdit, 43);
  EXPECT_EQ(audioMasterEndEdit, 44);
}

TEST(Flags, CarryTheBitsOfTheInterface) {
  EXPECT_EQ(effFlagsHasEditor, 1);
  EXPECT_EQ(effFlagsCanReplacing, 16);
  EXPECT_EQ(effFlagsProgramChunks, 32);
  EXPECT_EQ(effFlagsIsSynth, 256);
  EXPECT_EQ(effFlagsNoSoundInStop, 512);
  EXPECT_EQ(effFlagsCanDoubleReplacing, 4096);
  EXPECT_EQ(kVstPinIsActive, 1);
  EXPECT_EQ(kVstPinIsStereo, 2);
  EXPECT_EQ(kVstPinUseSpeaker, 4);
  EXPECT_EQ(kVstParameterIsSwitch, 1);
  EXPECT_EQ(kVstParameterUsesIntegerMinMax, 2);
  EXPECT_EQ(kVstParameterUsesFloatStep, 4);
  EXPECT_EQ(kVstParameterUsesIntStep, 8);
  EXPECT_EQ(kVstParameterSupportsDisplayIndex, 16);
  EXPECT_EQ(kVstParameterSupportsDisplayCategory, 32);
  EXPECT_EQ(kVstParameterCanRamp, 64);
}

TEST(Categories, CarryTheNumbersOfTheInterface) {
  EXPECT_EQ(kPlugCategUnknown, 0);
  EXPECT_EQ(kPlugCategEffect, 1);
  EXPECT_EQ(kPlugCategSynth, 2);
  EXPECT_EQ(kPlugCategAnalysis, 3);
  EXPECT_EQ(kPlugCategMastering, 4);
  EXPECT_EQ(kPlugCategSpacializer, 5);
  EXPECT_EQ(kPlugCategRoomFx, 6);
  EXPECT_EQ(kPlugSurroundFx, 7);
  EXPECT_EQ(kPlugCategRestoration, 8);
  EXPECT_EQ(kPlugCategOfflineProcess, 9);
  EXPECT_EQ(kPlugCategShell, 10);
  EXPECT_EQ(kPlugCategGenerator, 11);
}

}  // namespace
