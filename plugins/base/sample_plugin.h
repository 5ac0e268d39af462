// SPDX-License-Identifier: MIT
// What all sample plug-ins share: the interface's record, its C functions, and a working answer to every
// request that a host makes while it tries a plug-in out.
//
// A sample derives from SamplePlugin, describes itself in a Description, overrides what makes it special, and
// exports its entry point:
//
//   SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) { return instantiate<Quiet>(host);
//   }
//
// Ownership: an instance owns itself from instantiate() until the host sends effClose (1).
// Threads:   the host's; nothing is locked.
#pragma once

#include <string>
#include <vector>

#include "vst2/aeffect.h"
#include "vst2/effect_opcodes.h"
#include "vst2/host_opcodes.h"
#include "vst2/properties.h"

/// Written before an entry point, makes it a C function that the host can find by its name.
#define SAMPLE_PLUGIN_EXPORT extern "C" __attribute__((visibility("default")))

namespace sample_plugins {

/// Longest texts of the interface, in bytes with the terminating zero.
constexpr std::size_t kParameterTextSize = 8;
constexpr std::size_t kProgramNameSize = 24;
constexpr std::size_t kEffectNameSize = 32;
constexpr std::size_t kPinLabelSize = 64;
constexpr std::size_t kVendorSize = 64;

/// Copies `text` to the host's buffer, cut to `size` bytes with the terminating zero.
void putText(void* buffer, const std::string& text, std::size_t size);

struct Parameter {
  std::string name;
  std::string label;    ///< Unit, as in "dB".
  float value;          ///< At the start, in every program.
  VstInt32 lowest = 0;  ///< With `highest` above it: a stepped parameter, whose properties give this range.
  VstInt32 highest = 0;
};

struct Program {
  std::string name;
  std::vector<float> values;  ///< One for each parameter.
};

/// What a sample says about itself.
struct Description {
  std::string name;
  VstInt32 uniqueID;
  VstInt32 category = kPlugCategEffect;  ///< VstPlugCategory
  VstInt32 numInputs = 2;
  VstInt32 numOutputs = 2;
  VstInt32 flags = 0;  ///< Further VstAEffectFlags; with effFlagsProgramChunks the state is saved in chunks.
  std::vector<Parameter> parameters = {};
  std::vector<std::string> programNames = {};
};

class SamplePlugin {
 public:
  SamplePlugin(audioMasterCallback host, const Description& description);
  SamplePlugin(const SamplePlugin&) = delete;
  SamplePlugin& operator=(const SamplePlugin&) = delete;
  virtual ~SamplePlugin() = default;

  AEffect* effect() { return &record; }

 protected:
  /// Every request arrives here. effClose (1) is answered like the others; the instance is deleted after it.
  virtual VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt);
  /// Called by the host alone: requests that read or set a value do not pass here.
  virtual float getParameter(VstInt32 index);
  virtual void setParameter(VstInt32 index, float value);
  /// Copies inputs to outputs; an output without an input is silent.
  virtual void process(float** inputs, float** outputs, VstInt32 frames);
  /// 1 yes, -1 no, 0 do not know. (effCanDo, 51)
  virtual VstIntPtr canDo(const std::string& capability);

  /// What the sample calls to make a request of its host.
  const audioMasterCallback hostCallback;

 private:
  friend struct CFunctions;

  bool isParameter(VstInt32 index) const;
  Program& currentProgram() { return programs[static_cast<std::size_t>(current)]; }

  VstIntPtr answerProgramRequest(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr);
  VstIntPtr answerParameterRequest(VstInt32 opcode, VstInt32 index, void* ptr);
  VstIntPtr fillProperties(VstInt32 index, VstParameterProperties& properties) const;
  VstIntPtr setFromText(VstInt32 index, const char* text);
  VstIntPtr fillPin(const char* label, VstInt32 index, VstInt32 count, VstPinProperties& pin) const;
  VstIntPtr saveChunk(bool isProgram, void** data);
  VstIntPtr loadChunk(bool isProgram, const void* data, std::size_t sizeInBytes);

  AEffect record;
  Description description;
  std::vector<Program> programs;  ///< At least one, so that the parameters have a place for their values.
  VstInt32 current = 0;
  std::vector<float> chunk;  ///< The last one saved; the host reads it in place.
};

/// Makes an instance of `Plugin`, or nothing for a host that does not even tell its version.
template <typename Plugin>
AEffect* instantiate(audioMasterCallback host) {
  if (host(nullptr, audioMasterVersion, 0, 0, nullptr, 0.0f) == 0) return nullptr;
  return (new Plugin(host))->effect();
}

}  // namespace sample_plugins
