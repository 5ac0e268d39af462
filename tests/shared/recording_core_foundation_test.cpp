// SPDX-License-Identifier: MIT
// The recording CoreFoundation: that it records exactly what was called, fails where it was told to, and
// counts references as the real one does.
#include <cstring>
#include <limits>
#include <string>

#include "gmock/gmock.h"
#include "gtest/gtest-spi.h"
#include "gtest/gtest.h"
#include "platform/core_foundation.h"
#include "platform/entry_point_name.h"
#include "tests/shared/recording_core_foundation.h"

namespace {

using namespace doubles;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;

int theEntry(int number) { return number + 1; }
int anotherEntry(int number) { return number + 2; }

class RecordingCoreFoundationTest : public testing::Test {
 protected:
  static CFStringRef makeString(const char* text) {
    return CFStringCreateWithCString(nullptr, text, 0x08000100);
  }
  static CFURLRef makeUrl(const char* path) {
    CFStringRef string = makeString(path);
    CFURLRef url = CFURLCreateWithFileSystemPath(nullptr, string, 0, false);
    CFRelease(string);
    return url;
  }
  static CFBundleRef makeBundle(const char* path) {
    CFURLRef url = makeUrl(path);
    CFBundleRef bundle = CFBundleCreate(nullptr, url);
    CFRelease(url);
    return bundle;
  }
  RecordingCoreFoundation core_foundation;
};

TEST_F(RecordingCoreFoundationTest, RecordsALoadFromBeginningToEnd) {
  core_foundation.addBundle("/b.vst", {{"VSTPluginMain", theEntry}});
  CFBundleRef bundle = makeBundle("/b.vst");
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("VSTPluginMain")),
            reinterpret_cast<void*>(theEntry));
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("main_macho")), nullptr);
  CFBundleUnloadExecutable(bundle);
  CFRelease(bundle);
  EXPECT_THAT(core_foundation.calls(),
              ElementsAre("CFStringCreateWithCString(\"/b.vst\", UTF-8) -> string",
                          "CFURLCreateWithFileSystemPath(\"/b.vst\", POSIX, file) -> URL",
                          "CFRelease(string \"/b.vst\")", "CFBundleCreate(\"/b.vst\") -> bundle",
                          "CFRelease(URL \"/b.vst\")", "CFBundleLoadExecutable(\"/b.vst\") -> true",
                          "CFBundleGetFunctionPointerForName(\"/b.vst\", \"VSTPluginMain\") -> function",
                          "CFBundleGetFunctionPointerForName(\"/b.vst\", \"main_macho\") -> null",
                          "CFBundleUnloadExecutable(\"/b.vst\")", "CFRelease(bundle \"/b.vst\")"));
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
}

TEST_F(RecordingCoreFoundationTest, ShowsUnusualArguments) {
  int somewhere = 0;
  const auto allocator = reinterpret_cast<CFAllocatorRef>(&somewhere);
  CFStringRef string = CFStringCreateWithCString(allocator, "/b", 0x0600);
  CFURLRef url = CFURLCreateWithFileSystemPath(allocator, string, 1, true);
  CFBundleCreate(allocator, url);
  CFStringCreateWithCString(nullptr, "/c", 7);
  EXPECT_THAT(
      core_foundation.calls(),
      ElementsAre("CFStringCreateWithCString(\"/b\", ASCII, another allocator) -> string",
                  "CFURLCreateWithFileSystemPath(\"/b\", style 1, directory, another allocator) -> URL",
                  "CFBundleCreate(\"/b\", another allocator) -> null",
                  "CFStringCreateWithCString(\"/c\", encoding 7) -> string"));
}

TEST_F(RecordingCoreFoundationTest, ChoosesAndForgetsCalls) {
  makeUrl("/a");
  EXPECT_THAT(core_foundation.functionsCalled(),
              ElementsAre("CFStringCreateWithCString", "CFURLCreateWithFileSystemPath", "CFRelease"));
  EXPECT_THAT(core_foundation.callsOf("CFRelease"), ElementsAre("CFRelease(string \"/a\")"));
  EXPECT_THAT(core_foundation.callsOf("CFRetain"), IsEmpty());
  core_foundation.forgetCalls();
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("URL \"/a\""));
}

TEST_F(RecordingCoreFoundationTest, KnowsOnlyTheBundlesThatWereAdded) {
  EXPECT_EQ(makeBundle("/b.vst"), nullptr);
  EXPECT_THAT(core_foundation.callsOf("CFBundleCreate"), ElementsAre("CFBundleCreate(\"/b.vst\") -> null"));
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
}

TEST_F(RecordingCoreFoundationTest, FailsEachStepUntilItIsMended) {
  core_foundation.addBundle("/b.vst", {});
  core_foundation.failStep(Step::kCreateString);
  EXPECT_EQ(makeString("/b.vst"), nullptr);
  core_foundation.mendStep(Step::kCreateString);
  core_foundation.failStep(Step::kCreateUrl);
  EXPECT_EQ(makeUrl("/b.vst"), nullptr);
  core_foundation.mendStep(Step::kCreateUrl);
  core_foundation.failStep(Step::kCreateBundle);
  EXPECT_EQ(makeBundle("/b.vst"), nullptr);
  core_foundation.mendStep(Step::kCreateBundle);
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
  core_foundation.failStep(Step::kLoadExecutable);
  CFBundleRef bundle = makeBundle("/b.vst");
  EXPECT_FALSE(CFBundleLoadExecutable(bundle));
  core_foundation.mendStep(Step::kLoadExecutable);
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_THAT(core_foundation.callsOf("CFBundleLoadExecutable"),
              ElementsAre("CFBundleLoadExecutable(\"/b.vst\") -> false",
                          "CFBundleLoadExecutable(\"/b.vst\") -> true"));
}

TEST_F(RecordingCoreFoundationTest, DoesNotLoadABundleWithoutExecutable) {
  core_foundation.addBundleWithoutExecutable("/b.vst");
  CFBundleRef bundle = makeBundle("/b.vst");
  ASSERT_NE(bundle, nullptr);
  EXPECT_FALSE(CFBundleLoadExecutable(bundle));
}

TEST_F(RecordingCoreFoundationTest, MakesNoUrlOfAnEmptyPath) { EXPECT_EQ(makeUrl(""), nullptr); }

TEST_F(RecordingCoreFoundationTest, FindsSymbolsOnlyInALoadedBundle) {
  core_foundation.addBundle("/b.vst", {{"VSTPluginMain", theEntry}});
  CFBundleRef bundle = makeBundle("/b.vst");
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("VSTPluginMain")), nullptr);
  CFBundleLoadExecutable(bundle);
  EXPECT_NE(CFBundleGetFunctionPointerForName(bundle, CFSTR("VSTPluginMain")), nullptr);
  CFBundleUnloadExecutable(bundle);
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("VSTPluginMain")), nullptr);
}

TEST_F(RecordingCoreFoundationTest, ServesABundleKeptFromAnEarlierTestWithTheSymbolsOfThisOne) {
  core_foundation.addBundle("/b.vst", {{"VSTPluginMain", theEntry}});
  CFBundleRef kept = makeBundle("/b.vst");
  CFBundleLoadExecutable(kept);
  core_foundation.reset();
  EXPECT_EQ(CFBundleGetFunctionPointerForName(kept, CFSTR("VSTPluginMain")), nullptr);
  core_foundation.addBundle("/b.vst", {{"VSTPluginMain", anotherEntry}});
  EXPECT_EQ(CFBundleGetFunctionPointerForName(kept, CFSTR("VSTPluginMain")),
            reinterpret_cast<void*>(anotherEntry));
}

TEST_F(RecordingCoreFoundationTest, CountsReferences) {
  CFStringRef string = makeString("text");
  EXPECT_EQ(CFGetRetainCount(string), 1);
  EXPECT_EQ(CFRetain(string), string);
  EXPECT_EQ(CFGetRetainCount(string), 2);
  CFRelease(string);
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("string \"text\""));
  CFRelease(string);
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
  EXPECT_THAT(core_foundation.calls(), Contains("CFRetain(string \"text\")"));
  EXPECT_THAT(core_foundation.calls(), Contains("CFGetRetainCount(string \"text\") -> 2"));
}

TEST_F(RecordingCoreFoundationTest, LeavesConstantsAlone) {
  CFStringRef constant = CFSTR("constant");
  EXPECT_EQ(constant, CFSTR("constant"));
  EXPECT_NE(constant, CFSTR("another"));
  CFRetain(constant);
  CFRelease(constant);
  CFRelease(constant);
  EXPECT_EQ(CFGetRetainCount(constant), std::numeric_limits<CFIndex>::max());
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
  EXPECT_THAT(core_foundation.takeMisuses(), IsEmpty());
}

TEST_F(RecordingCoreFoundationTest, LendsTheIdentifierOfTheLocaleThatWasSet) {
  core_foundation.setLocale("de_CH");
  CFLocaleRef locale = CFLocaleCopyCurrent();
  char buffer[255] = {};
  EXPECT_TRUE(CFStringGetCString(CFLocaleGetIdentifier(locale), buffer, 255, 0x0600));
  EXPECT_STREQ(buffer, "de_CH");
  EXPECT_THAT(core_foundation.calls(),
              ElementsAre("CFLocaleCopyCurrent() -> locale", "CFLocaleGetIdentifier(\"de_CH\") -> string",
                          "CFStringGetCString(\"de_CH\", 255 bytes, ASCII) -> true"));
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("locale \"de_CH\""));
  CFRelease(locale);
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
}

TEST_F(RecordingCoreFoundationTest, TellsARetainedIdentifierThatOutlivesItsLocale) {
  CFLocaleRef locale = CFLocaleCopyCurrent();
  CFStringRef identifier = CFLocaleGetIdentifier(locale);
  CFRetain(identifier);
  CFRelease(locale);
  EXPECT_THAT(core_foundation.aliveObjects(), ElementsAre("string \"en_US\""));
  CFRelease(identifier);
  EXPECT_THAT(core_foundation.aliveObjects(), IsEmpty());
}

TEST_F(RecordingCoreFoundationTest, RefusesConversionsThatDoNotFitAndLeavesATemptingBuffer) {
  char buffer[8] = "#######";
  CFStringRef german = makeString("de_CH");
  EXPECT_FALSE(CFStringGetCString(german, buffer, 5, 0x0600));
  EXPECT_STREQ(buffer, "de_C");
  EXPECT_TRUE(CFStringGetCString(german, buffer, 6, 0x0600));
  EXPECT_STREQ(buffer, "de_CH");
  EXPECT_FALSE(CFStringGetCString(german, buffer, 8, 7));
  CFStringRef accented = makeString("d\xC3\xA9");
  EXPECT_FALSE(CFStringGetCString(accented, buffer, 8, 0x0600));
  EXPECT_TRUE(CFStringGetCString(accented, buffer, 8, 0x08000100));
  core_foundation.failStep(Step::kGetCString);
  EXPECT_FALSE(CFStringGetCString(german, buffer, 8, 0x0600));
  EXPECT_STREQ(buffer, "de_CH");
}

TEST_F(RecordingCoreFoundationTest, NotesMisusesWithoutCrashing) {
  CFStringRef string = makeString("text");
  CFRelease(string);
  CFRelease(string);
  CFRetain(nullptr);
  CFBundleCreate(nullptr, reinterpret_cast<CFURLRef>(makeString("path")));
  CFRelease(CFLocaleGetIdentifier(CFLocaleCopyCurrent()));
  EXPECT_THAT(core_foundation.takeMisuses(),
              ElementsAre("CFRelease of a released string \"text\"", "CFRetain of null",
                          "CFBundleCreate of a string \"path\"", "CFRelease of a lent string \"en_US\""));
  EXPECT_THAT(core_foundation.takeMisuses(), IsEmpty());
}

void misuseCoreFoundation() {
  RecordingCoreFoundation world;
  CFRelease(nullptr);
}

TEST(RecordingCoreFoundationEnd, FailsTheTestForAMisuseThatNobodyTook) {
  EXPECT_NONFATAL_FAILURE(misuseCoreFoundation(), "CFRelease of null");
}

TEST(RecordingCoreFoundationEnd, GivesWayToTheOneBefore) {
  RecordingCoreFoundation outer;
  {
    RecordingCoreFoundation inner;
    CFLocaleCopyCurrent();
    EXPECT_THAT(inner.functionsCalled(), ElementsAre("CFLocaleCopyCurrent"));
  }
  EXPECT_THAT(outer.calls(), IsEmpty());
  CFLocaleCopyCurrent();
  EXPECT_THAT(outer.functionsCalled(), ElementsAre("CFLocaleCopyCurrent"));
}

TEST(RecordingCoreFoundationDeathTest, EndsTheProcessWhenThereIsNone) {
  EXPECT_DEATH(CFLocaleCopyCurrent(), "while no RecordingCoreFoundation exists");
}

TEST_F(RecordingCoreFoundationTest, StartsAfreshAfterAReset) {
  core_foundation.addBundle("/b.vst", {});
  core_foundation.failStep(Step::kCreateString);
  core_foundation.setLocale("ja_JP");
  core_foundation.setSystemEntryPointName(std::nullopt);
  core_foundation.reset();
  EXPECT_THAT(core_foundation.calls(), IsEmpty());
  EXPECT_NE(makeString("text"), nullptr);
  EXPECT_EQ(makeBundle("/b.vst"), nullptr);
  CFLocaleGetIdentifier(CFLocaleCopyCurrent());
  EXPECT_THAT(core_foundation.calls(), Contains("CFLocaleGetIdentifier(\"en_US\") -> string"));
  EXPECT_NE(systemEntryPointName(), nullptr);
}

TEST_F(RecordingCoreFoundationTest, NamesTheSystemsEntryPointAsTold) {
  core_foundation.addBundle("/b.vst", {{"main", theEntry}, {"other", anotherEntry}});
  CFBundleRef bundle = makeBundle("/b.vst");
  CFBundleLoadExecutable(bundle);
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, systemEntryPointName()),
            reinterpret_cast<void*>(theEntry));
  core_foundation.setSystemEntryPointName("other");
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, systemEntryPointName()),
            reinterpret_cast<void*>(anotherEntry));
  core_foundation.setSystemEntryPointName(std::nullopt);
  EXPECT_EQ(systemEntryPointName(), nullptr);
}

}  // namespace
