// SPDX-License-Identifier: MIT
#include "describe/speaker_arrangement.h"

#include <cstddef>
#include <new>

namespace {

constexpr std::size_t kBlockSizeInBytes =
    offsetof(VstSpeakerArrangement, speakers) + kSpeakerEntries * sizeof(VstSpeakerProperties);
constexpr int kStoredTypes = 12;
constexpr int kNone = -1;

/// Up to twelve speakers; what is not named stays out.
struct Layout {
  VstInt32 type;
  VstInt32 numChannels;
  int speakers[kStoredTypes];
};

constexpr int _ = kNone;
constexpr Layout kEmpty = {kSpeakerArrEmpty, 0, {_, _, _, _, _, _, _, _, _, _, _, _}};
constexpr Layout kMono = {kSpeakerArrMono, 1, {kSpeakerM, _, _, _, _, _, _, _, _, _, _, _}};
constexpr Layout kStereo = {kSpeakerArrStereo, 2, {kSpeakerL, kSpeakerR, _, _, _, _, _, _, _, _, _, _}};
constexpr Layout kQuad = {
    kSpeakerArr40Music, 4, {kSpeakerL, kSpeakerR, kSpeakerLs, kSpeakerRs, _, _, _, _, _, _, _, _}};
constexpr Layout kLCRS = {
    kSpeakerArr40Cine, 4, {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerS, _, _, _, _, _, _, _, _}};
constexpr Layout k51 = {
    kSpeakerArr51,
    6,
    {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerLfe, kSpeakerLs, kSpeakerRs, _, _, _, _, _, _}};
constexpr Layout k61 = {
    kSpeakerArr61Cine,
    7,
    {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerLfe, kSpeakerLs, kSpeakerRs, kSpeakerS, _, _, _, _, _}};
constexpr Layout k71 = {kSpeakerArr71Cine,
                        8,
                        {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerLfe, kSpeakerLs, kSpeakerRs, kSpeakerLc,
                         kSpeakerRc, _, _, _, _}};
// On purpose: this host's own order, with the second subwoofer right behind the first.
constexpr Layout k102 = {kSpeakerArr102,
                         12,
                         {kSpeakerL, kSpeakerR, kSpeakerC, kSpeakerLfe, kSpeakerLfe2, kSpeakerLs, kSpeakerRs,
                          kSpeakerS, kSpeakerSl, kSpeakerSr, kSpeakerTfl, kSpeakerTfr}};

const Layout& layoutFor(int numChannels, KelSurroundModel model) {
  switch (numChannels) {
    case 0:
      return kEmpty;
    case 1:
      return kMono;
    case 2:
      return kStereo;
    case 4:
      return model == kKelSurroundQuad ? kQuad : kLCRS;
    case 6:
      return k51;
    case 7:
      return k61;
    case 8:
      return k71;
    case 12:
      return k102;
    default:
      return kStereo;  // On purpose: the count that was asked for is not kept.
  }
}

}  // namespace

VstSpeakerProperties* speakerIn(VstSpeakerArrangement& arrangement, int index) {
  // By address, since the declared array is shorter than the block.
  void* entries = reinterpret_cast<char*>(&arrangement) + offsetof(VstSpeakerArrangement, speakers);
  return static_cast<VstSpeakerProperties*>(entries) + index;
}

OwnedSpeakerArrangement initSpeakerArrangement(int type, int numChannels, int s0, int s1, int s2, int s3,
                                               int s4, int s5, int s6, int s7, int s8, int s9, int s10,
                                               int s11, int /*s12*/) {
  void* block = std::calloc(1, kBlockSizeInBytes);
  if (block == nullptr) throw std::bad_alloc();
  OwnedSpeakerArrangement arrangement(static_cast<VstSpeakerArrangement*>(block));
  arrangement->type = type;
  arrangement->numChannels = numChannels;
  const int types[kStoredTypes] = {s0, s1, s2, s3, s4, s5, s6, s7, s8, s9, s10, s11};
  for (int i = 0; i < kStoredTypes; ++i) {
    if (types[i] != kNone) speakerIn(*arrangement, i)->type = types[i];
  }
  return arrangement;
}

OwnedSpeakerArrangement getSpeakerArrangement(int numChannels, KelSurroundModel model) {
  const Layout& layout = layoutFor(numChannels, model);
  const auto& s = layout.speakers;
  return initSpeakerArrangement(layout.type, layout.numChannels, s[0], s[1], s[2], s[3], s[4], s[5], s[6],
                                s[7], s[8], s[9], s[10], s[11], kNone);
}
