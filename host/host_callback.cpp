// SPDX-License-Identifier: MIT
// The host callback: the function that plug-ins call, and its answers.
//
// Threads: any thread of the plug-in. Reads VSTWrapper::gCurrentLoadID and no other state. It never looks at
//          the instance, so the answers are the same for all instances, also while an entry point runs.
#include <cstring>

#include "flight_recorder/flight_recorder.h"
#include "host/host_answers.h"
#include "host/host_identity.h"
#include "host/vst_wrapper.h"
#include "platform/thread_number.h"
#include "vst2/host_opcodes.h"

namespace {

constexpr VstInt32 kVstVersion = 2400;
constexpr VstInt32 kVendorCode = fourCharacterCode('N', 'I', 'D', 'U');
constexpr std::size_t kMaxProductLength = 64;

VstIntPtr vendorService(const char* name) {
  if (std::strcmp(name, "niduGetTrackSampleForCurBlock") != 0) return 0;
  return reinterpret_cast<VstIntPtr>(&VSTWrapper::trackSamplePosThunk);
}

}  // namespace

VstIntPtr VSTWrapper::masterCallback(AEffect*, VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr,
                                     float) {
  noteHostRequest(opcode, index, value, currentThreadNumber());
  char* text = static_cast<char*>(ptr);
  switch (opcode) {
    case audioMasterVersion:
      return kVstVersion;
    case audioMasterCurrentId:
      return gCurrentLoadID;
    case audioMasterGetVendorString:
      std::memcpy(text, "NIDU", sizeof "NIDU");
      return 0;  // On purpose: 0 although the text is written.
    case audioMasterGetProductString:
      std::strncpy(text, GetHostId().c_str(), kMaxProductLength);
      return 0;  // On purpose: 0 although the text is written.
    case audioMasterGetVendorVersion: {
      KelClientVersion version;
      GetHostVersion(version);
      return packedVersion(version);
    }
    case audioMasterCanDo:
      return hostCanDo(text);
    case audioMasterGetLanguage:
      return currentLanguage();
    case kVendorCode:
      return vendorService(text);
    default:
      return 0;
  }
}

double VSTWrapper::trackSamplePosThunk(AEffect*) { return 0.0; }
