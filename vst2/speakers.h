// SPDX-License-Identifier: MIT
// Speaker arrangements: which loudspeaker each channel of a bus feeds.
#pragma once

#include "vst2/basic_types.h"

/// Speaker types. Values below 0 are user-defined.
enum VstSpeakerType : VstInt32 {
  kSpeakerUndefined = 0x7FFFFFFF,
  kSpeakerM = 0,      ///< Mono.
  kSpeakerL = 1,      ///< Left.
  kSpeakerR = 2,      ///< Right.
  kSpeakerC = 3,      ///< Centre.
  kSpeakerLfe = 4,    ///< Subwoofer.
  kSpeakerLs = 5,     ///< Left surround.
  kSpeakerRs = 6,     ///< Right surround.
  kSpeakerLc = 7,     ///< Left of centre.
  kSpeakerRc = 8,     ///< Right of centre.
  kSpeakerS = 9,      ///< Surround.
  kSpeakerSl = 10,    ///< Side left.
  kSpeakerSr = 11,    ///< Side right.
  kSpeakerTm = 12,    ///< Top middle.
  kSpeakerTfl = 13,   ///< Top front left.
  kSpeakerTfc = 14,   ///< Top front centre.
  kSpeakerTfr = 15,   ///< Top front right.
  kSpeakerTrl = 16,   ///< Top rear left.
  kSpeakerTrc = 17,   ///< Top rear centre.
  kSpeakerTrr = 18,   ///< Top rear right.
  kSpeakerLfe2 = 19,  ///< Second subwoofer.
};

/// Arrangement types: the ones that this host offers, and the user-defined one that a plug-in may answer.
enum VstSpeakerArrangementType : VstInt32 {
  kSpeakerArrUserDefined = -2,
  kSpeakerArrEmpty = -1,
  kSpeakerArrMono = 0,
  kSpeakerArrStereo = 1,
  kSpeakerArr40Cine = 10,
  kSpeakerArr40Music = 11,
  kSpeakerArr51 = 15,
  kSpeakerArr61Cine = 18,
  kSpeakerArr71Cine = 22,
  kSpeakerArr102 = 28,
};

struct VstSpeakerProperties {
  float azimuth;    ///< Radians.
  float elevation;  ///< Radians.
  float radius;     ///< Metres.
  float reserved;
  char name[64];
  VstInt32 type;  ///< VstSpeakerType
  char future[28];
};

/// Variable in length: 8 speakers are declared, but numChannels may be larger.
struct VstSpeakerArrangement {
  VstInt32 type;  ///< VstSpeakerArrangementType
  VstInt32 numChannels;
  VstSpeakerProperties speakers[8];
};
