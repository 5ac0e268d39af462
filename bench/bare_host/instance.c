// SPDX-License-Identifier: MIT
#include "instance.h"

#include <dlfcn.h>
#include <stdio.h>
#include <stdlib.h>

#include "host.h"

EntryPoint* loadEntry(const char* path) {
  void* module = dlopen(path, RTLD_NOW | RTLD_LOCAL);
  if (module == NULL) {
    fprintf(stderr, "bare_host: %s\n", dlerror());
    exit(3);
  }
  static const char* const kNames[] = {"VSTPluginMain", "main_macho", "main"};
  for (size_t i = 0; i < sizeof kNames / sizeof *kNames; ++i) {
    void* symbol = dlsym(module, kNames[i]);
    EntryPoint* entry = NULL;
    memcpy(&entry, &symbol, sizeof entry);
    if (entry != NULL) return entry;
  }
  fprintf(stderr, "bare_host: no entry point in %s\n", path);
  exit(3);
}

AEffect* createInstance(EntryPoint* entry, int32_t child) {
  hostCurrentChild = child;
  AEffect* effect = entry(hostCallback);
  if (effect == NULL) {
    fprintf(stderr, "bare_host: no instance\n");
    exit(7);
  }
  effect->resvd2 = (intptr_t)&hostCurrentChild;
  ask(effect, effIdentify);
  request(effect, effSetSampleRate, 0, 0, NULL, 44100.0f);
  request(effect, effSetBlockSize, 0, 512, NULL, 0.0f);
  ask(effect, effOpen);
  ask(effect, effSetProgram);
  for (int32_t i = effect->numInputs; i > 0; --i) request(effect, effConnectInput, i - 1, 1, NULL, 0.0f);
  for (int32_t i = effect->numOutputs; i > 0; --i) request(effect, effConnectOutput, i - 1, 1, NULL, 0.0f);
  canDo(effect, "hasCockosExtensions");
  hostCurrentChild = 0;
  return effect;
}

void selectProgram(AEffect* effect, int32_t program) {
  if (effect->numPrograms <= 0 || program == currentProgram(effect)) return;
  if (program >= effect->numPrograms) program = effect->numPrograms - 1;
  if (program < 0) program = 0;
  request(effect, effSetProgram, 0, program, NULL, 0.0f);
}

void currentProgramName(AEffect* effect, char name[kTextBuffer]) {
  askText(effect, effGetProgramName, 0, name, kTextBuffer);
  name[kTextBuffer - 1] = '\0';
  currentProgram(effect);
}

void nameOfProgram(AEffect* effect, int32_t program, char name[kTextBuffer]) {
  if (program == currentProgram(effect)) {
    currentProgramName(effect, name);
    return;
  }
  memset(name, 0, kTextBuffer);
  request(effect, effGetProgramNameIndexed, program, -1, name, 0.0f);
}

void renameProgram(AEffect* effect, int32_t program, const char* name) {
  if (program != currentProgram(effect) || effect->numPrograms <= 0) return;
  char present[kTextBuffer];
  currentProgramName(effect, present);
  if (strcmp(present, name) == 0) return;
  char sent[25] = {0};
  memcpy(sent, name, strnlen(name, sizeof sent - 1));
  request(effect, effSetProgramName, 0, 0, sent, 0.0f);
}

void effectName(AEffect* effect) {
  char name[kNameBuffer];
  if (askText(effect, effGetEffectName, 0, name, sizeof name) != 0) return;
  request(effect, effGetProductString, 0, 0, name, 0.0f);
}

/* The program also asks one maker's sampler for its name; no plug-in measured here is of that maker. */
void vendorName(AEffect* effect) {
  char name[kNameBuffer];
  askText(effect, effGetVendorString, 0, name, sizeof name);
}

void canDo(AEffect* effect, const char* capability) {
  char text[32];
  request(effect, effCanDo, 0, 0, strcpy(text, capability), 0.0f);
}
