// SPDX-License-Identifier: MIT
#include "describe/speaker_arrangement.h"

#include <cstddef>
#include <cstring>

namespace {

constexpr std::size_t kBlockSizeInBytes =
    offsetof(VstSpeakerArrangement, speakers) + kSpeakerEntries * sizeof(VstSpeakerProperties);
constexpr int kStoredTypes = 12;
constexpr int kNoSpeaker = -1;

/// Speakers that a row does not name have the type 0, as unused entries have.
struct Layout {
  VstInt32 numChannels;
  VstInt32 type;
  int speakers[kStoredTypes];
};

// clang-format off
constexpr Layout kStereo = {2, kSpeakerArrStereo,  {kSpeakerL, kSpeakerR}};
constexpr Layout kQuad =   {4, kSpeakerArr40Music, {kSpeakerL, kSpeakerR, kSpeakerLs, kSpeakerRs}};

// On purpose: in 10.2 the second subwoofer follows the first, which is this host's own order.
constexpr Layout kLayouts[] = {
    {0,  kSpeakerArrEmpty,  {}},
    {1,  kSpeakerArrMono,   {kSpeakerM}},
    kStereo,
    {4,  kSpeakerArr40Cine, {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerS}},
    {6,  kSpeakerArr51,     {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerLfe, kSpeakerLs, kSpeakerRs}},
    {7,  kSpeakerArr61Cine, {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerLfe, kSpeakerLs, kSpeakerRs,
                             kSpeakerS}},
    {8,  kSpeakerArr71Cine, {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerLfe, kSpeakerLs, kSpeakerRs,
                             kSpeakerLc, kSpeakerRc}},
    {12, kSpeakerArr102,    {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerLfe, kSpeakerLfe2, kSpeakerLs,
                             kSpeakerRs, kSpeakerS, kSpeakerSl, kSpeakerSr, kSpeakerTfl, kSpeakerTfr}},
};
// clang-format on

const Layout& layoutFor(int numChannels, KelSurroundModel model) {
  if (numChannels == 4 && model == kKelSurroundQuad) return kQuad;
  for (const Layout& layout : kLayouts) {
    if (layout.numChannels == numChannels) return layout;
  }
  return kStereo;
}

}  // namespace

VstSpeakerProperties* speakerIn(VstSpeakerArrangement& arrangement, int index) {
  // Computed from the address, because the declared array is shorter than the block.
  void* entries = reinterpret_cast<char*>(&arrangement) + offsetof(VstSpeakerArrangement, speakers);
  return static_cast<VstSpeakerProperties*>(entries) + index;
}

OwnedSpeakerArrangement initSpeakerArrangement(int type, int numChannels, int s0, int s1, int s2, int s3,
                                               int s4, int s5, int s6, int s7, int s8, int s9, int s10,
                                               int s11, int /*s12*/) {
  void* block = ::operator new(kBlockSizeInBytes);
  std::memset(block, 0, kBlockSizeInBytes);
  OwnedSpeakerArrangement arrangement(static_cast<VstSpeakerArrangement*>(block));
  arrangement->type = type;
  arrangement->numChannels = numChannels;
  const int types[kStoredTypes] = {s0, s1, s2, s3, s4, s5, s6, s7, s8, s9, s10, s11};
  for (int i = 0; i < kStoredTypes; ++i) {
    if (types[i] != kNoSpeaker) speakerIn(*arrangement, i)->type = types[i];
  }
  return arrangement;
}

OwnedSpeakerArrangement getSpeakerArrangement(int numChannels, KelSurroundModel model) {
  const Layout& layout = layoutFor(numChannels, model);
  const auto& s = layout.speakers;
  return initSpeakerArrangement(layout.type, layout.numChannels, s[0], s[1], s[2], s[3], s[4], s[5], s[6],
                                s[7], s[8], s[9], s[10], s[11], kNoSpeaker);
}
