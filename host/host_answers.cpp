// SPDX-License-Identifier: MIT
#include "host/host_answers.h"

#include <cstring>

#include "platform/core_foundation.h"

namespace {

struct Capability {
  const char* name;
  VstInt32 answer;
};

// On purpose: the host claims capabilities that the callback does not serve (it answers audioMasterGetTime,
// 7, and audioMasterSizeWindow, 15, with 0).
constexpr Capability kCapabilities[] = {
    {"sendVstEvents", 1},
    {"sendVstMidiEvent", 1},
    {"sendVstTimeInfo", 1},
    {"receiveVstEvents", 1},
    {"receiveVstMidiEvent", 1},
    {"reportConnectionChanges", 1},
    {"acceptIOChanges", 0},
    {"sizeWindow", 1},
    {"offline", 0},
    {"openFileSelector", 0},
    {"closeFileSelector", 0},
    {"startStopProcess", 0},
    {"shellCategory", 1},
    {"sendVstMidiEventFlagIsRealtime", 1},
};

struct Language {
  char code[3];
  VstHostLanguage language;
};

constexpr Language kLanguages[] = {
    {"en", kVstLangEnglish}, {"de", kVstLangGerman},  {"fr", kVstLangFrench},
    {"it", kVstLangItalian}, {"es", kVstLangSpanish}, {"ja", kVstLangJapanese},
};

}  // namespace

VstInt32 hostCanDo(const char* capability) {
  for (const Capability& row : kCapabilities) {
    if (std::strcmp(capability, row.name) == 0) return row.answer;
  }
  return 0;
}

VstHostLanguage languageFor(const char* localeIdentifier) {
  for (const Language& row : kLanguages) {
    if (std::strncmp(localeIdentifier, row.code, 2) == 0) return row.language;
  }
  return kVstLangEnglish;
}

VstHostLanguage currentLanguage() {
  // On purpose: the locale is not released.
  // NOLINTBEGIN(clang-analyzer-osx.cocoa.RetainCount)
  CFLocaleRef locale = CFLocaleCopyCurrent();
  char identifier[255];
  if (!CFStringGetCString(CFLocaleGetIdentifier(locale), identifier, sizeof identifier,
                          kCFStringEncodingASCII)) {
    return kVstLangEnglish;
  }
  return languageFor(identifier);
  // NOLINTEND(clang-analyzer-osx.cocoa.RetainCount)
}

VstInt32 packedVersion(const KelClientVersion& version) {
  return version.major << 24 | version.minor << 16 | version.third;
}
