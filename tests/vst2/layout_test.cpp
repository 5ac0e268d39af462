// Offsets, sizes and numbers of the plug-in interface, as literals: a plug-in was compiled against these.
#include <cstddef>

#include "gtest/gtest.h"
#include "vst2/aeffect.h"
#include "vst2/basic_types.h"
#include "vst2/effect_opcodes.h"
#include "vst2/host_opcodes.h"
#include "vst2/preset_data.h"
#include "vst2/properties.h"
#include "vst2/speakers.h"

namespace {

constexpr bool k64 = sizeof(void*) == 8;

struct Offset {
  const char* field;
  std::size_t actual;
  std::size_t on32;
  std::size_t on64;
};

TEST(AEffectLayout, EveryFieldLiesWherePluginsExpectIt) {
  const Offset table[] = {
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
  for (const Offset& row : table) EXPECT_EQ(row.actual, k64 ? row.on64 : row.on32) << row.field;
}

TEST(RecordLayout, TheOtherRecordsAreTheSameForBothWordSizes) {
  const Offset table[] = {
      {"pin label", offsetof(VstPinProperties, label), 0, 0},
      {"pin flags", offsetof(VstPinProperties, flags), 64, 64},
      {"pin arrangementType", offsetof(VstPinProperties, arrangementType), 68, 68},
      {"pin shortLabel", offsetof(VstPinProperties, shortLabel), 72, 72},
      {"pin future", offsetof(VstPinProperties, future), 80, 80},
      {"pin (size)", sizeof(VstPinProperties), 128, 128},
      {"parameter stepFloat", offsetof(VstParameterProperties, stepFloat), 0, 0},
      {"parameter smallStepFloat", offsetof(VstParameterProperties, smallStepFloat), 4, 4},
      {"parameter largeStepFloat", offsetof(VstParameterProperties, largeStepFloat), 8, 8},
      {"parameter label", offsetof(VstParameterProperties, label), 12, 12},
      {"parameter flags", offsetof(VstParameterProperties, flags), 76, 76},
      {"parameter minInteger", offsetof(VstParameterProperties, minInteger), 80, 80},
      {"parameter maxInteger", offsetof(VstParameterProperties, maxInteger), 84, 84},
      {"parameter stepInteger", offsetof(VstParameterProperties, stepInteger), 88, 88},
      {"parameter largeStepInteger", offsetof(VstParameterProperties, largeStepInteger), 92, 92},
      {"parameter shortLabel", offsetof(VstParameterProperties, shortLabel), 96, 96},
      {"parameter displayIndex", offsetof(VstParameterProperties, displayIndex), 104, 104},
      {"parameter category", offsetof(VstParameterProperties, category), 106, 106},
      {"parameter numParametersInCategory", offsetof(VstParameterProperties, numParametersInCategory), 108,
       108},
      {"parameter reserved", offsetof(VstParameterProperties, reserved), 110, 110},
      {"parameter categoryLabel", offsetof(VstParameterProperties, categoryLabel), 112, 112},
      {"parameter future", offsetof(VstParameterProperties, future), 136, 136},
      {"parameter (size)", sizeof(VstParameterProperties), 152, 152},
      {"speaker azimuth", offsetof(VstSpeakerProperties, azimuth), 0, 0},
      {"speaker elevation", offsetof(VstSpeakerProperties, elevation), 4, 4},
      {"speaker radius", offsetof(VstSpeakerProperties, radius), 8, 8},
      {"speaker reserved", offsetof(VstSpeakerProperties, reserved), 12, 12},
      {"speaker name", offsetof(VstSpeakerProperties, name), 16, 16},
      {"speaker type", offsetof(VstSpeakerProperties, type), 80, 80},
      {"speaker future", offsetof(VstSpeakerProperties, future), 84, 84},
      {"speaker (size)", sizeof(VstSpeakerProperties), 112, 112},
      {"arrangement type", offsetof(VstSpeakerArrangement, type), 0, 0},
      {"arrangement numChannels", offsetof(VstSpeakerArrangement, numChannels), 4, 4},
      {"arrangement speakers", offsetof(VstSpeakerArrangement, speakers), 8, 8},
      {"arrangement (size)", sizeof(VstSpeakerArrangement), 904, 904},
      {"program chunkMagic", offsetof(fxProgram, chunkMagic), 0, 0},
      {"program byteSize", offsetof(fxProgram, byteSize), 4, 4},
      {"program fxMagic", offsetof(fxProgram, fxMagic), 8, 8},
      {"program version", offsetof(fxProgram, version), 12, 12},
      {"program fxID", offsetof(fxProgram, fxID), 16, 16},
      {"program fxVersion", offsetof(fxProgram, fxVersion), 20, 20},
      {"program numParams", offsetof(fxProgram, numParams), 24, 24},
      {"program prgName", offsetof(fxProgram, prgName), 28, 28},
      {"program (header)", sizeof(fxProgram), 56, 56},
      {"bank numPrograms", offsetof(fxBank, numPrograms), 24, 24},
      {"bank future", offsetof(fxBank, future), 28, 28},
      {"bank (header)", sizeof(fxBank), 156, 156},
  };
  for (const Offset& row : table) EXPECT_EQ(row.actual, k64 ? row.on64 : row.on32) << row.field;
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
  EXPECT_EQ(kPlugCategSynth, 2);
  EXPECT_EQ(kPlugCategShell, 10);
  EXPECT_EQ(kVstParameterUsesIntegerMinMax, 2);
  EXPECT_EQ(kVstParameterUsesIntStep, 8);
  EXPECT_EQ(kVstParameterCanRamp, 64);
}

}  // namespace
