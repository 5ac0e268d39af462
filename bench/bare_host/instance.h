// SPDX-License-Identifier: MIT
/* One plug-in instance in the bare host: created and asked with the program's requests and buffers. */
#pragma once

#include <string.h>

#include "interface.h"

static inline intptr_t request(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr,
                               float opt) {
  return effect->dispatcher(effect, opcode, index, value, ptr, opt);
}

static inline intptr_t ask(AEffect* effect, int32_t opcode) {
  return request(effect, opcode, 0, 0, NULL, 0.0f);
}

static inline intptr_t askText(AEffect* effect, int32_t opcode, int32_t index, char* text, size_t size) {
  memset(text, 0, size);
  return request(effect, opcode, index, 0, text, 0.0f);
}

/* Stores the value in memory, as the program does: a register may keep more bits. */
static inline float getParameter(AEffect* effect, int32_t index) {
  const volatile float value = effect->getParameter(effect, index);
  return value;
}

static inline void setParameter(AEffect* effect, int32_t index, float value) {
  if (getParameter(effect, index) != value) effect->setParameter(effect, index, value);
}

static inline int32_t currentProgram(AEffect* effect) { return (int32_t)ask(effect, effGetProgram); }

enum { kNameBuffer = 114, kParameterNameBuffer = 500, kTextBuffer = 256 };

/* Loads the module and finds its entry point; ends the process when there is none. */
EntryPoint* loadEntry(const char* path);
/* Creates and opens an instance. `child` is the child of a shell, 0 for none. */
AEffect* createInstance(EntryPoint* entry, int32_t child);

void selectProgram(AEffect* effect, int32_t program);
void currentProgramName(AEffect* effect, char name[kTextBuffer]);
/* The given program's name. The caller does not use the name of a program that is not the current one. */
void nameOfProgram(AEffect* effect, int32_t program, char name[kTextBuffer]);
void renameProgram(AEffect* effect, int32_t program, const char* name);

void effectName(AEffect* effect);
void vendorName(AEffect* effect);
void canDo(AEffect* effect, const char* capability);
