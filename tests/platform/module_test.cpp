// SPDX-License-Identifier: MIT
// CFBundle on real shared objects: which file is loaded, what is found in it, and the line that each refusal
// leaves.
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include <dlfcn.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/core_foundation.h"
#include "tests/platform/bundle_files.h"
#include "tests/shared/thrown.h"

namespace {

using testing::HasSubstr;
using testing::StartsWith;

const std::string kThisProgram = sizeof(void*) == 8 ? "x86_64" : "i386";
const std::string kArchitectureFolder = "Contents/" + kThisProgram + "-linux";

// From a path to a bundle, as a caller does it; null as soon as a step fails.
CFBundleRef makeBundle(const std::string& path) {
  const CFStringRef string =
      CFStringCreateWithCString(kCFAllocatorDefault, path.c_str(), kCFStringEncodingUTF8);
  if (string == nullptr) return nullptr;
  const CFURLRef url = CFURLCreateWithFileSystemPath(kCFAllocatorDefault, string, kCFURLPOSIXPathStyle, 0);
  CFRelease(string);
  if (url == nullptr) return nullptr;
  const CFBundleRef bundle = CFBundleCreate(kCFAllocatorDefault, url);
  CFRelease(url);
  return bundle;
}

// Calls the function of this name; 0 when the bundle has none.
int call(CFBundleRef bundle, CFStringRef name) {
  void* const function = CFBundleGetFunctionPointerForName(bundle, name);
  return function == nullptr ? 0 : reinterpret_cast<int (*)()>(function)();
}

class CFBundle : public testing::Test {
 protected:
  CFBundle() { alarm(60); }  // Ends a test that waits.
  ~CFBundle() override { alarm(0); }

  // Whether the bundle at `path` loads and is the module only_here. Releases it.
  static bool loads(const std::string& path) {
    const CFBundleRef bundle = makeBundle(path);
    if (bundle == nullptr) return false;
    const bool loaded = CFBundleLoadExecutable(bundle) != 0;
    EXPECT_EQ(call(bundle, CFSTR("onlyHere")), loaded ? 3 : 0) << path;
    CFRelease(bundle);
    return loaded;
  }

  // What a load that must fail writes to standard error: one line, returned without its beginning and its
  // end.
  static std::string refusalOf(const std::string& path) {
    testing::internal::CaptureStderr();
    EXPECT_FALSE(loads(path)) << path;
    const std::string line = testing::internal::GetCapturedStderr();
    EXPECT_THAT(line, testing::MatchesRegex("vsttorture: [^\n]+\n"));
    return line.size() < 13 ? line : line.substr(12, line.size() - 13);
  }

  const BundleFiles files;
};

using CFBundleFolder = CFBundle;

TEST_F(CFBundleFolder, NamesAndPlacesOfTheExecutableAreTriedInTheirOrder) {
  std::vector<std::string> inOrder;
  for (const std::string& place :
       {kArchitectureFolder + "/", std::string("Contents/Linux/"), std::string("Contents/"), std::string()})
    for (const char* file : {"ProM", "ProM.so", "libProM.so"}) inOrder.push_back("ProM.vst/" + place + file);
  for (const std::string& file : inOrder) files.write(file, "#!");
  for (const std::string& file : inOrder) {
    EXPECT_THAT(refusalOf(files.path("ProM.vst")), StartsWith(files.path(file) + " is a script"));
    std::filesystem::remove(files.path(file));
  }
  EXPECT_EQ(refusalOf(files.path("ProM.vst")),
            files.path("ProM.vst") + " has no executable: looked for ProM, ProM.so and libProM.so in " +
                kArchitectureFolder + ", Contents/Linux, Contents and the folder itself");
}

TEST_F(CFBundleFolder, AModuleForMacOSDoesNotHideASharedObjectInAnotherPlace) {
  files.write("ProM.vst/Contents/MacOS/ProM", "\xCF\xFA\xED\xFE");
  files.write("ProM.vst/Contents/Info.plist",
              "<plist><dict><key>CFBundleExecutable</key><string>Other</string></dict></plist>");
  files.copy(ONLY_HERE, "ProM.vst/ProM.so");
  EXPECT_TRUE(loads(files.path("ProM.vst")));
}

TEST_F(CFBundleFolder, OnlyTheFoldersOfThisArchitectureAndSystemAreLookedInto) {
  for (const char* place : {"s390x-linux", "MacOS", "Resources"})
    files.copy(ONLY_HERE, std::string("ProM.vst/Contents/") + place + "/ProM.so");
  EXPECT_THAT(refusalOf(files.path("ProM.vst")), HasSubstr("has no executable"));
}

TEST_F(CFBundleFolder, OnlyTheLastExtensionIsCutOffTheName) {
  files.copy(ONLY_HERE, "Pro.M 1.2.vst/Pro.M 1.2.so");
  EXPECT_TRUE(loads(files.path("Pro.M 1.2.vst")));
  files.copy(ONLY_HERE, "ProM/ProM.so");
  EXPECT_TRUE(loads(files.path("ProM")));
}

TEST_F(CFBundleFolder, OnlyARegularFileIsAnExecutable) {
  files.makeFolder("ProM.vst/Contents/Linux/ProM");
  ASSERT_EQ(mkfifo(files.path("ProM.vst/Contents/Linux/ProM.so").c_str(), 0600), 0);
  std::filesystem::create_symlink("missing", files.path("ProM.vst/Contents/Linux/libProM.so"));
  EXPECT_THAT(refusalOf(files.path("ProM.vst")), HasSubstr("has no executable"));
  files.copy(ONLY_HERE, "ProM.vst/ProM");
  EXPECT_TRUE(loads(files.path("ProM.vst")));
}

TEST_F(CFBundleFolder, ASymbolicLinkToAFolderIsFollowedUnderItsOwnName) {
  files.makeFolder("Real.vst");
  std::filesystem::copy_file(ONLY_HERE, files.path("flat.so"));
  std::filesystem::create_symlink("../flat.so", files.path("Real.vst/Link.so"));
  std::filesystem::create_directory_symlink("Real.vst", files.path("Link.vst"));
  EXPECT_TRUE(loads(files.path("Link.vst")));
  EXPECT_THAT(refusalOf(files.path("Real.vst")), HasSubstr("has no executable"));
}

TEST_F(CFBundleFolder, TheRootFolderHasNoNameForAnExecutable) {
  EXPECT_EQ(refusalOf("/"), "/ has no executable");
  EXPECT_EQ(refusalOf("//."), "//. has no executable");
}

using CFBundleLoads = CFBundle;

TEST_F(CFBundleLoads, AFlatSharedObjectUnderAnyName) {
  for (const char* name : {"plug-in.so", "plug-in", "plug-in.vst", " two  blanks .so",
                           "\xC3\x9C\x62\x65r \xE9\x9F\xB3 \xF0\x9F\x8E\xB9.so"})
    EXPECT_TRUE(loads(files.copy(ONLY_HERE, name)));
}

TEST_F(CFBundleLoads, PathsThatEndWithSlashesOrADot) {
  files.copy(ONLY_HERE, "flat.so");
  files.copy(ONLY_HERE, "Kl\xC3\xA4nge.vst/Kl\xC3\xA4nge.so");
  for (const char* path :
       {"flat.so/", "flat.so///", "Kl\xC3\xA4nge.vst/", "Kl\xC3\xA4nge.vst//", "Kl\xC3\xA4nge.vst/."})
    EXPECT_TRUE(loads(files.path(path)));
}

TEST_F(CFBundleLoads, RelativePathsAndPathsWithoutASlash) {
  files.copy(ONLY_HERE, "folder/flat.so");
  files.copy(ONLY_HERE, "ProM.vst/ProM.so");
  const CurrentDirectory here(files.path("folder"));
  for (const char* path : {"./flat.so", "flat.so", "../ProM.vst"}) EXPECT_TRUE(loads(path));
  const CurrentDirectory inBundle(files.path("ProM.vst"));
  EXPECT_TRUE(loads("."));
}

TEST_F(CFBundleLoads, FromTheDirectoryThatWasCurrentWhenTheUrlWasMade) {
  files.copy(ONLY_HERE, "flat.so");
  CFBundleRef bundle = nullptr;
  {
    const CurrentDirectory here(files.path(""));
    bundle = makeBundle("flat.so");
  }
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  CFRelease(bundle);
}

TEST_F(CFBundleLoads, WithoutLettingOtherModulesSeeItsFunctions) {
  const CFBundleRef bundle = makeBundle(ONLY_HERE);
  ASSERT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_EQ(dlsym(RTLD_DEFAULT, "onlyHere"), nullptr);
  EXPECT_EQ(dlsym(RTLD_DEFAULT, "onlyInDependency"), nullptr);
  CFRelease(bundle);
}

TEST_F(CFBundleLoads, WithExceptionsOfStaticConstructorsReachingTheCaller) {
  // In a process of its own, as the module stays half loaded.
  const auto load = [] {
    _exit(thrownInt([] { CFBundleLoadExecutable(makeBundle(THROWS_WHEN_LOADED)); }).value_or(1));
  };
  EXPECT_EXIT(load(), testing::ExitedWithCode(42), "^$");
}

// All other reasons not to load a file are in tests/end_to_end/bad_input_test.cpp.
using CFBundleRefuses = CFBundle;

TEST_F(CFBundleRefuses, AModuleOfTheOtherWordSizeNamingBothArchitectures) {
  std::ostringstream content;
  content << std::ifstream(ONLY_HERE, std::ios::binary).rdbuf();
  std::string patched = content.str();
  patched[4] = sizeof(void*) == 8 ? 1 : 2;     // class
  patched[18] = sizeof(void*) == 8 ? 3 : '>';  // machine
  const std::string executable = files.write("ProM.vst/ProM.so", patched);
  EXPECT_EQ(refusalOf(files.path("ProM.vst")), executable + " is for " +
                                                   (sizeof(void*) == 8 ? "i386" : "x86_64") +
                                                   ", this program is for " + kThisProgram);
}

TEST_F(CFBundleRefuses, ABrokenFileAtEveryLoadAndFindsNothingInIt) {
  const std::string path = files.write("empty.so", "");
  const CFBundleRef bundle = makeBundle(path);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(CFBundleLoadExecutable(bundle));
  EXPECT_FALSE(CFBundleLoadExecutable(bundle));
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("main")), nullptr);
  CFBundleUnloadExecutable(bundle);
  CFRelease(bundle);
  const std::string line = "vsttorture: " + path + ": file too short\n";
  EXPECT_EQ(testing::internal::GetCapturedStderr(), line + line);
}

class CFBundleLoaded : public CFBundle {
 protected:
  void SetUp() override { ASSERT_TRUE(CFBundleLoadExecutable(bundle)); }
  // Lets the module set a flag when it is unloaded.
  static void watchUnloading(CFBundleRef watched, int* flag) {
    void* const function = CFBundleGetFunctionPointerForName(watched, CFSTR("setWhenUnloaded"));
    reinterpret_cast<void (*)(int*)>(function)(flag);
  }
  const CFBundleRef bundle = makeBundle(files.copy(ONLY_HERE, "a.so"));
};

TEST_F(CFBundleLoaded, FindsOnlyTheModulesOwnFunctions) {
  EXPECT_EQ(call(bundle, CFSTR("onlyHere")), 3);
  EXPECT_EQ(call(bundle, CFSTR("main")), 7);
  for (const CFStringRef name :
       {CFSTR("onlyInDependency"), CFSTR("malloc"), CFSTR("VSTPluginMain"), CFSTR("")})
    EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, name), nullptr);
  CFRelease(bundle);
}

TEST_F(CFBundleLoaded, NeverFindsTheProgramsOwnMain) {
  const CFBundleRef withoutMain = makeBundle(ONLY_IN_DEPENDENCY);
  ASSERT_TRUE(CFBundleLoadExecutable(withoutMain));
  EXPECT_EQ(CFBundleGetFunctionPointerForName(withoutMain, CFSTR("main")), nullptr);
  EXPECT_EQ(call(withoutMain, CFSTR("onlyInDependency")), 2);
  CFRelease(withoutMain);
  CFRelease(bundle);
}

TEST_F(CFBundleLoaded, IsUnloadedByOneUnloadHoweverOftenItWasLoadedAndLoadsAgain) {
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  int unloaded = 0;
  watchUnloading(bundle, &unloaded);
  CFBundleUnloadExecutable(bundle);
  EXPECT_EQ(unloaded, 1);
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyHere")), nullptr);
  CFBundleUnloadExecutable(bundle);
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_EQ(call(bundle, CFSTR("onlyHere")), 3);
  CFRelease(bundle);
}

TEST_F(CFBundleLoaded, ReleasingABundleUnloadsItsModuleUnlessAnotherBundleLoadedItToo) {
  const CFBundleRef second = makeBundle(files.path("a.so"));
  ASSERT_TRUE(CFBundleLoadExecutable(second));
  int unloaded = 0;
  watchUnloading(second, &unloaded);
  CFRelease(second);
  EXPECT_EQ(unloaded, 0);
  CFRelease(bundle);
  EXPECT_EQ(unloaded, 1);
}

}  // namespace
