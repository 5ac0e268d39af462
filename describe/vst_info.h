// SPDX-License-Identifier: MIT
// What the program learns about one plug-in.
//
// Building a record asks the plug-in everything that can be asked about it, which is the point of building
// one. Records are plain values; nothing points into them. Exceptions of the plug-in pass through; memory for
// a count that cannot be had is the int -1.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "describe/param_info.h"
#include "describe/variants.h"
#include "loader/plugin_identity.h"

class VSTWrapper;

namespace KelVSTInfoCache {

struct VSTInfo {
  /// From a live instance, or, where `wrapper` is null, an invalid record: placeholders and the name in
  /// `spec`.
  VSTInfo(VSTWrapper* wrapper, const VST_Class_Spec& spec);

  /// Asks the plug-in for everything. `wrapper` holds an instance.
  void refresh(VSTWrapper* wrapper, const VST_Class_Spec& spec);

  /// Becomes an invalid record. One variant is appended: mono in, mono out, accepted.
  void setToInvalid(const VST_Class_Spec& spec);

  /// All but the variants. Parameters are appended.
  void BuildBasicInfo(VSTWrapper* wrapper);

  /// Asks a shell for its children; duplicates are kept, in the plug-in's order. True when the set of
  /// children has changed. A shell that names no end of children is the int -1.
  bool refreshChildIDs(VSTWrapper* wrapper);

  /// The variants that fit the plug-in's channel counts, in table order; may be empty. Makes no request.
  /// On purpose: a plug-in with exactly one input counts as one without inputs.
  /// On purpose: none of the variants is accepted.
  static std::vector<VSTVariant> BuildVariants(VSTWrapper* wrapper, bool isSynth);

  std::string effectName;
  std::string vendorName;
  VstInt32 uniqueID = 0;
  std::int64_t dllTag = 0;        ///< The bundle's.
  VstInt32 vstVersion = 0;        ///< The answer to effGetVstVersion (58), such as 2400.
  std::uint32_t statusFlags = 1;  ///< refresh() clears bit 0x100000.
  bool isSynth = false;           ///< By category.
  bool receivesMidi = false;      ///< On purpose: any answer but 0 counts, so does -1 ("no").
  bool sendsMidi = false;         ///< Likewise.
  bool isShell = false;           ///< By category.
  bool hasEditor = false;
  bool wrapperFlag = false;             ///< The wrapper's auxFlag.
  std::vector<ParamInfo> params;        ///< In index order; none for a shell.
  std::vector<VST_ChildSpec> childIDs;  ///< A shell's children.
  std::vector<VSTVariant> variants;
};

}  // namespace KelVSTInfoCache
