// SPDX-License-Identifier: MIT
#include "presets.h"

#include <stdlib.h>

#include "instance.h"

enum { kStoreName = 64, kNameAt = 28, kNameSize = 28, kProgramContentAt = 56, kBankContentAt = 156 };

static void* memory(size_t size) {
  void* made = malloc(size);
  if (made == NULL) abort();
  return made;
}

static int hasChunks(const AEffect* effect) { return (effect->flags & kProgramChunks) != 0; }

static size_t programSize(const AEffect* effect) {
  return kProgramContentAt + sizeof(float) * (size_t)effect->numParams;
}

static void writeNumber(char* at, uint32_t number) {
  const uint32_t reversed = __builtin_bswap32(number);
  memcpy(at, &reversed, sizeof reversed);
}

static uint32_t readNumber(const char* at) {
  uint32_t reversed;
  memcpy(&reversed, at, sizeof reversed);
  return __builtin_bswap32(reversed);
}

static void writeHeader(char* at, const char* form, const AEffect* effect, int32_t count) {
  memcpy(at, "CcnK\0\0\0\0", 8);
  memcpy(at + 8, form, 4);
  writeNumber(at + 12, 1);
  writeNumber(at + 16, (uint32_t)effect->uniqueID);
  writeNumber(at + 20, (uint32_t)effect->version);
  writeNumber(at + 24, (uint32_t)count);
}

static void writeName(AEffect* effect, char* program) {
  char name[kTextBuffer];
  currentProgramName(effect, name);
  memset(program + kNameAt, 0, kNameSize);
  memcpy(program + kNameAt, name, strnlen(name, kNameSize - 1));
}

static void writeProgram(AEffect* effect, char* at) {
  writeHeader(at, "FxCk", effect, effect->numParams);
  writeName(effect, at);
  char* place = at + kProgramContentAt;
  for (int32_t i = 0; i < effect->numParams; ++i, place += 4) {
    const float value = getParameter(effect, i);
    uint32_t word;
    memcpy(&word, &value, sizeof word);
    writeNumber(place, word);
  }
}

static void readProgram(AEffect* effect, const char* at) {
  renameProgram(effect, currentProgram(effect), at + kNameAt);
  const char* place = at + kProgramContentAt;
  for (int32_t i = 0; i < effect->numParams; ++i, place += 4) {
    const uint32_t word = readNumber(place);
    float value;
    memcpy(&value, &word, sizeof value);
    setParameter(effect, i, value);
  }
}

/* The current program's name and values, while others are visited. */
static char* setAside(AEffect* effect) {
  const size_t size = kStoreName + sizeof(float) * (size_t)effect->numParams;
  char* store = memory(size);
  memset(store, 0, size);
  char name[kTextBuffer];
  currentProgramName(effect, name);
  memcpy(store, name, strnlen(name, kStoreName - 1));
  for (int32_t i = 0; i < effect->numParams; ++i) {
    const float value = getParameter(effect, i);
    memcpy(store + kStoreName + sizeof value * (size_t)i, &value, sizeof value);
  }
  return store;
}

static void putBack(AEffect* effect, char* store) {
  renameProgram(effect, currentProgram(effect), store);
  for (int32_t i = 0; i < effect->numParams; ++i) {
    float value;
    memcpy(&value, store + kStoreName + sizeof value * (size_t)i, sizeof value);
    setParameter(effect, i, value);
  }
  free(store);
}

static State saveChunk(AEffect* effect, int asBank) {
  void* chunk = NULL;
  const size_t chunkSize = (size_t)request(effect, effGetChunk, !asBank, 0, &chunk, 0.0f);
  const size_t contentAt = asBank ? kBankContentAt : kProgramContentAt;
  const State state = {memory(contentAt + 4 + chunkSize), contentAt + 4 + chunkSize};
  memset(state.bytes, 0, contentAt);
  writeHeader(state.bytes, asBank ? "FBCh" : "FPCh", effect, effect->numPrograms);
  if (!asBank) writeName(effect, state.bytes);
  writeNumber(state.bytes + contentAt, (uint32_t)chunkSize);
  if (chunkSize > 0) memcpy(state.bytes + contentAt + 4, chunk, chunkSize);
  return state;
}

static State saveBank(AEffect* effect) {
  const int32_t programs = effect->numPrograms;
  const size_t stride = programSize(effect);
  const size_t size = kBankContentAt + stride * (size_t)(programs > 0 ? programs : 1);
  const State state = {memory(size), size};
  memset(state.bytes, 0, programs > 0 ? kBankContentAt : size);
  writeHeader(state.bytes, "FxBk", effect, programs);
  const int32_t current = currentProgram(effect);
  char* store = setAside(effect);
  writeProgram(effect, state.bytes + kBankContentAt + stride * (size_t)current);
  for (int32_t i = 0; i < programs; ++i) {
    if (i == current) continue;
    selectProgram(effect, i);
    writeProgram(effect, state.bytes + kBankContentAt + stride * (size_t)i);
  }
  selectProgram(effect, current);
  putBack(effect, store);
  return state;
}

static void loadBank(AEffect* effect, const char* bank) {
  const size_t stride = programSize(effect);
  const int32_t current = currentProgram(effect);
  for (int32_t i = 0; i < effect->numPrograms; ++i) {
    if (i == current) continue;
    selectProgram(effect, i);
    readProgram(effect, bank + kBankContentAt + stride * (size_t)i);
  }
  if (effect->numPrograms > 0) selectProgram(effect, current);
  readProgram(effect, bank + kBankContentAt + stride * (size_t)current);
}

/* Selects each program once when the plug-in does not name programs by their index. */
static void visitPrograms(AEffect* effect) {
  char name[kTextBuffer] = {0};
  if (effect->numPrograms < 1) return;
  if (request(effect, effGetProgramNameIndexed, 0, -1, name, 0.0f) != 0) return;
  const int32_t current = currentProgram(effect);
  char* store = setAside(effect);
  for (int32_t i = 0; i < effect->numPrograms; ++i) {
    selectProgram(effect, i);
    currentProgramName(effect, name);
  }
  selectProgram(effect, current);
  putBack(effect, store);
}

static void loadChunk(AEffect* effect, const State* state, int isBank) {
  const size_t contentAt = isBank ? kBankContentAt : kProgramContentAt;
  const size_t chunkSize = state->size - contentAt - 4;
  if (chunkSize > 0) {
    request(effect, effSetChunk, !isBank, (intptr_t)chunkSize, state->bytes + contentAt + 4, 0.0f);
    if (isBank) visitPrograms(effect);
  }
  if (!isBank) renameProgram(effect, currentProgram(effect), state->bytes + kNameAt);
}

State saveState(AEffect* effect, int asBank) {
  if (hasChunks(effect)) return saveChunk(effect, asBank);
  if (asBank) return saveBank(effect);
  const State state = {memory(programSize(effect)), programSize(effect)};
  writeProgram(effect, state.bytes);
  return state;
}

void loadState(AEffect* effect, const State* state, int isBank) {
  if (hasChunks(effect)) {
    loadChunk(effect, state, isBank);
  } else if (isBank) {
    loadBank(effect, state->bytes);
  } else {
    readProgram(effect, state->bytes);
  }
}
