// SPDX-License-Identifier: MIT
// Strings, URLs and the current locale.
#include <filesystem>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <stdlib.h>

#include "platform/core_foundation.h"
#include "platform/entry_point_name.h"
#include "tests/platform/bundle_files.h"

namespace {

using testing::internal::CaptureStderr;
using testing::internal::GetCapturedStderr;

constexpr CFStringEncoding kUtf8 = 0x08000100;
constexpr CFStringEncoding kAscii = 0x0600;
constexpr CFStringEncoding kMacRoman = 0;

std::string textOf(CFStringRef string, CFStringEncoding encoding = kUtf8) {
  char buffer[64];
  return CFStringGetCString(string, buffer, sizeof buffer, encoding) ? buffer : "(no text)";
}

struct Text {
  const char* name;
  CFStringEncoding encoding;
  const char* bytes;
  std::string failure;  // The line on standard error; "" for a text that is valid.
};
class CFStringCreateWithCStringTest : public testing::TestWithParam<Text> {};

TEST_P(CFStringCreateWithCStringTest, TakesOnlyValidTextAndReportsOther) {
  const Text& row = GetParam();
  CaptureStderr();
  const CFStringRef string = CFStringCreateWithCString(nullptr, row.bytes, row.encoding);
  EXPECT_EQ(GetCapturedStderr(), row.failure);
  ASSERT_EQ(string != nullptr, row.failure.empty());
  if (string == nullptr) return;
  EXPECT_EQ(textOf(string, row.encoding), row.bytes);
  CFRelease(string);
}

std::string notUtf8(const std::string& shown) { return "vsttorture: not valid UTF-8: " + shown + "\n"; }

INSTANTIATE_TEST_SUITE_P(
    Texts, CFStringCreateWithCStringTest,
    testing::Values(Text{"Empty", kUtf8, "", ""}, Text{"OneByte", kUtf8, "/opt/a b.so\x7F", ""},
                    Text{"TwoBytes", kUtf8, "\xC2\x80 \xDF\xBF", ""},
                    Text{"ThreeBytes", kUtf8, "\xE0\xA0\x80 \xEF\xBF\xBF", ""},
                    Text{"FourBytes", kUtf8, "\xF0\x90\x80\x80 \xF4\x8F\xBF\xBF", ""},
                    Text{"BesideSurrogates", kUtf8, "\xED\x9F\xBF \xEE\x80\x80", ""},
                    Text{"LoneFollowing", kUtf8, "a\x80", notUtf8("a\\x80")},
                    Text{"OverlongSlash", kUtf8, "\xC0\xAF", notUtf8("\\xc0\\xaf")},
                    Text{"OverlongTwo", kUtf8, "\xC1\xBF", notUtf8("\\xc1\\xbf")},
                    Text{"OverlongThree", kUtf8, "\xE0\x9F\xBF", notUtf8("\\xe0\\x9f\\xbf")},
                    Text{"OverlongFour", kUtf8, "\xF0\x8F\xBF\xBF", notUtf8("\\xf0\\x8f\\xbf\\xbf")},
                    Text{"FirstSurrogate", kUtf8, "\xED\xA0\x80", notUtf8("\\xed\\xa0\\x80")},
                    Text{"LastSurrogate", kUtf8, "\xED\xBF\xBF", notUtf8("\\xed\\xbf\\xbf")},
                    Text{"AboveTheLast", kUtf8, "\xF4\x90\x80\x80", notUtf8("\\xf4\\x90\\x80\\x80")},
                    Text{"LeadF5", kUtf8, "\xF5\x80\x80\x80", notUtf8("\\xf5\\x80\\x80\\x80")},
                    Text{"ByteFF", kUtf8, "\xFF", notUtf8("\\xff")},
                    Text{"TruncatedTwo", kUtf8, "a\xC3", notUtf8("a\\xc3")},
                    Text{"TruncatedThree", kUtf8, "\xE2\x82", notUtf8("\\xe2\\x82")},
                    Text{"TruncatedFour", kUtf8, "\xF0\x9F\x8E", notUtf8("\\xf0\\x9f\\x8e")},
                    Text{"CutByAscii", kUtf8, "\xE2\x82z", notUtf8("\\xe2\\x82z")},
                    Text{"ControlCharactersBecomeBlanks", kUtf8, "/a\nb\x1F\x7F/\x8E",
                         notUtf8("/a b  /\\x8e")},
                    Text{"Ascii", kAscii, "plain\x7F", ""},
                    Text{"AsciiAbove7F", kAscii, "\xC3\xA4",
                         "vsttorture: not valid in the requested encoding: \xC3\xA4\n"},
                    Text{"AnUnknownEncoding", kMacRoman, "plain",
                         "vsttorture: not valid in the requested encoding: plain\n"}),
    [](const auto& test) { return test.param.name; });

TEST(CFStringGetCString, NeedsRoomForTheTerminatingZeroAndWritesNothingBehindIt) {
  char buffer[] = "???????";
  EXPECT_FALSE(CFStringGetCString(CFSTR(""), buffer, 0, kAscii));
  EXPECT_FALSE(CFStringGetCString(CFSTR(""), buffer, -1, kAscii));
  EXPECT_FALSE(CFStringGetCString(CFSTR("de_CH"), buffer, 5, kAscii));
  EXPECT_TRUE(CFStringGetCString(CFSTR("de_CH"), buffer, 6, kAscii));
  EXPECT_EQ(std::string(buffer, 7), std::string("de_CH\0?", 7));
}

TEST(CFStringGetCString, FailsForCharactersThatTheEncodingLacks) {
  EXPECT_EQ(textOf(CFSTR("j\xC3\xA4"), kUtf8), "j\xC3\xA4");
  EXPECT_EQ(textOf(CFSTR("j\xC3\xA4"), kAscii), "(no text)");
  EXPECT_EQ(textOf(CFSTR("plain"), kMacRoman), "(no text)");
}

TEST(CFSTR, GivesOneObjectForEqualTextsThatReleasesLeaveAlone) {
  const CFStringRef constant = CFSTR("a constant");
  for (int i = 0; i < 3; ++i) CFRelease(constant);
  EXPECT_EQ(CFSTR("a constant"), constant);
  EXPECT_NE(CFSTR("A constant"), constant);
  EXPECT_EQ(textOf(constant), "a constant");
  EXPECT_EQ(systemEntryPointName(), CFSTR("main"));
}

struct RefusedPath {
  const char* name;
  const char* path;
  CFURLPathStyle style;
  const char* failure;
};
class CFURLCreateWithFileSystemPathTest : public testing::TestWithParam<RefusedPath> {};

TEST_P(CFURLCreateWithFileSystemPathTest, ReportsWhatIsNoUsablePath) {
  const BundleFiles files;
  const CurrentDirectory removed(files.makeFolder("removed"));
  std::filesystem::remove(files.path("removed"));
  CaptureStderr();
  const CFStringRef path = CFStringCreateWithCString(nullptr, GetParam().path, kUtf8);
  const CFURLRef url = CFURLCreateWithFileSystemPath(nullptr, path, GetParam().style, 0);
  CFRelease(path);
  EXPECT_EQ(GetCapturedStderr(), GetParam().failure);
  EXPECT_EQ(url != nullptr, *GetParam().failure == '\0');
  if (url != nullptr) CFRelease(url);
}

INSTANTIATE_TEST_SUITE_P(
    Paths, CFURLCreateWithFileSystemPathTest,
    testing::Values(RefusedPath{"OfAnotherStyle", "C:\\a", 2, "vsttorture: not a POSIX path: C:\\a\n"},
                    RefusedPath{"RelativeWithoutACurrentDirectory", "a.so", 0,
                                "vsttorture: a.so: no current directory: No such file or directory\n"},
                    RefusedPath{"AbsoluteWithoutACurrentDirectory", "/a.so", 0, ""}),
    [](const auto& test) { return test.param.name; });

struct Environment {
  const char* name;
  const char* lcAll;  // Null: not set.
  const char* lcMessages;
  const char* lang;
  const char* identifier;
};
class CFLocaleCopyCurrentTest : public testing::TestWithParam<Environment> {};

// Never releases one of its two locales: the leak check of the sanitizer build must not report it.
TEST_P(CFLocaleCopyCurrentTest, TakesTheFirstVariableThatIsSet) {
  const auto set = [](const char* variable, const char* value) {
    value == nullptr ? unsetenv(variable) : setenv(variable, value, 1);
  };
  set("LC_ALL", GetParam().lcAll);
  set("LC_MESSAGES", GetParam().lcMessages);
  set("LANG", GetParam().lang);
  const CFLocaleRef locale = CFLocaleCopyCurrent();
  CFRelease(locale);
  EXPECT_EQ(textOf(CFLocaleGetIdentifier(CFLocaleCopyCurrent())), GetParam().identifier);
}

INSTANTIATE_TEST_SUITE_P(
    Environments, CFLocaleCopyCurrentTest,
    testing::Values(Environment{"NothingSet", nullptr, nullptr, nullptr, "en_US_POSIX"},
                    Environment{"AllEmpty", "", "", "", "en_US_POSIX"},
                    Environment{"LangAlone", nullptr, nullptr, "ja_JP.UTF-8", "ja_JP"},
                    Environment{"MessagesBeforeLang", nullptr, "fr_FR", "ja_JP", "fr_FR"},
                    Environment{"AllBeforeMessages", "it_IT", "fr_FR", "ja_JP", "it_IT"},
                    Environment{"EmptyAllIsSkipped", "", "fr_FR", "ja_JP", "fr_FR"},
                    Environment{"EmptyMessagesIsSkipped", nullptr, "", "ja_JP", "ja_JP"},
                    Environment{"TheCLocaleIsNotSkipped", "C", "fr_FR", "ja_JP", "en_US_POSIX"},
                    Environment{"CWithCodeset", nullptr, nullptr, "C.UTF-8", "en_US_POSIX"},
                    Environment{"Posix", nullptr, nullptr, "POSIX", "en_US_POSIX"},
                    Environment{"LanguageOnly", nullptr, nullptr, "de", "de"},
                    Environment{"Modifier", nullptr, nullptr, "de_DE@euro", "de_DE"},
                    Environment{"CodesetAndModifier", nullptr, nullptr, "sr_RS.UTF-8@latin", "sr_RS"},
                    Environment{"CodesetOnly", nullptr, nullptr, ".UTF-8", "en_US_POSIX"},
                    Environment{"LowerCaseCIsALanguage", nullptr, nullptr, "c", "c"},
                    Environment{"Utf8Letters", nullptr, nullptr, "j\xC3\xA4", "j\xC3\xA4"},
                    Environment{"NotUtf8", nullptr, nullptr, "j\xE4", "en_US_POSIX"}),
    [](const auto& test) { return test.param.name; });

}  // namespace
