// SPDX-License-Identifier: MIT
// VSTWrapper: creation, destruction and basic queries.
#include <exception>

#include "flight_recorder/flight_recorder.h"
#include "host/vst_wrapper.h"
#include "support/text_buffer.h"
#include "vst2/dispatch.h"

namespace {

constexpr double kSampleRateInHz = 44100.0;
constexpr int kBlockSizeInFrames = 512;
constexpr std::size_t kNameBufferSize = 114;
constexpr std::uint32_t kExtensionTokenMask = 0xFFFF0000u;
constexpr std::uint32_t kExtensionToken = 0xBEEF0000u;

/// The instance, or null when the entry point throws.
AEffect* callEntry(void* entry) {
  try {
    RequestUnderWay request(kFlightEntry);
    AEffect* const effect = reinterpret_cast<PluginEntryProc>(entry)(VSTWrapper::masterCallback);
    request.returned();
    return effect;
  } catch (...) {
    return nullptr;
  }
}

/// Makes the host callback answer with this child's identifier, until it is destroyed.
class CurrentLoadID {
 public:
  explicit CurrentLoadID(const VST_ChildSpec& child) {
    if (child.hasChildID) VSTWrapper::gCurrentLoadID = child.childID;
  }
  ~CurrentLoadID() { VSTWrapper::gCurrentLoadID = 0; }
  CurrentLoadID(const CurrentLoadID&) = delete;
  CurrentLoadID& operator=(const CurrentLoadID&) = delete;
};

}  // namespace

VstInt32 VSTWrapper::gCurrentLoadID = 0;

VSTWrapper* VSTWrapper::New(NiduCOM::i_ptr<VSTPluginLoader> module, const VST_ChildSpec& child,
                            KelVSTSupportEffect* support) {
  const CurrentLoadID currentLoadID(child);
  try {
    return new VSTWrapper(module, child, support);
  } catch (...) {
    return nullptr;
  }
}

VSTWrapper::VSTWrapper(const NiduCOM::i_ptr<VSTPluginLoader>& module, const VST_ChildSpec& child,
                       KelVSTSupportEffect* support)
    : loader(module), childSpec(child), supportEffect(support) {
  void* entry = loader->getMainEntry();
  nidu_FailNULL(entry);
  // On purpose: any instance is accepted; its magic number is not checked.
  effect = callEntry(entry);
  nidu_FailNULL(effect);
  effect->resvd2 = reinterpret_cast<VstIntPtr>(this);

  dispatch(*effect, effIdentify);
  setSampleRate(kSampleRateInHz);
  setBufferSize(kBlockSizeInFrames);
  dispatch(*effect, effOpen);
  dispatch(*effect, effSetProgram);
  connectAllPins();
  const auto answer =
      static_cast<std::uint32_t>(dispatch(*effect, effCanDo, 0, 0, textArgument("hasCockosExtensions")));
  hasCockosExtensions = (answer & kExtensionTokenMask) == kExtensionToken;
}

VSTWrapper::~VSTWrapper() noexcept(false) {
  if (effect == nullptr) return;
  const bool isUnwinding = std::uncaught_exceptions() > 0;
  try {
    if (mainsOn) {
      dispatch(*effect, effMainsChanged, 0, 0);
      mainsOn = false;
    }
    dispatch(*effect, effClose);
  } catch (...) {
    // A second exception during unwinding would end the process; the first one is the one to report.
    if (!isUnwinding) throw;
  }
}

void VSTWrapper::connectAllPins() {
  // On purpose: from the last pin down to the first.
  for (VstInt32 pins = effect->numInputs; pins > 0; --pins) dispatch(*effect, effConnectInput, pins - 1, 1);
  for (VstInt32 pins = effect->numOutputs; pins > 0; --pins) dispatch(*effect, effConnectOutput, pins - 1, 1);
}

VstInt32 VSTWrapper::getEffectCategory() const {
  return static_cast<VstInt32>(dispatch(*effect, effGetPlugCategory));
}

VstInt32 VSTWrapper::setSampleRate(double rate) {
  return static_cast<VstInt32>(dispatch(*effect, effSetSampleRate, 0, 0, nullptr, static_cast<float>(rate)));
}

VstInt32 VSTWrapper::setBufferSize(int frames) {
  return static_cast<VstInt32>(dispatch(*effect, effSetBlockSize, 0, frames));
}

bool VSTWrapper::setSpeakerArrangement(VstSpeakerArrangement* input, VstSpeakerArrangement* output) {
  return dispatch(*effect, effGetSpeakerArrangement, 0, reinterpret_cast<VstIntPtr>(input), output) != 0;
}

bool VSTWrapper::getInputProperties(int index, VstPinProperties& props) {
  return dispatch(*effect, effGetInputProperties, index, 0, &props) != 0;
}

bool VSTWrapper::getOutputProperties(int index, VstPinProperties& props) {
  return dispatch(*effect, effGetOutputProperties, index, 0, &props) != 0;
}

std::string VSTWrapper::getEffectName() {
  char name[kNameBufferSize];
  vst_zerostruct(name);
  if (dispatch(*effect, effGetEffectName, 0, 0, name) != 0) return textIn(name);
  if (dispatch(*effect, effGetProductString, 0, 0, name) != 0) return textIn(name);
  return childSpec.hasChildID ? childSpec.childName : loader->info.effectName;
}

std::string VSTWrapper::getManufacturerName() {
  char buffer[kNameBufferSize];
  vst_zerostruct(buffer);
  if (dispatch(*effect, effGetVendorString, 0, 0, buffer) == 0) return "unknown";
  std::string vendor = textIn(buffer);
  // On purpose: one maker's sampler reports its product name as the maker's name.
  if (vendor == "Play" && getEffectName() == "Play") return "EastWest";
  return vendor;
}

bool VSTWrapper::getNextShellPlugin(VST_ChildSpec& child) {
  char name[kNameBufferSize];
  vst_zerostruct(name);
  const auto id = static_cast<VstInt32>(dispatch(*effect, effShellGetNextPlugin, 0, 0, name));
  child.childName = textIn(name);
  child.childID = id;
  child.hasChildID = true;
  return id != 0;
}
