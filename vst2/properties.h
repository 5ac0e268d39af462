// SPDX-License-Identifier: MIT
// The records that a plug-in fills to describe a pin or a parameter.
//
// Clear a record before every query: plug-ins may fill only a part of it, or fill it and then answer 0.
#pragma once

#include "vst2/basic_types.h"

/// Bits of VstPinProperties::flags.
enum VstPinPropertiesFlags : VstInt32 {
  kVstPinIsActive = 1 << 0,
  kVstPinIsStereo = 1 << 1,    ///< First of a stereo pair.
  kVstPinUseSpeaker = 1 << 2,  ///< arrangementType is meaningful.
};

/// Answer to effGetInputProperties (33) and effGetOutputProperties (34).
struct VstPinProperties {
  char label[64];
  VstInt32 flags;
  VstInt32 arrangementType;
  char shortLabel[8];
  char future[48];
};

/// Bits of VstParameterProperties::flags.
enum VstParameterFlags : VstInt32 {
  kVstParameterIsSwitch = 1 << 0,
  kVstParameterUsesIntegerMinMax = 1 << 1,
  kVstParameterUsesFloatStep = 1 << 2,
  kVstParameterUsesIntStep = 1 << 3,
  kVstParameterSupportsDisplayIndex = 1 << 4,
  kVstParameterSupportsDisplayCategory = 1 << 5,
  kVstParameterCanRamp = 1 << 6,
};

/// Answer to effGetParameterProperties (56).
struct VstParameterProperties {
  float stepFloat;
  float smallStepFloat;
  float largeStepFloat;
  char label[64];
  VstInt32 flags;
  VstInt32 minInteger;
  VstInt32 maxInteger;
  VstInt32 stepInteger;
  VstInt32 largeStepInteger;
  char shortLabel[8];
  VstInt16 displayIndex;
  VstInt16 category;
  VstInt16 numParametersInCategory;
  VstInt16 reserved;
  char categoryLabel[24];
  char future[16];
};
