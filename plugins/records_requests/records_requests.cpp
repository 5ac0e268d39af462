// SPDX-License-Identifier: MIT
// An effect that records what its host does with it: 2 inputs, 3 outputs, 3 programs, 3 parameters (the last
// one stepped). Used by end_to_end_tests and bench_tests. It writes to the file named in
// RECORDS_REQUESTS_LOG, one line for each event:
//
//   INSTANCE entry
//   INSTANCE dispatch OPCODE index INDEX value VALUE ptr CONTENT opt NUMBER
//   INSTANCE getParameter INDEX answers NUMBER
//   INSTANCE setParameter INDEX value NUMBER
//
// INSTANCE counts from 1. CONTENT is that of describePointer(). With RECORDS_REQUESTS_CHUNKS=1 the state is
// saved in chunks; with RECORDS_REQUESTS_UNNAMED_PROGRAMS=1 effGetProgramNameIndexed (29) is answered with 0.
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "plugins/base/sample_plugin.h"
#include "plugins/records_requests/pointer_content.h"

using namespace sample_plugins;

namespace {

bool isAskedFor(const char* variable) {
  const char* value = std::getenv(variable);
  return value != nullptr && std::strcmp(value, "1") == 0;
}

Description describe() {
  Description description{"Records requests", fourCharacterCode('R', 'e', 'c', 'R')};
  description.numInputs = 2;
  description.numOutputs = 3;
  description.parameters = {{"First", "a", 0.25f}, {"Second", "b", 0.5f}, {"Steps", "", 0.0f, 0, 4}};
  description.programNames = {"One", "Two", "Three"};
  if (isAskedFor("RECORDS_REQUESTS_CHUNKS")) description.flags = effFlagsProgramChunks;
  return description;
}

/// The log, opened once; null when no file is named.
std::FILE* log() {
  static std::FILE* const file = [] {
    const char* path = std::getenv("RECORDS_REQUESTS_LOG");
    std::FILE* opened = path == nullptr ? nullptr : std::fopen(path, "a");
    if (path != nullptr && opened == nullptr) std::abort();
    return opened;
  }();
  return file;
}

class RecordsRequests : public SamplePlugin {
 public:
  explicit RecordsRequests(audioMasterCallback host) : SamplePlugin(host, describe()), instance(++instances) {
    write("entry");
  }

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    write("dispatch " + std::to_string(opcode) + " index " + std::to_string(index) + " value " +
          describeValue(opcode, value) + " ptr " + describePointer(opcode, value, ptr) + " opt " +
          numberText(opt));
    if (opcode == effGetProgramNameIndexed && hidesNames) return 0;
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }

  float getParameter(VstInt32 index) override {
    const float answer = SamplePlugin::getParameter(index);
    write("getParameter " + std::to_string(index) + " answers " + numberText(answer));
    return answer;
  }

  void setParameter(VstInt32 index, float value) override {
    write("setParameter " + std::to_string(index) + " value " + numberText(value));
    SamplePlugin::setParameter(index, value);
  }

 private:
  void write(const std::string& event) const {
    if (log() == nullptr) return;
    std::fprintf(log(), "%d %s\n", instance, event.c_str());
    std::fflush(log());
  }

  static inline int instances = 0;
  const int instance;
  const bool hidesNames = isAskedFor("RECORDS_REQUESTS_UNNAMED_PROGRAMS");
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<RecordsRequests>(host);
}
