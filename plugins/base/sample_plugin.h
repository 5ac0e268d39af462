// SPDX-License-Identifier: MIT
// The base of the sample plug-ins: the interface's record, its C functions, and a correct answer to every
// request that the program makes.
//
// A sample derives from SamplePlugin, passes it a Description, overrides what it does differently, and
// exports its entry point:
//
//   SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
//     return instantiate<Quiet>(host);
//   }
//
// Ownership: an instance lives until the host sends effClose (1), and deletes itself then.
// Threads:   not thread-safe.
#pragma once

#include <string>
#include <vector>

#include "vst2/aeffect.h"
#include "vst2/effect_opcodes.h"
#include "vst2/host_opcodes.h"
#include "vst2/properties.h"

/// Makes an entry point a C function that the module exports.
#define SAMPLE_PLUGIN_EXPORT extern "C" __attribute__((visibility("default")))

namespace sample_plugins {

/// The interface's text sizes in bytes, with the terminating zero.
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

/// What a sample tells the host about itself.
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
  /// Called by the host only: dispatcher requests that read or set a value do not call these two.
  virtual float getParameter(VstInt32 index);
  virtual void setParameter(VstInt32 index, float value);
  /// Copies each input to the output of the same number; further outputs are silent.
  virtual void process(float** inputs, float** outputs, VstInt32 frames);
  /// The answer to effCanDo (51): 1 yes, -1 no, 0 unknown.
  virtual VstIntPtr canDo(const std::string& capability);

  /// Call this to make a request of the host.
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
  std::vector<Program> programs;  ///< Never empty: the parameter values are kept here.
  VstInt32 current = 0;
  std::vector<float> chunk;  ///< The last one saved. The host gets a pointer to it.
};

/// Makes an instance of `Plugin`. Null when the host answers 0 to audioMasterVersion (1).
template <typename Plugin>
AEffect* instantiate(audioMasterCallback host) {
  if (host(nullptr, audioMasterVersion, 0, 0, nullptr, 0.0f) == 0) return nullptr;
  return (new Plugin(host))->effect();
}

}  // namespace sample_plugins
