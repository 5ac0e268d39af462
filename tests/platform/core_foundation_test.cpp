// SPDX-License-Identifier: MIT
// Strings, counts, URLs and the current locale.
#include <filesystem>
#include <limits>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <stdlib.h>

#include "platform/core_foundation.h"
#include "platform/entry_point_name.h"
#include "tests/platform/temporary_folder.h"

namespace {

using testing::internal::CaptureStderr;
using testing::internal::GetCapturedStderr;

CFStringRef makeUtf8(const std::string& text) {
  return CFStringCreateWithCString(nullptr, text.c_str(), 0x08000100);
}

std::string textOf(CFStringRef string, CFStringEncoding encoding = 0x08000100) {
  char buffer[64];
  return CFStringGetCString(string, buffer, sizeof buffer, encoding) ? buffer : "(no text)";
}

struct Utf8Case {
  const char* name;
  const char* bytes;
  bool valid;
};
class CFStringCreateWithCStringUtf8 : public testing::TestWithParam<Utf8Case> {};

TEST_P(CFStringCreateWithCStringUtf8, TakesValidTextOnlyAndTellsWhy) {
  CaptureStderr();
  const CFStringRef string = makeUtf8(GetParam().bytes);
  const std::string said = GetCapturedStderr();
  if (GetParam().valid) {
    ASSERT_NE(string, nullptr);
    EXPECT_EQ(textOf(string), GetParam().bytes);
    EXPECT_EQ(said, "");
    CFRelease(string);
  } else {
    EXPECT_EQ(string, nullptr);
    EXPECT_THAT(said, testing::MatchesRegex("vsttorture: not valid UTF-8: [ -~]+\n"));
  }
}

INSTANTIATE_TEST_SUITE_P(
    Table, CFStringCreateWithCStringUtf8,
    testing::Values(
        Utf8Case{"Empty", "", true}, Utf8Case{"Ascii", "/opt/a b.so", true},
        Utf8Case{"TwoBytes", "\xC2\x80 \xDF\xBF", true},
        Utf8Case{"ThreeBytes", "\xE0\xA0\x80 \xEF\xBF\xBF", true},
        Utf8Case{"FourBytes", "\xF0\x90\x80\x80 \xF4\x8F\xBF\xBF", true},
        Utf8Case{"BesideSurrogates", "\xED\x9F\xBF \xEE\x80\x80", true},
        Utf8Case{"LoneFollowing", "a\x80", false}, Utf8Case{"OverlongSlash", "\xC0\xAF", false},
        Utf8Case{"OverlongTwo", "\xC1\xBF", false}, Utf8Case{"OverlongThree", "\xE0\x9F\xBF", false},
        Utf8Case{"OverlongFour", "\xF0\x8F\xBF\xBF", false},
        Utf8Case{"FirstSurrogate", "\xED\xA0\x80", false}, Utf8Case{"LastSurrogate", "\xED\xBF\xBF", false},
        Utf8Case{"AboveTheLast", "\xF4\x90\x80\x80", false}, Utf8Case{"LeadF5", "\xF5\x80\x80\x80", false},
        Utf8Case{"ByteFF", "\xFF", false}, Utf8Case{"TruncatedTwo", "a\xC3", false},
        Utf8Case{"TruncatedThree", "\xE2\x82", false}, Utf8Case{"TruncatedFour", "\xF0\x9F\x8E", false},
        Utf8Case{"CutByAscii", "\xE2\x82z", false}, Utf8Case{"Latin1", "caf\xE9.so", false}),
    [](const auto& test) { return test.param.name; });

TEST(CFStringCreateWithCString, AsciiHoldsNothingAbove7F) {
  const CFStringRef string = CFStringCreateWithCString(nullptr, "plain", 0x0600);
  ASSERT_NE(string, nullptr);
  EXPECT_EQ(textOf(string), "plain");
  CFRelease(string);
  CaptureStderr();
  EXPECT_EQ(CFStringCreateWithCString(nullptr, "\xC3\xA4", 0x0600), nullptr);
  EXPECT_EQ(GetCapturedStderr(), "vsttorture: not valid in the encoding asked for: \xC3\xA4\n");
}

TEST(CFStringCreateWithCString, AnUnknownEncodingGivesNull) {
  CaptureStderr();
  EXPECT_EQ(CFStringCreateWithCString(nullptr, "plain", 0x0100), nullptr);
  EXPECT_EQ(GetCapturedStderr(), "vsttorture: not valid in the encoding asked for: plain\n");
}

TEST(CFStringCreateWithCString, TheReasonShowsBytesThatAreNoText) {
  CaptureStderr();
  EXPECT_EQ(makeUtf8("/a\nb/\xFF\x8E.so"), nullptr);
  EXPECT_EQ(GetCapturedStderr(), "vsttorture: not valid UTF-8: /a b/\\xff\\x8e.so\n");
}

TEST(CFStringGetCString, NeedsRoomForTheTerminatingZero) {
  char buffer[] = "??????";
  EXPECT_FALSE(CFStringGetCString(CFSTR("de_CH"), buffer, 5, 0x0600));
  EXPECT_TRUE(CFStringGetCString(CFSTR("de_CH"), buffer, 6, 0x0600));
  EXPECT_STREQ(buffer, "de_CH");
}

TEST(CFStringGetCString, WritesNothingBehindTheText) {
  char buffer[] = "??????";
  EXPECT_TRUE(CFStringGetCString(CFSTR("de"), buffer, 6, 0x0600));
  EXPECT_EQ(std::string(buffer, 6), std::string("de\0???", 6));
}

TEST(CFStringGetCString, RefusesSizesBelowOne) {
  char buffer[] = "?";
  EXPECT_FALSE(CFStringGetCString(CFSTR(""), buffer, 0, 0x0600));
  EXPECT_FALSE(CFStringGetCString(CFSTR(""), buffer, -1, 0x0600));
  EXPECT_STREQ(buffer, "?");
}

TEST(CFStringGetCString, AsciiCannotSayOtherLetters) {
  const CFStringRef string = makeUtf8("j\xC3\xA4");
  EXPECT_EQ(textOf(string, 0x0600), "(no text)");
  EXPECT_EQ(textOf(string, 0x08000100), "j\xC3\xA4");
  EXPECT_EQ(textOf(string, 0x0100), "(no text)");
  CFRelease(string);
}

TEST(CFSTR, EqualTextsAreOneObject) {
  EXPECT_EQ(CFSTR("main"), CFSTR("main"));
  EXPECT_NE(CFSTR("main"), CFSTR("Main"));
  EXPECT_EQ(textOf(CFSTR("VSTPluginMain")), "VSTPluginMain");
}

TEST(CFSTR, RetainAndReleaseLeaveItAlone) {
  const CFStringRef constant = CFSTR("a constant");
  for (int i = 0; i < 3; ++i) CFRelease(constant);
  EXPECT_EQ(CFRetain(constant), constant);
  EXPECT_EQ(CFGetRetainCount(constant), std::numeric_limits<CFIndex>::max());
  EXPECT_EQ(textOf(constant), "a constant");
}

TEST(CFRetain, CountsReferences) {
  const CFStringRef string = makeUtf8("counted");
  EXPECT_EQ(CFGetRetainCount(string), 1);
  EXPECT_EQ(CFRetain(string), string);
  EXPECT_EQ(CFGetRetainCount(string), 2);
  CFRelease(string);
  EXPECT_EQ(CFGetRetainCount(string), 1);
  EXPECT_EQ(textOf(string), "counted");
  CFRelease(string);
}

TEST(CFRetain, CountsFromManyThreads) {
  const CFStringRef string = makeUtf8("shared");
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([string] {
      for (int turn = 0; turn < 20000; ++turn) {
        CFRetain(string);
        CFRetain(string);
        CFRelease(string);
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(CFGetRetainCount(string), 80001);
  for (int i = 0; i < 80001; ++i) CFRelease(string);
}

TEST(CFURLCreateWithFileSystemPath, AnEmptyPathGivesNullAndTheReason) {
  CaptureStderr();
  EXPECT_EQ(CFURLCreateWithFileSystemPath(nullptr, CFSTR(""), 0, 0), nullptr);
  EXPECT_EQ(GetCapturedStderr(), "vsttorture: the path is empty\n");
}

TEST(CFURLCreateWithFileSystemPath, AnotherPathStyleGivesNullAndTheReason) {
  CaptureStderr();
  EXPECT_EQ(CFURLCreateWithFileSystemPath(nullptr, CFSTR("C:\\a"), 2, 0), nullptr);
  EXPECT_EQ(GetCapturedStderr(), "vsttorture: not a POSIX path: C:\\a\n");
}

TEST(CFURLCreateWithFileSystemPath, ARelativePathNeedsACurrentDirectory) {
  const TemporaryFolder folder;
  const CurrentDirectory inside(folder.makeFolder("gone"));
  std::filesystem::remove(folder.path("gone"));
  CaptureStderr();
  EXPECT_EQ(CFURLCreateWithFileSystemPath(nullptr, CFSTR("a.so"), 0, 0), nullptr);
  EXPECT_EQ(GetCapturedStderr(), "vsttorture: a.so: no current directory: No such file or directory\n");
  const CFURLRef absolute = CFURLCreateWithFileSystemPath(nullptr, CFSTR("/a.so"), 0, 0);
  ASSERT_NE(absolute, nullptr);
  CFRelease(absolute);
}

TEST(CFURLCreateWithFileSystemPath, DoesNotKeepTheString) {
  const CFStringRef path = makeUtf8("/opt/plug-in.so");
  const CFURLRef url = CFURLCreateWithFileSystemPath(nullptr, path, 0, 0);
  EXPECT_EQ(CFGetRetainCount(path), 1);
  EXPECT_EQ(CFGetRetainCount(url), 1);
  CFRelease(path);
  CFRelease(url);
}

class CFLocaleCopyCurrentTest : public testing::Test {
 protected:
  CFLocaleCopyCurrentTest() {
    unsetenv("LC_ALL");
    unsetenv("LC_MESSAGES");
    unsetenv("LANG");
  }
  static std::string identifier() {
    const CFLocaleRef locale = CFLocaleCopyCurrent();
    const std::string text = textOf(CFLocaleGetIdentifier(locale), 0x0600);
    CFRelease(locale);
    return text;
  }
};

TEST_F(CFLocaleCopyCurrentTest, FollowsTheEnvironment) {
  EXPECT_EQ(identifier(), "en_US_POSIX");
  setenv("LANG", "pt_BR.UTF-8", 1);
  EXPECT_EQ(identifier(), "pt_BR");
  setenv("LC_MESSAGES", "ja_JP.UTF-8", 1);
  EXPECT_EQ(identifier(), "ja_JP");
  setenv("LC_ALL", "de", 1);
  EXPECT_EQ(identifier(), "de");
}

TEST_F(CFLocaleCopyCurrentTest, GivesEachCallerAReferenceToOneObject) {
  setenv("LANG", "fr_FR", 1);
  const CFLocaleRef first = CFLocaleCopyCurrent();
  const CFIndex count = CFGetRetainCount(first);
  const CFLocaleRef second = CFLocaleCopyCurrent();
  EXPECT_EQ(second, first);
  EXPECT_EQ(CFGetRetainCount(first), count + 1);
  CFRelease(second);
  EXPECT_EQ(CFGetRetainCount(first), count);
  CFRelease(first);
}

// A caller may keep its locale for ever; the leak check of the sanitizer build looks on.
TEST_F(CFLocaleCopyCurrentTest, ALocaleThatIsNeverReleasedIsNoLeak) {
  for (const char* language : {"it_IT", "es_ES", "it_IT"}) {
    setenv("LANG", language, 1);
    EXPECT_EQ(textOf(CFLocaleGetIdentifier(CFLocaleCopyCurrent())), language);
  }
}

TEST(SystemEntryPointName, IsMain) { EXPECT_EQ(systemEntryPointName(), CFSTR("main")); }

}  // namespace
