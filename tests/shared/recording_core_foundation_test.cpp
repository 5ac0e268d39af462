// SPDX-License-Identifier: MIT
// The recording CoreFoundation: that it cannot hide a fault of the code that it stands under.
#include <string>

#include "gmock/gmock.h"
#include "gtest/gtest-spi.h"
#include "gtest/gtest.h"
#include "platform/core_foundation.h"
#include "tests/shared/recording_core_foundation.h"

namespace {

using doubles::RecordingCoreFoundation;
using testing::ElementsAre;

CFStringRef makeString(const char* text) { return CFStringCreateWithCString(nullptr, text, 0x08000100); }

int anEntry() { return 1; }

TEST(RecordingCoreFoundation, ShowsUnusualArguments) {
  const RecordingCoreFoundation core_foundation;
  int somewhere = 0;
  const auto allocator = reinterpret_cast<CFAllocatorRef>(&somewhere);
  CFStringRef string = CFStringCreateWithCString(allocator, "/b", 7);
  CFURLRef url = CFURLCreateWithFileSystemPath(allocator, string, 1, true);
  CFBundleCreate(allocator, url);
  EXPECT_THAT(
      core_foundation.calls(),
      ElementsAre("CFStringCreateWithCString(\"/b\", encoding 7, another allocator) -> string",
                  "CFURLCreateWithFileSystemPath(\"/b\", style 1, directory, another allocator) -> URL",
                  "CFBundleCreate(\"/b\", another allocator) -> null"));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("string \"/b\"", "URL \"/b\""));
}

TEST(RecordingCoreFoundation, FindsSymbolsOnlyInALoadedBundle) {
  RecordingCoreFoundation core_foundation;
  core_foundation.addBundle("/b", {{"VSTPluginMain", anEntry}});
  CFBundleRef bundle = CFBundleCreate(nullptr, CFURLCreateWithFileSystemPath(nullptr, CFSTR("/b"), 0, 0));
  const auto symbol = [&] { return CFBundleGetFunctionPointerForName(bundle, CFSTR("VSTPluginMain")); };
  EXPECT_EQ(symbol(), nullptr);
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_EQ(symbol(), reinterpret_cast<void*>(anEntry));
  CFBundleUnloadExecutable(bundle);
  EXPECT_EQ(symbol(), nullptr);
}

TEST(RecordingCoreFoundation, RefusesConversionsThatDoNotFitAndFillsTheBufferAllTheSame) {
  const RecordingCoreFoundation core_foundation;
  char buffer[8] = "#######";
  EXPECT_FALSE(CFStringGetCString(CFSTR("de_CH"), buffer, 5, 0x0600));
  EXPECT_STREQ(buffer, "de_C");
  EXPECT_TRUE(CFStringGetCString(CFSTR("de_CH"), buffer, 6, 0x0600));
  EXPECT_FALSE(CFStringGetCString(CFSTR("de_CH"), buffer, 8, 7));
  EXPECT_FALSE(CFStringGetCString(CFSTR("d\xC3\xA9"), buffer, 8, 0x0600));
}

struct Misuse {
  const char* name;
  void (*action)();
  const char* failure;
};
class RecordingCoreFoundationMisuse : public testing::TestWithParam<Misuse> {};

void runMisuse(const Misuse& misuse) {
  const RecordingCoreFoundation core_foundation;
  misuse.action();
}

TEST_P(RecordingCoreFoundationMisuse, FailsTheTest) {
  testing::TestPartResultArray failures;
  {
    const testing::ScopedFakeTestPartResultReporter reporter(&failures);
    runMisuse(GetParam());
  }
  ASSERT_EQ(failures.size(), 1);
  EXPECT_THAT(failures.GetTestPartResult(0).message(), testing::HasSubstr(GetParam().failure));
}

INSTANTIATE_TEST_SUITE_P(
    , RecordingCoreFoundationMisuse,
    testing::Values(Misuse{"ANullObject", [] { CFRelease(nullptr); }, "CFRelease of null"},
                    Misuse{"TwoReleases",
                           [] {
                             const CFStringRef string = makeString("text");
                             CFRelease(string);
                             CFRelease(string);
                           },
                           "CFRelease of a released string \"text\""},
                    Misuse{"AnIdentifierAfterItsLocale",
                           [] {
                             char buffer[8];
                             const CFLocaleRef locale = CFLocaleCopyCurrent();
                             const CFStringRef identifier = CFLocaleGetIdentifier(locale);
                             CFRelease(locale);
                             CFStringGetCString(identifier, buffer, 8, 0x0600);
                           },
                           "CFStringGetCString of a released string \"en_US\""},
                    Misuse{"AnotherKind",
                           [] { CFBundleCreate(nullptr, reinterpret_cast<CFURLRef>(makeString("path"))); },
                           "CFBundleCreate of a string \"path\""},
                    Misuse{"AnotherOwner", [] { CFRelease(CFLocaleGetIdentifier(CFLocaleCopyCurrent())); },
                           "CFRelease of another owner's string \"en_US\""}),
    [](const auto& test) { return test.param.name; });

}  // namespace
