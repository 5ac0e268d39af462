// SPDX-License-Identifier: MIT
#include <filesystem>
#include <fstream>
#include <random>

#include <gmock/gmock.h>

#include "scanner/find/module_file.h"
#include "tests/scanner/module_bytes.h"
#include "tests/shared/program_run.h"
#include "tests/shared/sanitizer.h"
#include "tests/shared/temporary_directory.h"

using scanner::ModuleFile;
using scanner::readModuleFile;
using scanner::Target;

namespace {

/// "linux x86_64"; "no module" for a file without a target, "nothing" where there is no file.
std::string targetIn(const std::string& path) {
  const std::optional<ModuleFile> file = readModuleFile(path);
  if (!file) return "nothing";
  if (!file->target) return "no module";
  const char* const systems[] = {"linux ", "macos ", "windows "};
  return systems[static_cast<int>(file->target->system)] + file->target->processor;
}

/// A new file in place of the old one: some file systems wait for the disk when a file is written over.
void putFile(const std::string& path, const std::string& bytes) {
  std::filesystem::remove(path);
  std::ofstream(path, std::ios::binary) << bytes;
}

class ModuleFiles : public ::testing::Test {
 protected:
  std::string targetOf(const std::string& bytes) {
    const std::string path = folder.path() / "module";
    putFile(path, bytes);
    return targetIn(path);
  }
  TemporaryDirectory folder;
};

struct Case {
  const char* name;
  std::string bytes;
  const char* target;
};

std::string elf(bool is64Bit, bool isBigEndian, std::uint16_t machine, bool hasGnuHash) {
  return elfBytes({is64Bit, isBigEndian, machine, hasGnuHash});
}
std::string elfWithSymbol(const char* symbol) {
  ElfForm form;
  form.symbol = symbol;
  return elfBytes(form);
}
template <class Form, class Change>
Form changed(Form form, Change change) {
  change(form);
  return form;
}

const Case kCases[] = {
    {"X8664WithGnuHash", elf(true, false, 62, true), "linux x86_64"},
    {"X8664WithTheOlderHash", elf(true, false, 62, false), "linux x86_64"},
    {"I386WithGnuHash", elf(false, false, 3, true), "linux i386"},
    {"I386WithTheOlderHash", elf(false, false, 3, false), "linux i386"},
    {"Aarch64", elf(true, false, 183, true), "linux aarch64"},
    {"X32", elf(false, false, 62, true), "linux x32"},
    {"BigEndian64BitWithGnuHash", elf(true, true, 21, true), "linux powerpc64"},
    {"BigEndian64BitWithTheOlderHash", elf(true, true, 21, false), "linux powerpc64"},
    {"BigEndian32BitWithGnuHash", elf(false, true, 20, true), "linux powerpc"},
    {"BigEndian32BitWithTheOlderHash", elf(false, true, 20, false), "linux powerpc"},
    {"AProcessorWithoutAName", elf(true, false, 4711, true), "linux machine 4711"},
    {"EntryPointNamedMainMacho", elfWithSymbol("main_macho"), "linux x86_64"},
    {"EntryPointNamedMain", elfWithSymbol("main"), "linux x86_64"},
    {"LibraryWithoutAnEntryPoint", elfWithSymbol("VSTPluginMainX"), "no module"},
    {"EntryPointThatIsOnlyAskedFor", elfBytes(changed(ElfForm{}, [](ElfForm& f) { f.isDefined = false; })),
     "no module"},
    {"EntryPointThatIsNoFunction", elfBytes(changed(ElfForm{}, [](ElfForm& f) { f.symbolType = 1; })),
     "no module"},
    {"ProgramThatExportsMain",
     elfBytes(changed(ElfForm{},
                      [](ElfForm& f) {
                        f.symbol = "main";
                        f.hasInterpreter = true;
                      })),
     "no module"},
    {"LibraryThatCanAlsoBeRun", elfBytes(changed(ElfForm{}, [](ElfForm& f) { f.hasInterpreter = true; })),
     "linux x86_64"},
    {"ProgramAtAFixedAddress", elfBytes(changed(ElfForm{}, [](ElfForm& f) { f.fileType = 2; })), "no module"},
    {"MacBundle", machBytes({}), "macos x86_64"},
    {"MacBundleOf32Bit", machBytes({false, false, 7}), "macos i386"},
    {"MacBundleOfPowerPc", machBytes({false, true, 18}), "macos powerpc"},
    {"MacLibrary", machBytes({true, false, 0x0100000C, 6}), "macos aarch64"},
    {"MacProgram", machBytes({true, false, 0x01000007, 2}), "no module"},
    {"MacBundleWithoutAnEntryPoint", machBytes({true, false, 7, 8, "_other"}), "no module"},
    {"MacBundleThatAsksForTheEntryPoint", machBytes({true, false, 7, 8, "_VSTPluginMain", 0x01}),
     "no module"},
    {"MacBundleOfTwoProcessors",
     fatMachBytes({machBytes({true, false, 0x0100000C}), machBytes({true, false, 0x01000007})}, false),
     "macos aarch64"},
    {"MacBundleOfTwoProcessorsWhoseSecondHasTheEntryPoint",
     fatMachBytes({machBytes({true, false, 7, 8, "_other"}), machBytes({true, false, 0x01000007})}, true),
     "macos x86_64"},
    {"JavaClass", std::string("\xCA\xFE\xBA\xBE\x00\x00\x00\x34", 8) + std::string(100, 'x'), "no module"},
    {"WindowsLibraryOf64Bit", peBytes({}), "windows x86_64"},
    {"WindowsLibraryOf32Bit", peBytes({false, 0x014C}), "windows i386"},
    {"WindowsLibraryWithMain", peBytes({true, 0xAA64, true, "main"}), "windows aarch64"},
    {"WindowsProgram", peBytes({true, 0x8664, false}), "no module"},
    {"WindowsLibraryWithoutAnEntryPoint", peBytes({true, 0x8664, true, "DllMain"}), "no module"},
    {"EmptyFile", "", "no module"},
    {"Text", "#!/bin/sh\necho VSTPluginMain main\n", "no module"},
};

class ReadModuleFile : public ModuleFiles, public ::testing::WithParamInterface<Case> {};

TEST_P(ReadModuleFile, TellsSystemAndProcessor) { EXPECT_EQ(targetOf(GetParam().bytes), GetParam().target); }

/// Whatever is missing, and wherever a number points that is not what it was: the answer may be anything, but
/// there is one, and soon.
TEST_P(ReadModuleFile, SurvivesTruncationAtEveryLength) {
  const std::string& whole = GetParam().bytes;
  const std::size_t limit = std::min<std::size_t>(whole.size(), 700);
  for (std::size_t size = 0; size < limit; ++size) targetOf(whole.substr(0, size));
}

INSTANTIATE_TEST_SUITE_P(Files, ReadModuleFile, ::testing::ValuesIn(kCases),
                         [](const auto& parameter) { return std::string(parameter.param.name); });

TEST_F(ModuleFiles, DamagedFilesAreReadWithoutHarm) {
  std::mt19937 random(20260101);
  const std::string path = folder.path() / "damaged";
  // One thread reads them: another sanitizer has more to say of it.
  const int rounds = kWithThreadSanitizer ? 1000 : 10000;
  for (int i = 0; i < rounds; ++i) {
    std::string bytes = kCases[random() % std::size(kCases)].bytes;
    const unsigned damages = 1 + random() % 8;
    for (unsigned k = 0; k < damages && !bytes.empty(); ++k)
      bytes[random() % std::min<std::size_t>(bytes.size(), 600)] = static_cast<char>(random());
    putFile(path, bytes);
    ASSERT_NE(targetIn(path), "nothing");
  }
}

TEST_F(ModuleFiles, RandomBytesAreNoModule) {
  std::mt19937 random(20260102);
  const std::string path = folder.path() / "random";
  for (int i = 0; i < 1000; ++i) {
    std::string bytes(random() % 2000, '\0');
    for (char& c : bytes) c = static_cast<char>(random());
    putFile(path, bytes);
    ASSERT_EQ(targetIn(path), "no module");
  }
}

TEST_F(ModuleFiles, AHashChainThatNeverEndsIsGivenUp) {
  ElfForm form;
  form.hasGnuHash = false;
  form.symbol = "other";
  std::string bytes = elfBytes(form);
  // At the end of the file stand the number of symbols, three buckets and two chains: there are very many
  // symbols, each bucket begins with the only one, and its chain names it again.
  bytes[bytes.size() - 21] = '\x7F';
  for (const unsigned distance : {20, 16, 12, 4}) bytes[bytes.size() - distance] = 1;
  EXPECT_EQ(targetOf(bytes), "no module");
}

TEST(ReadModuleFileOfOurs, SamplePluginsAreModulesOfThisProcessor) {
  const std::optional<Target> own = scanner::targetOfProgram("/proc/self/exe");
  ASSERT_TRUE(own);
  for (const char* name : {"well_behaved_effect", "older_entry", "main_macho_entry", "shell"})
    EXPECT_EQ(targetIn(samplePlugin(name)), "linux " + own->processor) << name;
  EXPECT_EQ(targetIn(samplePlugin("no_entry")), "no module");
}

TEST_F(ModuleFiles, WhatIsNoFileIsNothing) {
  EXPECT_EQ(targetIn(folder.path()), "nothing");
  EXPECT_EQ(targetIn(folder.path() / "missing"), "nothing");
  EXPECT_EQ(targetIn("/dev/null"), "nothing");
}

TEST_F(ModuleFiles, LinksToOneFileHaveOneIdentity) {
  const std::filesystem::path file = folder.path() / "module";
  targetOf(elfBytes({}));
  std::filesystem::create_hard_link(file, folder.path() / "hard");
  std::filesystem::create_symlink(file, folder.path() / "soft");
  std::filesystem::copy_file(file, folder.path() / "copy");
  const auto identity = [&](const char* name) { return readModuleFile(folder.path() / name)->identity; };
  EXPECT_TRUE(identity("module").isSameFileAs(identity("hard")));
  EXPECT_TRUE(identity("module").isSameFileAs(identity("soft")));
  EXPECT_FALSE(identity("module").isSameFileAs(identity("copy")));
}

}  // namespace
