// SPDX-License-Identifier: MIT
#include "describe/vst_info.h"

#include <functional>

#include "host/vst_wrapper.h"
#include "support/sorted_vector_set.h"
#include "vst2/dispatch.h"

namespace KelVSTInfoCache {
namespace {

constexpr std::uint32_t kNeedsRefresh = 0x100000;
constexpr VstInt32 kInvalidRecordVersion = 2400;

/// Far more children than any shell has: one that names more would never stop.
constexpr std::size_t kMostChildren = 1u << 20;

constexpr int kNoLimit = 100;

bool answersCapability(AEffect& effect, const char* capability) {
  return dispatch(effect, effCanDo, 0, 0, textArgument(capability)) != 0;
}

}  // namespace

VSTInfo::VSTInfo(VSTWrapper* wrapper, const VST_Class_Spec& spec) {
  if (wrapper != nullptr) {
    refresh(wrapper, spec);
  } else {
    setToInvalid(spec);
  }
}

void VSTInfo::refresh(VSTWrapper* wrapper, const VST_Class_Spec& /*spec*/) {
  BuildBasicInfo(wrapper);
  variants = BuildVariants(wrapper, isSynth);
  statusFlags &= ~kNeedsRefresh;
}

void VSTInfo::setToInvalid(const VST_Class_Spec& spec) {
  effectName = spec.getEffectName();
  vendorName = "unknown";
  uniqueID = 0;
  dllTag = 0;
  vstVersion = kInvalidRecordVersion;
  isSynth = false;
  receivesMidi = false;
  sendsMidi = false;
  isShell = false;
  hasEditor = true;
  wrapperFlag = true;
  statusFlags = 1;
  params.clear();
  childIDs.clear();
  variants.emplace_back(GetPrototypeVariants().front());
}

void VSTInfo::BuildBasicInfo(VSTWrapper* wrapper) {
  AEffect& effect = *wrapper->effect;
  effectName = wrapper->getEffectName();
  vendorName = wrapper->getManufacturerName();
  uniqueID = effect.uniqueID;
  {
    const NiduCOM::i_ptr<VSTPluginLoader> loader = wrapper->loader;
    dllTag = loader->info.dllTag;
  }
  vstVersion = static_cast<VstInt32>(dispatch(effect, effGetVstVersion));
  const VstInt32 category = wrapper->getEffectCategory();
  isSynth = category == kPlugCategSynth;
  isShell = category == kPlugCategShell;
  hasEditor = (effect.flags & effFlagsHasEditor) != 0;
  wrapperFlag = wrapper->auxFlag;
  receivesMidi = answersCapability(effect, "receiveVstMidiEvent");
  sendsMidi = answersCapability(effect, "sendVstMidiEvent");
  if (isShell) {
    refreshChildIDs(wrapper);
    return;
  }
  // Room for all at once, so that a count too large for the memory fails here and not minutes later.
  const VstInt32 count = effect.numParams;
  if (count > 0) allocateOrFail([&] { params.reserve(params.size() + static_cast<std::size_t>(count)); });
  for (VstInt32 index = 0; index < effect.numParams; ++index) {
    params.emplace_back(wrapper, index);
  }
}

bool VSTInfo::refreshChildIDs(VSTWrapper* wrapper) {
  sorted_vector_set<VST_ChildSpec, std::less<>> known;
  for (const VST_ChildSpec& child : childIDs) known.insert(child);
  childIDs.clear();
  bool changed = false;
  VST_ChildSpec child;
  while (wrapper->getNextShellPlugin(child)) {
    if (childIDs.size() == kMostChildren) throw -1;
    childIDs.push_back(child);
    if (known.find(child) == known.end()) changed = true;
  }
  return changed || known.size() != childIDs.size();
}

std::vector<VSTVariant> VSTInfo::BuildVariants(VSTWrapper* wrapper, bool isSynth) {
  const std::vector<PrototypeVSTVariant>& prototypes = GetPrototypeVariants();
  const VstInt32 first = isSynth ? kFirstInstrumentRow : kFirstEffectRow;
  const VstInt32 last = isSynth ? kLastInstrumentRow : kLastEffectRow;
  const VstInt32 numIns = wrapper->effect->numInputs;
  const VstInt32 numOuts = wrapper->effect->numOutputs > 0 ? wrapper->effect->numOutputs : 1;

  VSTBundle in = {0, 0};
  VSTBundle out = {0, 0};
  setupBundle(numOuts, kNoLimit, out);
  if (numIns > 1) setupBundle(numIns, out.mainChannels, in);

  std::vector<VSTVariant> fitting;
  for (VstInt32 row = first; row <= last; ++row) {
    const PrototypeVSTVariant& prototype = prototypes[static_cast<std::size_t>(row)];
    if (prototype.numIns > in.mainChannels || prototype.numOuts > out.mainChannels) continue;
    fitting.emplace_back(prototype, in, out);
  }
  return fitting;
}

}  // namespace KelVSTInfoCache
