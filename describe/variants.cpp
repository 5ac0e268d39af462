// SPDX-License-Identifier: MIT
#include "describe/variants.h"

#include <algorithm>

namespace {

constexpr int kMostMainChannels = 2;

constexpr PrototypeVSTVariant kPrototypes[] = {
    {0, 1, 1, kKelSurroundMonoStereo},   // mono in, mono out
    {1, 1, 2, kKelSurroundMonoStereo},   // mono in, stereo out
    {2, 2, 2, kKelSurroundMonoStereo},   // stereo in, stereo out
    {3, 1, 4, kKelSurroundQuad},         // mono in, quad out
    {4, 2, 4, kKelSurroundQuad},         // stereo in, quad out
    {5, 4, 4, kKelSurroundQuad},         // quad in, quad out
    {6, 1, 6, kKelSurround51},           // mono in, 5.1 out
    {7, 2, 6, kKelSurround51},           // stereo in, 5.1 out
    {8, 6, 6, kKelSurround51},           // 5.1 in, 5.1 out
    {9, 1, 4, kKelSurroundLCRS},         // mono in, LCRS out
    {10, 2, 4, kKelSurroundLCRS},        // stereo in, LCRS out
    {11, 4, 4, kKelSurroundLCRS},        // LCRS in, LCRS out
    {12, 1, 7, kKelSurround61},          // mono in, 6.1 out
    {13, 2, 7, kKelSurround61},          // stereo in, 6.1 out
    {14, 7, 7, kKelSurround61},          // 6.1 in, 6.1 out
    {15, 1, 8, kKelSurround71},          // mono in, 7.1 out
    {16, 2, 8, kKelSurround71},          // stereo in, 7.1 out
    {17, 8, 8, kKelSurround71},          // 7.1 in, 7.1 out
    {18, 1, 12, kKelSurround102},        // mono in, 10.2 out
    {19, 2, 12, kKelSurround102},        // stereo in, 10.2 out
    {20, 12, 12, kKelSurround102},       // 10.2 in, 10.2 out
    {21, 0, 1, kKelSurroundMonoStereo},  // instrument, mono out
    {22, 0, 2, kKelSurroundMonoStereo},  // instrument, stereo out
    {23, 0, 4, kKelSurroundQuad},        // instrument, quad out
    {24, 0, 6, kKelSurround51},          // instrument, 5.1 out
    {25, 0, 4, kKelSurroundLCRS},        // instrument, LCRS out
    {26, 0, 7, kKelSurround61},          // instrument, 6.1 out
    {27, 0, 8, kKelSurround71},          // instrument, 7.1 out
    {28, 0, 8, kKelSurround102},         // On purpose: 8 outputs, so its output arrangement is 7.1.
};

}  // namespace

void setupBundle(int count, int limit, VSTBundle& out) {
  out.mainChannels = std::min({count, limit, kMostMainChannels});
  out.extraChannels = count - out.mainChannels;
}

const std::vector<PrototypeVSTVariant>& GetPrototypeVariants() {
  // On purpose: never destroyed. The run may still read the table while a plug-in's thread is in exit().
  static const auto* const variants =
      new std::vector<PrototypeVSTVariant>(std::begin(kPrototypes), std::end(kPrototypes));
  return *variants;
}

VSTVariant::VSTVariant(const PrototypeVSTVariant& p, const VSTBundle& in, const VSTBundle& out)
    : PrototypeVSTVariant(p), inBundle(in), outBundle(out), accepted(false) {}

VSTVariant::VSTVariant(const PrototypeVSTVariant& p)
    : PrototypeVSTVariant(p), inBundle{p.numIns, 0}, outBundle{p.numOuts, 0}, accepted(true) {}

OwnedSpeakerArrangement VSTVariant::getInArrangement() const {
  return getSpeakerArrangement(numIns, surroundModel);
}

OwnedSpeakerArrangement VSTVariant::getOutArrangement() const {
  return getSpeakerArrangement(numOuts, surroundModel);
}
