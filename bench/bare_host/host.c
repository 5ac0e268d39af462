// SPDX-License-Identifier: MIT
#include "host.h"

#include <stdlib.h>
#include <string.h>

enum {
  hostVersion = 1,
  hostCurrentId = 2,
  hostGetVendorString = 32,
  hostGetProductString = 33,
  hostGetVendorVersion = 34,
  hostCanDo = 37,
  hostGetLanguage = 38
};

int32_t hostCurrentChild = 0;

static intptr_t answerCanDo(const char* capability) {
  static const char* const kClaimed[] = {
      "sendVstEvents",    "sendVstMidiEvent",    "sendVstTimeInfo",
      "receiveVstEvents", "receiveVstMidiEvent", "reportConnectionChanges",
      "sizeWindow",       "shellCategory",       "sendVstMidiEventFlagIsRealtime",
  };
  for (size_t i = 0; i < sizeof kClaimed / sizeof *kClaimed; ++i) {
    if (strcmp(capability, kClaimed[i]) == 0) return 1;
  }
  return 0;
}

static intptr_t answerLanguage(void) {
  static const char* const kVariables[] = {"LC_ALL", "LC_MESSAGES", "LANG"};
  static const char kLanguages[][3] = {"en", "de", "fr", "it", "es", "ja"};
  const char* locale = NULL;
  for (size_t i = 0; i < 3 && (locale == NULL || *locale == '\0'); ++i) locale = getenv(kVariables[i]);
  for (intptr_t i = 0; locale != NULL && i < 6; ++i) {
    if (strncmp(locale, kLanguages[i], 2) == 0) return i + 1;
  }
  return 1;
}

intptr_t hostCallback(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt) {
  (void)effect, (void)index, (void)value, (void)opt;
  switch (opcode) {
    case hostVersion:
      return 2400;
    case hostCurrentId:
      return hostCurrentChild;
    case hostGetVendorString:
      strcpy(ptr, "NIDU");
      return 0;
    case hostGetProductString:
      memset(ptr, 0, 64);
      strcpy(ptr, "com.nidu.kel");
      return 0;
    case hostGetVendorVersion:
      return 8 << 24;
    case hostCanDo:
      return answerCanDo(ptr);
    case hostGetLanguage:
      return answerLanguage();
    default:
      return 0;
  }
}
