// SPDX-License-Identifier: MIT
// audioMasterGetLanguage (38): the language of the user's locale.
#include <string>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "host/host_answers.h"
#include "host/vst_wrapper.h"
#include "tests/host/named_case.h"
#include "tests/shared/recording_core_foundation.h"

namespace {

using testing::ElementsAre;

struct LocaleCase {
  const char* name;
  const char* identifier;
  VstInt32 language;
};

class HostLanguage : public testing::TestWithParam<LocaleCase> {
 protected:
  HostLanguage() { core_foundation.setLocale(GetParam().identifier); }
  doubles::RecordingCoreFoundation core_foundation;
};

VstIntPtr askLanguage() { return VSTWrapper::masterCallback(nullptr, 38, 0, 0, nullptr, 0.0f); }

TEST_P(HostLanguage, IsDecidedByTheFirstTwoCharacters) {
  EXPECT_EQ(askLanguage(), GetParam().language);
  EXPECT_EQ(currentLanguage(), GetParam().language);
  EXPECT_EQ(languageFor(GetParam().identifier), GetParam().language);
}

INSTANTIATE_TEST_SUITE_P(
    Of, HostLanguage,
    testing::Values(LocaleCase{"English", "en", 1}, LocaleCase{"AmericanEnglish", "en_US", 1},
                    LocaleCase{"PosixEnglish", "en_US_POSIX", 1}, LocaleCase{"German", "de", 2},
                    LocaleCase{"SwissGerman", "de_CH", 2}, LocaleCase{"French", "fr", 3},
                    LocaleCase{"CanadianFrench", "fr_CA", 3}, LocaleCase{"Italian", "it", 4},
                    LocaleCase{"ItalianItalian", "it_IT", 4}, LocaleCase{"Spanish", "es", 5},
                    LocaleCase{"MexicanSpanish", "es_MX", 5}, LocaleCase{"Japanese", "ja", 6},
                    LocaleCase{"JapaneseJapanese", "ja_JP", 6}, LocaleCase{"BrazilianPortuguese", "pt_BR", 1},
                    LocaleCase{"Korean", "ko_KR", 1}, LocaleCase{"Chinese", "zh-Hans_CN", 1},
                    LocaleCase{"GermanWithAHyphen", "de-CH", 2},
                    // Two characters are two characters.
                    LocaleCase{"LowerSorbian", "dsb", 1}, LocaleCase{"Danish", "da_DK", 1},
                    LocaleCase{"Filipino", "fil", 1}, LocaleCase{"ThreeLettersBeginningWithTwo", "den", 2},
                    LocaleCase{"UpperCase", "DE", 1}, LocaleCase{"MixedCase", "Ja_JP", 1},
                    LocaleCase{"LeadingBlank", " de", 1}, LocaleCase{"Half", "d", 1},
                    LocaleCase{"Nothing", "", 1}),
    host_tests::nameOfCase<LocaleCase>);

class HostLanguageConversation : public testing::Test {
 protected:
  HostLanguageConversation() { core_foundation.setLocale("ja_JP"); }
  doubles::RecordingCoreFoundation core_foundation;
};

// On purpose: the locale is not released.
TEST_F(HostLanguageConversation, CopiesTheLocaleAndKeepsIt) {
  EXPECT_EQ(askLanguage(), 6);
  EXPECT_THAT(core_foundation.calls(),
              ElementsAre("CFLocaleCopyCurrent() -> locale", "CFLocaleGetIdentifier(\"ja_JP\") -> string",
                          "CFStringGetCString(\"ja_JP\", 255 bytes, ASCII) -> true"));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("locale \"ja_JP\""));
}

TEST_F(HostLanguageConversation, AnswersEnglishWhereTheIdentifierCannotBeConverted) {
  core_foundation.failStep(doubles::Step::kGetCString);
  EXPECT_EQ(askLanguage(), 1);
  EXPECT_EQ(core_foundation.calls().size(), 3u);
}

TEST_F(HostLanguageConversation, AnswersEnglishWhereTheIdentifierIsTooLong) {
  core_foundation.setLocale("ja_" + std::string(251, 'x'));  // 254 characters and the zero byte
  EXPECT_EQ(askLanguage(), 6);
  core_foundation.setLocale("ja_" + std::string(252, 'x'));
  EXPECT_EQ(askLanguage(), 1);
}

TEST_F(HostLanguageConversation, AnswersEnglishWhereTheIdentifierIsNotAscii) {
  core_foundation.setLocale("ja_\xC3\xA9");
  EXPECT_EQ(askLanguage(), 1);
}

TEST_F(HostLanguageConversation, AsksAnewEachTime) {
  EXPECT_EQ(askLanguage(), 6);
  core_foundation.setLocale("de_CH");
  EXPECT_EQ(askLanguage(), 2);
}

}  // namespace
