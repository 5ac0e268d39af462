// SPDX-License-Identifier: MIT
// CFBundle on real shared objects: what loads, what is found in it, and the line that each refusal leaves.
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include <dlfcn.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include "platform/core_foundation.h"
#include "platform/entry_point_name.h"
#include "tests/platform/temporary_folder.h"

namespace {

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::StartsWith;

// Goes the way of a caller from a path to a bundle; null as soon as a step fails.
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

int call(void* function) { return reinterpret_cast<int (*)()>(function)(); }

std::string contentOf(const std::string& path) {
  std::ostringstream content;
  content << std::ifstream(path, std::ios::binary).rdbuf();
  return content.str();
}

class CFBundle : public testing::Test {
 protected:
  CFBundle() { alarm(60); }  // Ends a test that waits.
  ~CFBundle() override { alarm(0); }

  // Says whether the bundle at `path` loads and is the module only_here; then unloads it.
  static bool loads(const std::string& path) {
    const CFBundleRef bundle = makeBundle(path);
    if (bundle == nullptr) return false;
    const bool loaded = CFBundleLoadExecutable(bundle) != 0;
    void* const function = CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyHere"));
    const bool isOnlyHere = loaded && function != nullptr && call(function) == 3;
    CFRelease(bundle);
    EXPECT_EQ(isOnlyHere, loaded) << path << " is another module";
    return isOnlyHere;
  }

  // What a load that must fail writes to standard error, without the line's start and end.
  static std::string reasonAgainst(const std::string& path) {
    testing::internal::CaptureStderr();
    const bool loaded = loads(path);
    const std::string said = testing::internal::GetCapturedStderr();
    EXPECT_FALSE(loaded) << path;
    EXPECT_THAT(said, StartsWith("vsttorture: "));
    EXPECT_EQ(said.find('\n'), said.size() - 1) << "not one line: " << said;
    return said.size() < 13 ? said : said.substr(12, said.size() - 13);
  }

  // A copy of the module only_here whose header is for other machines.
  std::string patchedCopy(const std::string& name, char elfClass, char machine) const {
    std::string content = contentOf(ONLY_HERE);
    content[4] = elfClass;
    content[18] = machine;
    return folder.write(name, content);
  }

  const TemporaryFolder folder;
  const std::string thisProgram = sizeof(void*) == 8 ? "x86_64" : "i386";
};

using CFBundleLoads = CFBundle;

TEST_F(CFBundleLoads, AFlatSharedObjectUnderAnyName) {
  EXPECT_TRUE(loads(folder.copy(ONLY_HERE, "plug-in.so")));
  EXPECT_TRUE(loads(folder.copy(ONLY_HERE, "plug-in")));
  EXPECT_TRUE(loads(folder.copy(ONLY_HERE, "plug-in.vst")));
}

TEST_F(CFBundleLoads, ADirectoryWithItsExecutable) {
  folder.copy(ONLY_HERE, "ProM.vst/ProM.so");
  EXPECT_TRUE(loads(folder.path("ProM.vst")));
}

TEST_F(CFBundleLoads, ADirectoryWithAKey) {
  folder.write("ProM.vst/Contents/Info.plist",
               "<plist><dict><key>CFBundleExecutable</key><string>Engine</string></dict></plist>");
  folder.copy(ONLY_HERE, "ProM.vst/Contents/Linux/libEngine.so");
  EXPECT_TRUE(loads(folder.path("ProM.vst")));
}

TEST_F(CFBundleLoads, PathsThatEndWithASlash) {
  folder.copy(ONLY_HERE, "ProM.vst/ProM.so");
  EXPECT_TRUE(loads(folder.path("ProM.vst/")));
  EXPECT_TRUE(loads(folder.path("ProM.vst//")));
  EXPECT_TRUE(loads(folder.copy(ONLY_HERE, "flat.so") + "/"));
  EXPECT_TRUE(loads(folder.path("flat.so///")));
}

TEST_F(CFBundleLoads, ThroughSymbolicLinks) {
  folder.copy(ONLY_HERE, "elsewhere/flat.so");
  std::filesystem::create_symlink("elsewhere/flat.so", folder.path("link.vst"));
  EXPECT_TRUE(loads(folder.path("link.vst")));
  folder.makeFolder("ProM.vst");
  std::filesystem::create_symlink("../elsewhere/flat.so", folder.path("ProM.vst/ProM.so"));
  EXPECT_TRUE(loads(folder.path("ProM.vst")));
  std::filesystem::create_symlink("../ProM.vst", folder.path("elsewhere/ProM.vst"));
  EXPECT_TRUE(loads(folder.path("elsewhere/ProM.vst")));
}

TEST_F(CFBundleLoads, BlanksAndOtherLetters) {
  EXPECT_TRUE(loads(folder.copy(ONLY_HERE, " two  blanks .so")));
  EXPECT_TRUE(loads(folder.copy(ONLY_HERE,
                                "\xC3\x9C"
                                "ber \xE9\x9F\xB3 \xF0\x9F\x8E\xB9.so")));
  folder.copy(ONLY_HERE, "Kl\xC3\xA4nge 1.2.vst/Kl\xC3\xA4nge 1.2.so");
  EXPECT_TRUE(loads(folder.path("Kl\xC3\xA4nge 1.2.vst")));
}

TEST_F(CFBundleLoads, RelativePathsAndPathsWithoutASlash) {
  folder.copy(ONLY_HERE, "folder/flat.so");
  folder.copy(ONLY_HERE, "ProM.vst/ProM.so");
  const CurrentDirectory here(folder.path("folder"));
  EXPECT_TRUE(loads("./flat.so"));
  EXPECT_TRUE(loads("flat.so"));
  EXPECT_TRUE(loads("../ProM.vst"));
  const CurrentDirectory inBundle(folder.path("ProM.vst"));
  EXPECT_TRUE(loads("."));
}

TEST_F(CFBundleLoads, WhereTheUrlWasMadeWhateverTheCurrentDirectoryIsLater) {
  folder.copy(ONLY_HERE, "flat.so");
  CFBundleRef bundle = nullptr;
  {
    const CurrentDirectory here(folder.path(""));
    bundle = makeBundle("flat.so");
  }
  ASSERT_NE(bundle, nullptr);
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  CFRelease(bundle);
}

TEST_F(CFBundleLoads, TheFirstTimeOnlyWhenAskedTwice) {
  const CFBundleRef bundle = makeBundle(folder.copy(ONLY_HERE, "a.so"));
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  void* const first = CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyHere"));
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyHere")), first);
  CFBundleUnloadExecutable(bundle);
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyHere")), nullptr);
  CFRelease(bundle);
}

TEST_F(CFBundleLoads, WithoutLettingOtherModulesSeeItsFunctions) {
  const CFBundleRef bundle = makeBundle(folder.copy(ONLY_HERE, "a.so"));
  ASSERT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_EQ(dlsym(RTLD_DEFAULT, "onlyHere"), nullptr);
  EXPECT_EQ(dlsym(RTLD_DEFAULT, "onlyInDependency"), nullptr);
  CFRelease(bundle);
}

TEST_F(CFBundleLoads, WithExceptionsOfStaticConstructorsPassingThrough) {
  const auto load = [] {
    const CFBundleRef bundle = makeBundle(THROWS_WHEN_LOADED);
    try {
      CFBundleLoadExecutable(bundle);
    } catch (int thrown) {
      _exit(thrown);
    }
    _exit(1);
  };
  EXPECT_EXIT(load(), testing::ExitedWithCode(42), "^$");
}

using CFBundleRefuses = CFBundle;

TEST_F(CFBundleRefuses, APathThatDoesNotExist) {
  const std::string path = folder.path("missing.so");
  EXPECT_EQ(reasonAgainst(path), path + ": No such file or directory");
}

TEST_F(CFBundleRefuses, ADanglingLink) {
  std::filesystem::create_symlink("missing", folder.path("link.so"));
  EXPECT_EQ(reasonAgainst(folder.path("link.so")), folder.path("link.so") + ": No such file or directory");
}

TEST_F(CFBundleRefuses, APathThroughAFile) {
  folder.write("file", "");
  EXPECT_EQ(reasonAgainst(folder.path("file/a.so")), folder.path("file/a.so") + ": Not a directory");
}

TEST_F(CFBundleRefuses, ATextFile) {
  const std::string path = folder.write("text.so", std::string(20, '\n') + std::string(2000, 'x'));
  EXPECT_THAT(reasonAgainst(path), AllOf(HasSubstr(path), HasSubstr("ELF header")));
}

TEST_F(CFBundleRefuses, AnEmptyFile) {
  const std::string path = folder.write("empty.so", "");
  EXPECT_EQ(reasonAgainst(path), path + ": file too short");
}

TEST_F(CFBundleRefuses, ADirectoryWithoutExecutable) {
  const std::string path = folder.makeFolder("ProM.vst");
  EXPECT_EQ(reasonAgainst(path), path + " has no executable ProM");
}

TEST_F(CFBundleRefuses, ADirectoryWhoseKeyNamesAMissingFile) {
  folder.copy(ONLY_HERE, "ProM.vst/ProM.so");
  folder.write("ProM.vst/Info.plist",
               "<plist><dict><key>CFBundleExecutable</key><string>Two\nLines</string></dict></plist>");
  EXPECT_EQ(reasonAgainst(folder.path("ProM.vst")),
            folder.path("ProM.vst") + " has no executable Two Lines, which its Info.plist names");
}

TEST_F(CFBundleRefuses, TheOtherWordSizeNamingBoth) {
  const std::string path =
      sizeof(void*) == 8 ? patchedCopy("other.so", 1, 3) : patchedCopy("other.so", 2, 62);
  const std::string other = sizeof(void*) == 8 ? "i386" : "x86_64";
  EXPECT_EQ(reasonAgainst(path), path + " is for " + other + ", this program is for " + thisProgram);
}

TEST_F(CFBundleRefuses, AnotherArchitectureInADirectoryNamingBoth) {
  const std::string path = patchedCopy("ProM.vst/ProM.so", 2, '\xB7');
  EXPECT_EQ(reasonAgainst(folder.path("ProM.vst")),
            path + " is for aarch64, this program is for " + thisProgram);
}

struct ForeignFile {
  const char* name;
  std::string content;
  const char* format;
};
class CFBundleForeignFile : public CFBundle, public testing::WithParamInterface<ForeignFile> {};

TEST_P(CFBundleForeignFile, IsRefusedAndNamed) {
  const std::string path = folder.write("ProM.vst/Contents/MacOS/ProM", GetParam().content);
  EXPECT_EQ(reasonAgainst(folder.path("ProM.vst")),
            path + " is " + GetParam().format + ", not a shared object for Linux");
}

std::string withRest(const std::string& firstBytes) { return firstBytes + std::string(1000, '\1'); }

INSTANTIATE_TEST_SUITE_P(
    Formats, CFBundleForeignFile,
    testing::Values(ForeignFile{"MacOS32", withRest("\xCE\xFA\xED\xFE"), "a module for macOS"},
                    ForeignFile{"MacOS64", withRest("\xCF\xFA\xED\xFE"), "a module for macOS"},
                    ForeignFile{"MacOSPowerpc", withRest("\xFE\xED\xFA\xCE"), "a module for macOS"},
                    ForeignFile{"MacOSPowerpc64", withRest("\xFE\xED\xFA\xCF"), "a module for macOS"},
                    ForeignFile{"MacOSUniversal", withRest("\xCA\xFE\xBA\xBE"), "a module for macOS"},
                    ForeignFile{"MacOSUniversal64", withRest("\xCA\xFE\xBA\xBF"), "a module for macOS"},
                    ForeignFile{"Windows", withRest("MZ"), "a module for Windows"},
                    ForeignFile{"StaticLibrary", withRest("!<arch>\n"), "a static library"},
                    ForeignFile{"Script", "#!/bin/sh\n", "a script"}),
    [](const auto& test) { return test.param.name; });

TEST_F(CFBundleRefuses, AFileThatOnlyBeginsLikeAStaticLibrary) {
  EXPECT_THAT(reasonAgainst(folder.write("a.so", withRest("!<arch>"))), HasSubstr("ELF header"));
}

TEST_F(CFBundleRefuses, AnUndefinedSymbol) {
  const std::string path = folder.copy(UNDEFINED_SYMBOL, "undefined.so");
  EXPECT_EQ(reasonAgainst(path), path + ": undefined symbol: thisFunctionExistsNowhere");
}

TEST_F(CFBundleRefuses, AProgram) { EXPECT_THAT(reasonAgainst("/proc/self/exe"), HasSubstr("executable")); }

TEST_F(CFBundleRefuses, InvalidUtf8) {
  EXPECT_EQ(reasonAgainst("/tmp/\xFF.so"), "not valid UTF-8: /tmp/\\xff.so");
}

TEST_F(CFBundleRefuses, AnEmptyPath) { EXPECT_EQ(reasonAgainst(""), "the path is empty"); }

TEST_F(CFBundleRefuses, APathOfFiveThousandCharacters) {
  const std::string path = "/" + std::string(4999, 'a');
  EXPECT_EQ(reasonAgainst(path), path + ": File name too long");
}

TEST_F(CFBundleRefuses, ANameWithALineEndInOneLine) {
  const std::string shown = folder.path("two lines\x7F.so");
  EXPECT_THAT(reasonAgainst(folder.write("two\nlines.so", "no plug-in")),
              AllOf(HasSubstr("/two lines.so"), HasSubstr("too short")));
}

TEST_F(CFBundleRefuses, LibrariesOfTheSearchPath) {
  const CurrentDirectory here(folder.path(""));
  EXPECT_THAT(reasonAgainst("libm.so.6"), EndsWith("/libm.so.6: No such file or directory"));
}

TEST_F(CFBundleRefuses, AFifoWithoutWaiting) {
  const std::string path = folder.path("fifo.so");
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  EXPECT_EQ(reasonAgainst(path), path + " is neither a file nor a directory");
}

TEST_F(CFBundleRefuses, Devices) {
  EXPECT_EQ(reasonAgainst("/dev/null"), "/dev/null is neither a file nor a directory");
  EXPECT_EQ(reasonAgainst("/dev/zero"), "/dev/zero is neither a file nor a directory");
}

TEST_F(CFBundleRefuses, ASocket) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  const std::string path = folder.path("socket");
  ASSERT_LT(path.size(), sizeof address.sun_path);
  std::memcpy(address.sun_path, path.c_str(), path.size());
  const int listener = socket(AF_UNIX, SOCK_STREAM, 0);
  ASSERT_EQ(bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
  EXPECT_EQ(reasonAgainst(path), path + " is neither a file nor a directory");
  close(listener);
}

TEST_F(CFBundleRefuses, AtCreationWhatIsMissingAndAtLoadingWhatIsBroken) {
  testing::internal::CaptureStderr();
  EXPECT_EQ(makeBundle(folder.path("missing.so")), nullptr);
  EXPECT_EQ(makeBundle("/dev/null"), nullptr);
  const CFBundleRef empty = makeBundle(folder.write("empty.so", ""));
  ASSERT_NE(empty, nullptr);
  EXPECT_EQ(CFGetRetainCount(empty), 1);
  EXPECT_FALSE(CFBundleLoadExecutable(empty));
  EXPECT_FALSE(CFBundleLoadExecutable(empty));
  EXPECT_EQ(CFBundleGetFunctionPointerForName(empty, CFSTR("main")), nullptr);
  CFBundleUnloadExecutable(empty);
  CFRelease(empty);
  testing::internal::GetCapturedStderr();
}

class CFBundleGetFunctionPointerForNameTest : public CFBundle {
 protected:
  CFBundleGetFunctionPointerForNameTest() { CFBundleLoadExecutable(bundle); }
  ~CFBundleGetFunctionPointerForNameTest() override { CFRelease(bundle); }
  const CFBundleRef bundle = makeBundle(folder.copy(ONLY_HERE, "a.so"));
};

TEST_F(CFBundleGetFunctionPointerForNameTest, FindsTheModulesOwn) {
  EXPECT_EQ(call(CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyHere"))), 3);
}

TEST_F(CFBundleGetFunctionPointerForNameTest, LeavesItsLibrariesAside) {
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyInDependency")), nullptr);
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("malloc")), nullptr);
}

TEST_F(CFBundleGetFunctionPointerForNameTest, GivesNullForOtherNames) {
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("VSTPluginMain")), nullptr);
  EXPECT_EQ(CFBundleGetFunctionPointerForName(bundle, CFSTR("")), nullptr);
}

TEST_F(CFBundleGetFunctionPointerForNameTest, FindsTheOldestEntryPoint) {
  EXPECT_EQ(call(CFBundleGetFunctionPointerForName(bundle, systemEntryPointName())), 7);
}

TEST_F(CFBundleGetFunctionPointerForNameTest, NeverFindsTheProgramsOwnMain) {
  const CFBundleRef withoutMain = makeBundle(ONLY_IN_DEPENDENCY);
  ASSERT_TRUE(CFBundleLoadExecutable(withoutMain));
  EXPECT_EQ(CFBundleGetFunctionPointerForName(withoutMain, CFSTR("main")), nullptr);
  EXPECT_EQ(call(CFBundleGetFunctionPointerForName(withoutMain, CFSTR("onlyInDependency"))), 2);
  CFRelease(withoutMain);
}

TEST_F(CFBundleGetFunctionPointerForNameTest, GivesNullBeforeLoading) {
  const CFBundleRef notLoaded = makeBundle(ONLY_HERE);
  EXPECT_EQ(CFBundleGetFunctionPointerForName(notLoaded, CFSTR("onlyHere")), nullptr);
  CFRelease(notLoaded);
}

// Hands the module a flag that it sets when it is unloaded.
void watchUnloading(CFBundleRef bundle, int* flag) {
  void* const function = CFBundleGetFunctionPointerForName(bundle, CFSTR("setWhenUnloaded"));
  reinterpret_cast<void (*)(int*)>(function)(flag);
}

using CFBundleUnloadExecutableTest = CFBundleGetFunctionPointerForNameTest;

TEST_F(CFBundleUnloadExecutableTest, RunsTheModulesDestructors) {
  int unloaded = 0;
  watchUnloading(bundle, &unloaded);
  CFBundleUnloadExecutable(bundle);
  EXPECT_EQ(unloaded, 1);
  CFBundleUnloadExecutable(bundle);
  EXPECT_EQ(CFGetRetainCount(bundle), 1);
}

TEST_F(CFBundleUnloadExecutableTest, NeedsToBeDoneOnceHoweverOftenItWasLoaded) {
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  int unloaded = 0;
  watchUnloading(bundle, &unloaded);
  CFBundleUnloadExecutable(bundle);
  EXPECT_EQ(unloaded, 1);
}

TEST_F(CFBundleUnloadExecutableTest, LeavesABundleThatLoadsAgain) {
  CFBundleUnloadExecutable(bundle);
  EXPECT_TRUE(CFBundleLoadExecutable(bundle));
  EXPECT_EQ(call(CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyHere"))), 3);
}

TEST_F(CFBundleUnloadExecutableTest, ComesWithTheLastRelease) {
  const CFBundleRef other = makeBundle(folder.copy(ONLY_HERE, "other.so"));
  ASSERT_TRUE(CFBundleLoadExecutable(other));
  int unloaded = 0;
  watchUnloading(other, &unloaded);
  CFRetain(other);
  CFRelease(other);
  EXPECT_EQ(unloaded, 0);
  CFRelease(other);
  EXPECT_EQ(unloaded, 1);
}

TEST_F(CFBundleUnloadExecutableTest, KeepsTheCodeThatAnotherBundleLoaded) {
  const CFBundleRef second = makeBundle(folder.path("a.so"));
  ASSERT_TRUE(CFBundleLoadExecutable(second));
  int unloaded = 0;
  watchUnloading(second, &unloaded);
  CFRelease(second);
  EXPECT_EQ(unloaded, 0);
  EXPECT_EQ(call(CFBundleGetFunctionPointerForName(bundle, CFSTR("onlyHere"))), 3);
  CFBundleUnloadExecutable(bundle);
  EXPECT_EQ(unloaded, 1);
}

}  // namespace
