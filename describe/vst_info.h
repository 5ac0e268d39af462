// SPDX-License-Identifier: MIT
// The description of one plug-in.
//
// Building a record tests the plug-in too, since it makes every request for names, parameters and children.
// Records are plain values; nothing points into them.
//
// Failures: throws what the plug-in throws, and the int -1 for a parameter count that the memory cannot hold
//           and for a shell that never stops naming children.
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
  /// Describes a live instance. When `wrapper` is null, makes an invalid record: placeholders, and the name
  /// from `spec`.
  VSTInfo(VSTWrapper* wrapper, const VST_Class_Spec& spec);

  /// Describes the plug-in again. `wrapper` holds an instance; `spec` is not used.
  void refresh(VSTWrapper* wrapper, const VST_Class_Spec& spec);

  /// Becomes an invalid record. Appends one accepted variant, mono in and mono out, and keeps the others.
  void setToInvalid(const VST_Class_Spec& spec);

  /// Everything but the variants. Appends the parameters to those that are in the record already.
  void BuildBasicInfo(VSTWrapper* wrapper);

  /// Asks a shell for its children (effShellGetNextPlugin, 70) and keeps them in its order, duplicates
  /// included. True when a child is new, or when the former set of children has another size than the new
  /// list. Throws the int -1 when the shell names more than 2^20 children.
  bool refreshChildIDs(VSTWrapper* wrapper);

  /// The variants that fit the plug-in's channel counts, in table order; may be empty. `isSynth` selects the
  /// instrument rows. Makes no request.
  /// On purpose: a plug-in with exactly one input is treated like one without inputs.
  /// On purpose: none of the variants is accepted.
  static std::vector<VSTVariant> BuildVariants(VSTWrapper* wrapper, bool isSynth);

  std::string effectName;
  std::string vendorName;
  VstInt32 uniqueID = 0;
  std::int64_t dllTag = 0;        ///< The dllTag of the bundle's VST_DLL_Info.
  VstInt32 vstVersion = 0;        ///< The answer to effGetVstVersion (58), such as 2400.
  std::uint32_t statusFlags = 1;  ///< refresh() clears bit 0x100000.
  bool isSynth = false;           ///< The category is 2.
  bool receivesMidi = false;      ///< On purpose: true for any answer but 0, even for -1 ("no").
  bool sendsMidi = false;         ///< The same.
  bool isShell = false;           ///< The category is 10.
  bool hasEditor = false;
  bool wrapperFlag = false;             ///< The wrapper's auxFlag.
  std::vector<ParamInfo> params;        ///< In index order; none for a shell.
  std::vector<VST_ChildSpec> childIDs;  ///< A shell's children, in its order.
  std::vector<VSTVariant> variants;
};

}  // namespace KelVSTInfoCache
