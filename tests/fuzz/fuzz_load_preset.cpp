// SPDX-License-Identifier: MIT
// Fuzz target: preset and bank data from nowhere, loaded into a plug-in whose numbers are from nowhere too.
//
// Input: five bytes of plug-in (flags, programs, parameters, current program and bits: 1 names its programs
// by index, 2 does not select programs), then the data. The counts are signed bytes. The memory goes on for
// 512 bytes behind the data, since sizes, names and values are read without a look at where the data ends;
// whatever reads further is a find.
//
// A bank may claim two thousand million programs, all in the same place, so the plug-in throws after some
// thousand requests. Whatever state is reached: what is saved then as a program can be loaded again.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

#include "host/vst_wrapper.h"
#include "tests/shared/in_process_plugin.h"
#include "tests/shared/recording_core_foundation.h"
#include "tests/shared/recording_effect.h"

namespace {

constexpr std::size_t kPluginBytes = 5;
constexpr std::size_t kSlack = 512;
constexpr int kMostRequests = 3000;

struct GivesUp {};

void shape(doubles::RecordingEffect& effect, const std::uint8_t* bytes) {
  effect.aeffect.flags = bytes[0];
  effect.aeffect.numPrograms = static_cast<std::int8_t>(bytes[1]);
  effect.aeffect.numParams = static_cast<std::int8_t>(bytes[2]);
  effect.currentProgram = static_cast<std::int8_t>(bytes[3]);
  effect.namesProgramsByIndex = (bytes[4] & 1) != 0;
  if ((bytes[4] & 2) != 0) effect.ignore(effSetProgram);
}

void loadAndSave(VSTWrapper& wrapper, const char* data, int size) {
  wrapper.loadFromFXBData(data, size);
  AutoBuffer<char> saved;
  wrapper.saveToFXBData(saved, true);
  wrapper.saveToFXBData(saved, false);
  if (!wrapper.loadFromFXBData(saved.data(), saved.size())) std::abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* input, std::size_t size) {
  if (size < kPluginBytes) return -1;
  doubles::RecordingCoreFoundation core_foundation;
  doubles::InProcessPlugin plugin(core_foundation);
  doubles::RecordingEffect effect;
  plugin.willCreate(effect);
  NiduCOM::i_ptr<VSTPluginLoader> loader;
  loader.reset(new VSTPluginLoader(VST_DLL_Info("/test.vst", "test")), NiduCOM::AddRef::kAdopt);
  const std::unique_ptr<VSTWrapper> wrapper(VSTWrapper::New(loader, VST_ChildSpec(), nullptr));
  if (wrapper == nullptr) std::abort();

  shape(effect, input);
  const std::size_t dataSize = size - kPluginBytes;
  const auto data = std::make_unique<char[]>(dataSize + kSlack);
  if (dataSize > 0) std::memcpy(data.get(), input + kPluginBytes, dataSize);
  int requests = 0;
  effect.onRequest = [&requests](const doubles::Request&) {
    if (++requests > kMostRequests) throw GivesUp();
  };
  try {
    loadAndSave(*wrapper, data.get(), static_cast<int>(dataSize));
  } catch (const GivesUp&) {  // Thrown out of a request, as a plug-in may.
  }
  effect.onRequest = nullptr;
  return 0;
}
