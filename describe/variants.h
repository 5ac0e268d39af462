// SPDX-License-Identifier: MIT
// The input/output configurations that a plug-in may be offered.
//
// Every variant is a row of a fixed table of prototypes, together with how the plug-in's own channels split
// into main channels and extra channels.
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

/// How a channel count splits into two parts.
struct VSTBundle {
  VstInt32 mainChannels;   ///< On the main bus. At most 2 when set by setupBundle().
  VstInt32 extraChannels;  ///< The rest of the count.
};

/// Splits `count`: the smallest of `count`, `limit` and 2 are main channels, the others are extra channels.
void setupBundle(int count, int limit, VSTBundle& out);

/// The first and last row for effects, and for instruments (which have no inputs).
constexpr VstInt32 kFirstEffectRow = 0;
constexpr VstInt32 kLastEffectRow = 20;
constexpr VstInt32 kFirstInstrumentRow = 21;
constexpr VstInt32 kLastInstrumentRow = 28;

/// The 29 rows, in order. The table exists from the first call to the end of the process and never changes.
const std::vector<PrototypeVSTVariant>& GetPrototypeVariants();

/// A prototype with the split of a plug-in's channels.
struct VSTVariant : PrototypeVSTVariant {
  /// Copies the row and the bundles. Not accepted.
  VSTVariant(const PrototypeVSTVariant& p, const VSTBundle& in, const VSTBundle& out);
  /// A row alone: all its channels are main channels. Accepted.
  explicit VSTVariant(const PrototypeVSTVariant& p);

  /// The arrangement of the row's channels, whatever the bundles are. The caller owns it. Throws
  /// std::bad_alloc when there is no memory.
  [[nodiscard]] OwnedSpeakerArrangement getInArrangement() const;
  [[nodiscard]] OwnedSpeakerArrangement getOutArrangement() const;

  VSTBundle inBundle;
  VSTBundle outBundle;
  bool accepted;  ///< Only accepted variants are offered to a plug-in.
};
