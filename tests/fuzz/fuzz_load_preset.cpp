// SPDX-License-Identifier: MIT
// Fuzz target: loads arbitrary preset and bank data into a plug-in with arbitrary flags and counts.
//
// The input begins with five bytes for the plug-in: its flags, its numbers of programs and parameters and its
// current program as signed bytes, and a byte of bits (1: it names programs by their index, 2: it does not
// select programs). The data follows. The host reads sizes, names and values without checking where the data
// ends, so 512 further bytes follow the data; a read behind them is an error.
//
// A bank may claim 2^31 - 1 programs, all in the same place, so the plug-in throws after 3000 requests. In
// whatever state the plug-in is then, the host must be able to load the program that it saves.
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
constexpr std::size_t kReadableBytesBehindData = 512;
constexpr int kMostRequests = 3000;

struct TooManyRequests {};

void setUp(doubles::RecordingEffect& effect, const std::uint8_t* bytes) {
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

  setUp(effect, input);
  const std::size_t dataSize = size - kPluginBytes;
  const auto data = std::make_unique<char[]>(dataSize + kReadableBytesBehindData);
  if (dataSize > 0) std::memcpy(data.get(), input + kPluginBytes, dataSize);
  int requests = 0;
  effect.onRequest = [&requests](const doubles::Request&) {
    if (++requests > kMostRequests) throw TooManyRequests();
  };
  try {
    loadAndSave(*wrapper, data.get(), static_cast<int>(dataSize));
  } catch (const TooManyRequests&) {  // Thrown from a request, as plug-ins do.
  } catch (int) {                     // A negative number of parameters gave a size that cannot be allocated.
  }
  effect.onRequest = nullptr;
  return 0;
}
