// SPDX-License-Identifier: MIT
// audioMasterCanDo (37): the capabilities that the host claims.
#include <cctype>
#include <string>

#include "gtest/gtest.h"
#include "host/host_answers.h"
#include "host/vst_wrapper.h"
#include "tests/host/named_case.h"

namespace {

struct CapabilityCase {
  const char* name;
  VstInt32 answer;
};

// On purpose, the host claims what it does not serve: it answers audioMasterGetTime (7) and
// audioMasterSizeWindow (15) with 0.
const CapabilityCase kCapabilities[] = {
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

class HostCanDo : public testing::TestWithParam<CapabilityCase> {
 protected:
  /// Both doors: the table, and the callback that plug-ins reach it through.
  static void expectAnswer(const std::string& capability, VstInt32 answer) {
    EXPECT_EQ(hostCanDo(capability.c_str()), answer) << '"' << capability << '"';
    std::string text = capability;
    EXPECT_EQ(VSTWrapper::masterCallback(nullptr, 37, 0, 0, text.data(), 0.0f), answer)
        << '"' << capability << '"';
    EXPECT_EQ(text, capability);
  }

  const std::string capability = GetParam().name;
};

TEST_P(HostCanDo, AnswersTheWholeText) { expectAnswer(capability, GetParam().answer); }

TEST_P(HostCanDo, AnswersZeroInOtherCapitals) {
  std::string upper = capability;
  std::string lower = capability;
  std::string capitalised = capability;
  for (char& letter : upper) letter = static_cast<char>(std::toupper(letter));
  for (char& letter : lower) letter = static_cast<char>(std::tolower(letter));
  capitalised[0] = static_cast<char>(std::toupper(capitalised[0]));
  expectAnswer(upper, 0);
  expectAnswer(capitalised, 0);
  // "offline" has no capitals to lose.
  expectAnswer(lower, lower == capability ? GetParam().answer : 0);
}

TEST_P(HostCanDo, AnswersZeroWithABlankOrMoreAroundIt) {
  expectAnswer(capability + ' ', 0);
  expectAnswer(' ' + capability, 0);
  expectAnswer(capability + 's', 0);
  expectAnswer('x' + capability, 0);
  expectAnswer(capability + capability, 0);
}

TEST_P(HostCanDo, AnswersZeroToABeginningThatIsNoCapabilityItself) {
  for (std::size_t length = 0; length < capability.size(); ++length) {
    const std::string beginning = capability.substr(0, length);
    // The last row begins with the second.
    expectAnswer(beginning, beginning == "sendVstMidiEvent" ? 1 : 0);
  }
}

INSTANTIATE_TEST_SUITE_P(Each, HostCanDo, testing::ValuesIn(kCapabilities),
                         host_tests::nameOfCase<CapabilityCase>);

TEST(HostCanDoOthers, AnswersZeroToWhatOtherHostsClaim) {
  for (const char* capability :
       {"", "supplyIdle", "supportShell", "asyncProcessing", "editFile", "getChunkFile", "startStopProcess2",
        "hasCockosExtensions", "receiveVstTimeInfo", "midiProgramNames", "NIDU"}) {
    EXPECT_EQ(hostCanDo(capability), 0) << capability;
  }
}

}  // namespace
