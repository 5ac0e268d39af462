// SPDX-License-Identifier: MIT
// Speaker arrangements for a channel count and a surround model.
#pragma once

#include <memory>
#include <new>

#include "vst2/speakers.h"

/// The kind of surround that a variant is meant for, with its channel count.
enum KelSurroundModel : VstInt32 {
  kKelSurroundMonoStereo = 1,  ///< 1 or 2 channels.
  kKelSurroundQuad = 2,        ///< 4: L R Ls Rs. The only value that is ever tested.
  kKelSurroundLCRS = 3,        ///< 4: L R C S.
  kKelSurround51 = 4,          ///< 6.
  kKelSurround61 = 5,          ///< 7.
  kKelSurround71 = 6,          ///< 8.
  kKelSurround102 = 7,         ///< 12.
};

/// Frees the whole block of an arrangement, which is larger than the record that the interface declares.
struct FreeSpeakerArrangement {
  void operator()(VstSpeakerArrangement* arrangement) const { ::operator delete(arrangement); }
};
using OwnedSpeakerArrangement = std::unique_ptr<VstSpeakerArrangement, FreeSpeakerArrangement>;

/// Every arrangement made here has room for this many speakers; unused entries are zero.
constexpr int kSpeakerEntries = 20;

/// The speaker entry with an index of 0 to 19. It belongs to the arrangement.
VstSpeakerProperties* speakerIn(VstSpeakerArrangement& arrangement, int index);

/// A new arrangement with this type and channel count, whose first entries have these speaker types; -1
/// leaves an entry's type at zero. Throws std::bad_alloc when there is no memory.
/// On purpose: the thirteenth speaker type is ignored; only twelve are stored.
OwnedSpeakerArrangement initSpeakerArrangement(int type, int numChannels, int s0, int s1, int s2, int s3,
                                               int s4, int s5, int s6, int s7, int s8, int s9, int s10,
                                               int s11, int s12);

/// A new arrangement for this many channels. The model matters only for four channels, which are quad or
/// LCRS. Throws std::bad_alloc when there is no memory.
/// On purpose: a count without an arrangement of its own, such as 5 or -1, becomes stereo with 2 channels.
OwnedSpeakerArrangement getSpeakerArrangement(int numChannels, KelSurroundModel model);
