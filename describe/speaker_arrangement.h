// SPDX-License-Identifier: MIT
// Speaker arrangements for a channel count and a surround model.
#pragma once

#include <cstdlib>
#include <memory>

#include "vst2/speakers.h"

/// Which kind of surround a variant is meant for.
enum KelSurroundModel : VstInt32 {
  kKelSurroundMonoStereo = 1,  ///< 1 or 2 channels.
  kKelSurroundQuad = 2,        ///< 4: L R Ls Rs. The only value that is ever tested.
  kKelSurroundLCRS = 3,        ///< 4: L R C S.
  kKelSurround51 = 4,          ///< 6.
  kKelSurround61 = 5,          ///< 7.
  kKelSurround71 = 6,          ///< 8.
  kKelSurround102 = 7,         ///< 12.
};

/// Frees an arrangement, whose block is larger than the record that the interface declares.
struct FreeSpeakerArrangement {
  void operator()(VstSpeakerArrangement* arrangement) const { std::free(arrangement); }
};
using OwnedSpeakerArrangement = std::unique_ptr<VstSpeakerArrangement, FreeSpeakerArrangement>;

/// Room for this many speakers in every arrangement made here; unused ones are zero.
constexpr int kSpeakerEntries = 20;

/// One speaker entry, 0 to 19. Borrowed.
VstSpeakerProperties* speakerIn(VstSpeakerArrangement& arrangement, int index);

/// A new arrangement with these values and, for its first speakers, these types; -1 leaves a type at zero.
/// On purpose: the thirteenth type is ignored, only twelve are ever stored.
/// Throws std::bad_alloc when there is no memory.
OwnedSpeakerArrangement initSpeakerArrangement(int type, int numChannels, int s0, int s1, int s2, int s3,
                                               int s4, int s5, int s6, int s7, int s8, int s9, int s10,
                                               int s11, int s12);

/// A new arrangement for this many channels. A count that is not known becomes stereo. The model decides
/// between the two arrangements of four channels and nothing else.
OwnedSpeakerArrangement getSpeakerArrangement(int numChannels, KelSurroundModel model);
