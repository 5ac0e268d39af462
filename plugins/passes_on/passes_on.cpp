// SPDX-License-Identifier: MIT
// Stands between a host and the plug-in named in PASSES_ON_TO: hands every request on, and first writes it to
// the file named in PASSES_ON_LOG, one a line:
//
//   entry
//   dispatch OPCODE INDEX VALUE OPT     (a VALUE that is an address: "address")
//   getParameter INDEX
//   setParameter INDEX VALUE
//
// Every second call of the entry point seeds the C library's random numbers, so that the host draws the same
// tests in each run. Used by worker_conversation, which compares the logs of two programs. Written for trust:
// a plug-in's own record stays in use, only its three functions are put aside.
#include <cinttypes>
#include <cstdio>
#include <cstdlib>
#include <map>

#include <dlfcn.h>

#include "vst2/aeffect.h"
#include "vst2/effect_opcodes.h"

namespace {

constexpr unsigned kSeed = 20240229;

struct Functions {
  AEffectDispatcherProc dispatcher;
  AEffectGetParameterProc getParameter;
  AEffectSetParameterProc setParameter;
};

std::map<AEffect*, Functions>& functions() {
  static std::map<AEffect*, Functions> all;
  return all;
}

const char* settingOf(const char* variable) {
  const char* value = std::getenv(variable);
  if (value == nullptr) std::abort();
  return value;
}

std::FILE* log() {
  static std::FILE* const file = std::fopen(settingOf("PASSES_ON_LOG"), "a");
  if (file == nullptr) std::abort();
  return file;
}

bool isAddress(VstInt32 opcode) {
  return opcode == effSetSpeakerArrangement || opcode == effGetSpeakerArrangement;
}

VstIntPtr dispatch(AEffect* effect, VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) {
  if (isAddress(opcode)) {
    std::fprintf(log(), "dispatch %d %d address %a\n", static_cast<int>(opcode), static_cast<int>(index),
                 static_cast<double>(opt));
  } else {
    std::fprintf(log(), "dispatch %d %d %" PRId64 " %a\n", static_cast<int>(opcode), static_cast<int>(index),
                 static_cast<std::int64_t>(value), static_cast<double>(opt));
  }
  std::fflush(log());
  return functions()[effect].dispatcher(effect, opcode, index, value, ptr, opt);
}

float getParameter(AEffect* effect, VstInt32 index) {
  std::fprintf(log(), "getParameter %d\n", static_cast<int>(index));
  std::fflush(log());
  return functions()[effect].getParameter(effect, index);
}

void setParameter(AEffect* effect, VstInt32 index, float value) {
  std::fprintf(log(), "setParameter %d %a\n", static_cast<int>(index), static_cast<double>(value));
  std::fflush(log());
  functions()[effect].setParameter(effect, index, value);
}

PluginEntryProc entryOf(void* module) {
  for (const char* name : {"VSTPluginMain", "main_macho", "main"}) {
    if (void* entry = dlsym(module, name)) return reinterpret_cast<PluginEntryProc>(entry);
  }
  return nullptr;
}

}  // namespace

extern "C" __attribute__((visibility("default"))) AEffect* VSTPluginMain(audioMasterCallback host) {
  std::fputs("entry\n", log());
  std::fflush(log());
  static int instances = 0;
  if (++instances % 2 == 0) std::srand(kSeed);
  void* module = dlopen(settingOf("PASSES_ON_TO"), RTLD_NOW | RTLD_LOCAL);
  const PluginEntryProc entry = module == nullptr ? nullptr : entryOf(module);
  AEffect* effect = entry == nullptr ? nullptr : entry(host);
  if (effect == nullptr) return nullptr;
  functions()[effect] = {effect->dispatcher, effect->getParameter, effect->setParameter};
  effect->dispatcher = dispatch;
  effect->getParameter = getParameter;
  effect->setParameter = setParameter;
  return effect;
}
