// SPDX-License-Identifier: MIT
// What a plug-in is: everything that it tells a host about itself.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "describe/vst_info.h"
#include "host/vst_wrapper.h"
#include "loader/plugin_identity.h"

/// One answer to effGetInputProperties (33) or effGetOutputProperties (34).
struct PinDescription {
  std::string label;
  std::string shortLabel;
  VstInt32 flags = 0;                               ///< VstPinPropertiesFlags
  std::optional<VstInt32> speakerArrangement = {};  ///< Where the flags say that it is meaningful.
};

/// A plain value. Nothing of it refers to the instance.
struct PluginDescription {
  /// Asks an instance. Makes each request once, except for those that the record `info` makes as well: the
  /// category (35) and, where the plug-in has no effect name, the product (48).
  /// On purpose: as in every description record, a parameter with integer steps is left at its last one.
  /// Throws the int -1 where a count is too large to be true: more than 2^16 pins, or 2^20 programs or
  /// parameters. What the plug-in throws passes.
  PluginDescription(VSTWrapper& wrapper, const VST_Class_Spec& spec);

  VST_Class_Spec identity;
  VstInt32 category;                    ///< effGetPlugCategory (35), a VstPlugCategory value.
  std::vector<std::string> valueTexts;  ///< effGetParamDisplay (7) of each parameter's current value.
  KelVSTInfoCache::VSTInfo info;
  std::optional<std::string> product;  ///< effGetProductString (48); nothing where it is not answered.
  VstInt32 vendorVersion;              ///< effGetVendorVersion (49)
  VstInt32 version;                    ///< AEffect::version
  VstInt32 flags;                      ///< VstAEffectFlags
  VstInt32 latencyInSamples;           ///< AEffect::initialDelay
  std::vector<std::optional<PinDescription>> inputs;  ///< Nothing for a pin whose request is not answered.
  std::vector<std::optional<PinDescription>> outputs;
  VstInt32 currentProgram = 0;                       ///< effGetProgram (3)
  std::vector<std::optional<std::string>> programs;  ///< effGetProgramNameIndexed (29); see the source.
};
