// SPDX-License-Identifier: MIT
// An effect that makes every request of its host three times: in its entry point, when opened, when closed.
// Used by end_to_end_tests. It writes the answers to the file named in ASKS_HOST_LOG, one per line:
//
//   PLACE OPCODE answers NUMBER[, writes COUNT bytes "TEXT"]
//   PLACE canDo "CAPABILITY" answers NUMBER
//   PLACE service "NAME" answers 0 | a function that answers NUMBER
//
// PLACE is entry, open or close. COUNT is the number of bytes up to the last one that the host changed.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <memory>

#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

constexpr VstInt32 kVendorService = fourCharacterCode('N', 'I', 'D', 'U');

constexpr const char* kCapabilities[] = {
    "sendVstEvents",
    "sendVstMidiEvent",
    "sendVstTimeInfo",
    "receiveVstEvents",
    "receiveVstMidiEvent",
    "reportConnectionChanges",
    "acceptIOChanges",
    "sizeWindow",
    "offline",
    "openFileSelector",
    "closeFileSelector",
    "startStopProcess",
    "shellCategory",
    "sendVstMidiEventFlagIsRealtime",
};

/// The text itself, with a capital first letter, with a blank at the end, without its last letter, and with
/// one letter more.
std::vector<std::string> variantsOf(const std::string& text) {
  std::string otherCase = text;
  otherCase[0] = static_cast<char>(otherCase[0] - 'a' + 'A');
  return {text, otherCase, text + ' ', text.substr(0, text.size() - 1), text + 's'};
}

/// Makes all requests in one place.
class Questions {
 public:
  Questions(audioMasterCallback itsHost, AEffect* itsEffect, const char* itsPlace)
      : host(itsHost), effect(itsEffect), place(itsPlace) {}

  void askAll() {
    const char* path = std::getenv("ASKS_HOST_LOG");
    if (path == nullptr) return;
    log.reset(std::fopen(path, "a"));
    if (!log) std::abort();
    for (VstInt32 opcode = 0; opcode <= 60; ++opcode) askRequest(opcode);
    askRequest(1000);
    askRequest(-1);
    for (const char* capability : kCapabilities) {
      for (const std::string& text : variantsOf(capability)) askCapability(text);
    }
    askCapability("");
    for (const std::string& name : variantsOf("niduGetTrackSampleForCurBlock")) askService(name);
    askService("");
  }

 private:
  struct Close {
    void operator()(std::FILE* file) const { std::fclose(file); }
  };

  /// Makes a request with a buffer of 0xAA, so that every byte that the host writes can be seen.
  void askRequest(VstInt32 opcode) {
    constexpr char kUntouched = '\xAA';
    char buffer[128];
    std::fill(std::begin(buffer), std::end(buffer) - 1, kUntouched);
    *(std::end(buffer) - 1) = '\0';
    const VstIntPtr answer = host(effect, opcode, 0, 0, buffer, 0.0f);

    std::size_t written = sizeof buffer - 1;
    while (written > 0 && buffer[written - 1] == kUntouched) --written;
    std::fprintf(log.get(), "%s %d answers %lld", place, opcode, static_cast<long long>(answer));
    if (written > 0) {
      const std::string bytes(buffer, written);
      std::fprintf(log.get(), ", writes %zu bytes \"%s\"", written, bytes.c_str());
    }
    std::fputc('\n', log.get());
  }

  void askCapability(std::string text) {
    const VstIntPtr answer = host(effect, audioMasterCanDo, 0, 0, text.data(), 0.0f);
    std::fprintf(log.get(), "%s canDo \"%s\" answers %lld\n", place, text.c_str(),
                 static_cast<long long>(answer));
  }

  /// Index, value and opt are arbitrary: the host must ignore them.
  void askService(std::string name) {
    const VstIntPtr answer = host(effect, kVendorService, 3, -5, name.data(), 0.25f);
    std::fprintf(log.get(), "%s service \"%s\" answers ", place, name.c_str());
    if (answer == 0) {
      std::fputs("0\n", log.get());
      return;
    }
    const auto trackSample = reinterpret_cast<double (*)(AEffect*)>(answer);
    std::fprintf(log.get(), "a function that answers %g\n", trackSample(effect));
  }

  audioMasterCallback host;
  AEffect* effect;
  const char* place;
  std::unique_ptr<std::FILE, Close> log;
};

class AsksHost : public SamplePlugin {
 public:
  explicit AsksHost(audioMasterCallback host)
      : SamplePlugin(host, {"Asks its host", fourCharacterCode('A', 's', 'k', 's')}) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effOpen) Questions(hostCallback, effect(), "open").askAll();
    if (opcode == effClose) Questions(hostCallback, effect(), "close").askAll();
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  Questions(host, nullptr, "entry").askAll();
  return instantiate<AsksHost>(host);
}
