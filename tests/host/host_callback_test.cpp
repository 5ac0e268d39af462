// SPDX-License-Identifier: MIT
// VSTWrapper::masterCallback: the answer to every request that a plug-in can make, and what stands behind the
// answers. Capabilities, the vendor's name and the one service are in tests/end_to_end/golden/host_callback.txt.
//
// On purpose: the host claims capabilities that it does not serve; it answers audioMasterGetTime (7) and
// audioMasterSizeWindow (15) with 0.
#include <climits>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "host/host_answers.h"
#include "host/host_identity.h"
#include "host/vst_wrapper.h"
#include "tests/host/named_case.h"
#include "tests/shared/recording_core_foundation.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr VstInt32 kNidu = 1313424469;  // 'NIDU'

VstIntPtr ask(VstInt32 opcode, void* ptr = nullptr) {
  return VSTWrapper::masterCallback(nullptr, opcode, 0, 0, ptr, 0.0f);
}

std::vector<VstInt32> someOpcodes() {
  std::vector<VstInt32> opcodes = {
      INT_MIN, -kNidu,    -37,       -2,         -1,     1000,
      2400,    kNidu - 1, kNidu + 1, 0x5544494E, INT_MAX};  // 0x5544494E is 'UDIN'
  for (VstInt32 opcode = 0; opcode <= 300; ++opcode) opcodes.push_back(opcode);
  return opcodes;
}

class VSTWrapperMasterCallback : public testing::Test {
 protected:
  doubles::RecordingCoreFoundation core_foundation;  // The locale is en_US.
};

TEST_F(VSTWrapperMasterCallback, AnswersByTheOpcodeAloneAndZeroToAllButFive) {
  const std::map<VstInt32, VstIntPtr> answers = {{1, 2400}, {34, 134217728}, {38, 1}};
  auto* const garbage = reinterpret_cast<AEffect*>(std::uintptr_t{1});
  for (const VstInt32 opcode : someOpcodes()) {
    SCOPED_TRACE("opcode " + std::to_string(opcode));
    const auto found = answers.find(opcode);
    const VstIntPtr answer = found == answers.end() ? 0 : found->second;
    char text[64] = {};
    EXPECT_EQ(VSTWrapper::masterCallback(nullptr, opcode, 0, 0, text, 0.0f), answer);
    EXPECT_EQ(VSTWrapper::masterCallback(garbage, opcode, -1, -1, text, -1.0f), answer);
    EXPECT_EQ(VSTWrapper::masterCallback(nullptr, opcode, INT_MAX, 4711, text, 1e30f), answer);
    if (opcode != 32 && opcode != 33 && opcode != 37) {
      EXPECT_EQ(ask(opcode, nullptr), answer);
    }
  }
}

TEST_F(VSTWrapperMasterCallback, WritesOnlyTheTwoNamesAndAsksTheSystemOnlyForTheLanguage) {
  for (const VstInt32 opcode : someOpcodes()) {
    if (opcode == 32 || opcode == 33 || opcode == 38) continue;
    std::string text(80, 'z');
    ask(opcode, text.data());
    EXPECT_EQ(text, std::string(80, 'z')) << "opcode " << opcode;
  }
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
}

// On purpose: answered with 0 although the text is written.
TEST_F(VSTWrapperMasterCallback, WritesTheProductInto64BytesZeroPaddedAndAnswersZero) {
  std::string text(80, 'z');
  EXPECT_EQ(ask(33, text.data()), 0);
  EXPECT_EQ(text, "com.nidu.kel" + std::string(52, '\0') + std::string(16, 'z'));
}

// On purpose: the service has an opcode of its own.
TEST_F(VSTWrapperMasterCallback, ReturnsNoServiceThroughVendorSpecific) {
  char name[] = "niduGetTrackSampleForCurBlock";
  EXPECT_EQ(VSTWrapper::masterCallback(nullptr, 35, kNidu, kNidu, name, 0.0f), 0);
}

// ---- audioMasterGetLanguage (38)

struct LocaleCase {
  const char* name;
  const char* identifier;
  VstInt32 language;
};

class HostLanguage : public testing::TestWithParam<LocaleCase> {
 protected:
  doubles::RecordingCoreFoundation core_foundation;
};

TEST_P(HostLanguage, IsDecidedByTheFirstTwoCharacters) {
  core_foundation.setLocale(GetParam().identifier);
  EXPECT_EQ(ask(38), GetParam().language);
}

INSTANTIATE_TEST_SUITE_P(
    Of, HostLanguage,
    testing::Values(LocaleCase{"English", "en", 1}, LocaleCase{"German", "de", 2},
                    LocaleCase{"SwissGerman", "de_CH", 2}, LocaleCase{"CanadianFrench", "fr_CA", 3},
                    LocaleCase{"Italian", "it_IT", 4}, LocaleCase{"MexicanSpanish", "es_MX", 5},
                    LocaleCase{"Japanese", "ja_JP", 6}, LocaleCase{"BrazilianPortuguese", "pt_BR", 1},
                    LocaleCase{"Danish", "da_DK", 1}, LocaleCase{"LowerSorbian", "dsb", 1},
                    LocaleCase{"ThreeLettersBeginningWithTwo", "den", 2}, LocaleCase{"UpperCase", "DE", 1},
                    LocaleCase{"LeadingBlank", " de", 1}, LocaleCase{"OneLetter", "d", 1},
                    LocaleCase{"Nothing", "", 1}),
    host_tests::nameOfCase<LocaleCase>);

class HostLanguageOfJapan : public testing::Test {
 protected:
  HostLanguageOfJapan() { core_foundation.setLocale("ja_JP"); }
  doubles::RecordingCoreFoundation core_foundation;
};

// On purpose: the locale is not released.
TEST_F(HostLanguageOfJapan, IsReadFromALocaleThatIsCopiedAndNotReleased) {
  EXPECT_EQ(ask(38), 6);
  EXPECT_THAT(core_foundation.calls(),
              ElementsAre("CFLocaleCopyCurrent() -> locale", "CFLocaleGetIdentifier(\"ja_JP\") -> string",
                          "CFStringGetCString(\"ja_JP\", 255 bytes, ASCII) -> true"));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("locale \"ja_JP\""));
  core_foundation.setLocale("de_CH");
  EXPECT_EQ(ask(38), 2);  // The locale is read anew each time.
}

TEST_F(HostLanguageOfJapan, IsEnglishIfTheIdentifierCannotBeConverted) {
  core_foundation.setLocale("ja_" + std::string(251, 'x'));  // 254 characters and the zero byte
  EXPECT_EQ(ask(38), 6);
  core_foundation.setLocale("ja_" + std::string(252, 'x'));
  EXPECT_EQ(ask(38), 1);
  core_foundation.setLocale("ja_\xC3\xA9");
  EXPECT_EQ(ask(38), 1);
  core_foundation.setLocale("ja_JP");
  core_foundation.failStep(doubles::Step::kGetCString);
  EXPECT_EQ(ask(38), 1);
}

// ---- Identity

TEST(PackedVersion, JoinsThePartsByOr) {
  EXPECT_EQ(packedVersion({1, 2, 3}), 0x01020003);
  EXPECT_EQ(packedVersion({127, 255, 65535}), 2147483647);
  // A part that is too large does not carry into the next one.
  EXPECT_EQ(packedVersion({0, 1, 65536}), 65536);
  EXPECT_EQ(packedVersion({1, 256, 0}), 16777216);
}

}  // namespace
