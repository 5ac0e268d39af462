// SPDX-License-Identifier: MIT
// The input/output configurations that a plug-in may be offered.
//
// Every variant starts from a row of one fixed table of prototypes and adds how the plug-in's own channels
// split into a main part and the rest.
#pragma once

#include <vector>

#include "describe/speaker_arrangement.h"

/// One row of the table.
struct PrototypeVSTVariant {
  VstInt32 variantID;  ///< The row number, 0 to 28.
  VstInt32 numIns;     ///< Input channels.
  VstInt32 numOuts;    ///< Output channels.
  KelSurroundModel surroundModel;
};

/// How a channel count splits.
struct VSTBundle {
  VstInt32 mainChannels;   ///< On the main bus, never more than 2 when made by setupBundle().
  VstInt32 extraChannels;  ///< The rest of the count.
};

/// Main part: the smallest of `count`, `limit` and 2. The rest is extra.
void setupBundle(int count, int limit, VSTBundle& out);

/// The first and last row for effects, and for instruments (which have no inputs).
constexpr VstInt32 kFirstEffectRow = 0;
constexpr VstInt32 kLastEffectRow = 20;
constexpr VstInt32 kFirstInstrumentRow = 21;
constexpr VstInt32 kLastInstrumentRow = 28;

/// The 29 rows, in order. Lives from the first call to the end of the process and never changes.
const std::vector<PrototypeVSTVariant>& GetPrototypeVariants();

/// A prototype with the split of a plug-in's channels.
struct VSTVariant : PrototypeVSTVariant {
  /// Made with bundles: not accepted.
  VSTVariant(const PrototypeVSTVariant& p, const VSTBundle& in, const VSTBundle& out);
  /// Made from the prototype alone: all its channels are main channels, accepted.
  explicit VSTVariant(const PrototypeVSTVariant& p);

  /// The arrangement of the prototype's channels; the bundles play no part. The caller owns it.
  [[nodiscard]] OwnedSpeakerArrangement getInArrangement() const;
  [[nodiscard]] OwnedSpeakerArrangement getOutArrangement() const;

  VSTBundle inBundle;
  VSTBundle outBundle;
  bool accepted;  ///< Only accepted variants are offered to a plug-in.
};
