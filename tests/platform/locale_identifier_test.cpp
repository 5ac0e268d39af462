// SPDX-License-Identifier: MIT
// The locale rule as a table.
#include <gtest/gtest.h>

#include "platform/linux/locale_identifier.h"

namespace {

struct LocaleCase {
  const char* name;
  const char* lcAll;
  const char* lcMessages;
  const char* lang;
  const char* identifier;
};
class LocaleIdentifier : public testing::TestWithParam<LocaleCase> {};

TEST_P(LocaleIdentifier, ComesFromTheFirstVariableThatIsSet) {
  const LocaleCase& row = GetParam();
  EXPECT_EQ(core_foundation::localeIdentifier(row.lcAll, row.lcMessages, row.lang), row.identifier);
}

INSTANTIATE_TEST_SUITE_P(
    Table, LocaleIdentifier,
    testing::Values(LocaleCase{"NothingSet", nullptr, nullptr, nullptr, "en_US_POSIX"},
                    LocaleCase{"AllEmpty", "", "", "", "en_US_POSIX"},
                    LocaleCase{"LangAlone", nullptr, nullptr, "ja_JP.UTF-8", "ja_JP"},
                    LocaleCase{"MessagesBeforeLang", nullptr, "fr_FR", "ja_JP", "fr_FR"},
                    LocaleCase{"AllBeforeMessages", "it_IT", "fr_FR", "ja_JP", "it_IT"},
                    LocaleCase{"EmptyAllIsSkipped", "", "fr_FR", "ja_JP", "fr_FR"},
                    LocaleCase{"EmptyMessagesIsSkipped", nullptr, "", "ja_JP", "ja_JP"},
                    LocaleCase{"TheCLocaleDecidesToo", "C", "fr_FR", "ja_JP", "en_US_POSIX"},
                    LocaleCase{"C", nullptr, nullptr, "C", "en_US_POSIX"},
                    LocaleCase{"CWithCodeset", nullptr, nullptr, "C.UTF-8", "en_US_POSIX"},
                    LocaleCase{"Posix", nullptr, nullptr, "POSIX", "en_US_POSIX"},
                    LocaleCase{"LanguageOnly", nullptr, nullptr, "de", "de"},
                    LocaleCase{"Modifier", nullptr, nullptr, "de_DE@euro", "de_DE"},
                    LocaleCase{"CodesetAndModifier", nullptr, nullptr, "sr_RS.UTF-8@latin", "sr_RS"},
                    LocaleCase{"CodesetOnly", nullptr, nullptr, ".UTF-8", "en_US_POSIX"},
                    LocaleCase{"ModifierOnly", nullptr, nullptr, "@euro", "en_US_POSIX"},
                    LocaleCase{"LowerCaseCIsALanguage", nullptr, nullptr, "c", "c"},
                    LocaleCase{"Utf8Letters", nullptr, nullptr, "j\xC3\xA4", "j\xC3\xA4"},
                    LocaleCase{"NotUtf8", nullptr, nullptr, "j\xE4", "en_US_POSIX"}),
    [](const auto& test) { return test.param.name; });

}  // namespace
