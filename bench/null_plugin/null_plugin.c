// SPDX-License-Identifier: MIT
/* The null plug-in: answers every request with 0 in constant time, so that a run on it costs what its host
 * costs. The environment variables NULL_PLUGIN_PARAMETERS and NULL_PLUGIN_PROGRAMS set its counts;
 * NULL_PLUGIN_SEED seeds the random numbers, so that the host draws the same tests in each run. */
#include <stdint.h>
#include <stdlib.h>

#include "bench/bare_host/interface.h"

static intptr_t answerNothing(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr,
                              float opt) {
  (void)index, (void)value, (void)ptr, (void)opt;
  if (opcode == effClose) free(effect);
  return 0;
}

static void ignoreValue(AEffect* effect, int32_t index, float value) {
  (void)effect, (void)index, (void)value;
}

static float noValue(AEffect* effect, int32_t index) {
  (void)effect, (void)index;
  return 0.0f;
}

static int32_t countFrom(const char* variable) {
  const char* text = getenv(variable);
  return text == NULL ? 0 : (int32_t)strtol(text, NULL, 10);
}

__attribute__((visibility("default"))) AEffect* VSTPluginMain(HostCallback* host) {
  (void)host;
  AEffect* effect = calloc(1, sizeof(AEffect));
  if (effect == NULL) return NULL;
  effect->magic = 0x56737450;
  effect->dispatcher = answerNothing;
  effect->setParameter = ignoreValue;
  effect->getParameter = noValue;
  if (getenv("NULL_PLUGIN_SEED") != NULL) srand((unsigned)countFrom("NULL_PLUGIN_SEED"));
  effect->numParams = countFrom("NULL_PLUGIN_PARAMETERS");
  effect->numPrograms = countFrom("NULL_PLUGIN_PROGRAMS");
  return effect;
}
