// SPDX-License-Identifier: MIT
#include <atomic>
#include <filesystem>
#include <fstream>
#include <thread>

#include <gmock/gmock.h>
#include <linux/capability.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include "scanner/find/find_modules.h"
#include "tests/scanner/module_bytes.h"
#include "tests/shared/temporary_directory.h"

namespace fs = std::filesystem;
using scanner::findModules;
using scanner::FindResult;
using scanner::Module;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::SizeIs;

namespace {

class FindModules : public ::testing::Test {
 protected:
  /// A module of this machine's kind, or of another one.
  void putModule(const std::string& name, const ElfForm& form = {}) { putFile(name, elfBytes(form)); }
  void putFile(const std::string& name, const std::string& bytes) {
    const fs::path path = folder.path() / name;
    fs::create_directories(path.parent_path());
    std::ofstream(path, std::ios::binary) << bytes;
  }
  [[nodiscard]] std::string at(const std::string& name) const { return folder.path() / name; }

  /// The bundles that are found, relative to the folder.
  [[nodiscard]] std::vector<std::string> bundles(const std::vector<std::string>& paths) const {
    std::vector<std::string> names;
    for (const Module& module : findModules(paths).modules) names.push_back(relative(module.bundle));
    return names;
  }
  [[nodiscard]] std::vector<std::string> bundles() const { return bundles({folder.path()}); }
  [[nodiscard]] std::string relative(const std::string& path) const {
    return path.substr(folder.path().string().size() + 1);
  }

  TemporaryDirectory folder;
};

TEST_F(FindModules, ModulesBelowAFolderComeInByteOrderAndOtherFilesAreLeftOut) {
  putModule("b.so");
  putModule("a/deep/er/without_extension");
  putModule("B.so");
  putFile("readme.so", "no module");
  EXPECT_THAT(bundles(), ElementsAre("B.so", "a/deep/er/without_extension", "b.so"));
}

TEST_F(FindModules, RelativePathsAreTakenFromTheCurrentFolder) {
  putModule("sub/a.so");
  const fs::path before = fs::current_path();
  fs::current_path(folder.path());
  const FindResult byDot = findModules({"."});
  const FindResult byName = findModules({".//sub/"});
  const FindResult byFile = findModules({"sub/../sub/a.so"});
  fs::current_path(before);
  ASSERT_THAT(byDot.modules, SizeIs(1));
  EXPECT_EQ(byDot.modules[0].bundle, at("sub/a.so"));
  EXPECT_THAT(byName.places, ElementsAre(at("sub")));
  ASSERT_THAT(byFile.modules, SizeIs(1));
  EXPECT_EQ(byFile.modules[0].bundle, at("sub/../sub/a.so"));
}

TEST_F(FindModules, AFileUnderSeveralNamesIsOneModuleThatKnowsTheOthers) {
  putModule("a.so");
  fs::create_hard_link(at("a.so"), at("hard.so"));
  fs::create_symlink("a.so", at("soft.so"));
  const FindResult found = findModules({folder.path(), at("hard.so")});
  ASSERT_THAT(found.modules, SizeIs(1));
  EXPECT_EQ(found.modules[0].bundle, at("a.so"));
  EXPECT_THAT(found.modules[0].otherNames, ElementsAre(at("hard.so"), at("soft.so")));
}

TEST_F(FindModules, LinksToFoldersAreFollowedOnceAndLoopsEnd) {
  putModule("real/a.so");
  fs::create_directory_symlink("..", at("real/up"));
  fs::create_directory_symlink("real", at("alias"));
  fs::create_symlink("self", at("self"));
  fs::create_symlink("missing", at("broken"));
  const FindResult found = findModules({folder.path()});
  EXPECT_THAT(found.modules, SizeIs(1));
  EXPECT_THAT(found.unreadable, IsEmpty());
}

TEST_F(FindModules, NamesNeedNotBeUtf8) {
  putModule("\xFF\xC0 \n\x1B[31m.so");
  EXPECT_THAT(bundles(), ElementsAre("\xFF\xC0 \n\x1B[31m.so"));
}

TEST_F(FindModules, PipesAndSocketsAreNotOpened) {
  ASSERT_EQ(mkfifo(at("pipe.so").c_str(), 0600), 0);
  EXPECT_THAT(bundles(), IsEmpty());
}

TEST_F(FindModules, TenThousandFilesAreFound) {
  const std::string bytes = elfBytes({});
  for (int i = 0; i < 10000; ++i) putFile(std::to_string(i % 100) + "/" + std::to_string(i) + ".so", bytes);
  EXPECT_THAT(bundles(), SizeIs(10000));
}

TEST_F(FindModules, AFolderThatChangesMeanwhileCostsNoModuleThatStays) {
  putModule("stays.so");
  for (int i = 0; i < 50; ++i) putModule("sub" + std::to_string(i) + "/a.so");
  std::atomic<bool> isOver{false};
  std::thread changer([&] {
    for (int i = 0; !isOver; i = (i + 1) % 50) {
      std::error_code ignored;
      fs::remove_all(at("sub" + std::to_string(i)), ignored);
      putModule("sub" + std::to_string(i) + "/b.so");
    }
  });
  for (int i = 0; i < 20; ++i) EXPECT_THAT(bundles(), ::testing::Contains("stays.so"));
  isOver = true;
  changer.join();
}

/// Gives up what lets root read everything. The files stay those of their owner, whoever that is.
bool giveUpCapabilities() {
  __user_cap_header_struct header = {_LINUX_CAPABILITY_VERSION_3, 0};
  __user_cap_data_struct none[_LINUX_CAPABILITY_U32S_3] = {};
  return syscall(SYS_capset, &header, none) == 0;
}

/// Runs `check` in a child without root's rights. True when it held there.
template <class Check>
bool holdsWithoutRights(Check check) {
  const pid_t child = fork();
  if (child == 0) _exit(giveUpCapabilities() && check() ? 0 : 1);
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

TEST_F(FindModules, WhatCannotBeReadIsNamedWithTheReasonAndTheRestIsFound) {
  putModule("a.so");
  putModule("closed/b.so");
  putModule("listed/c.so");
  putModule("unreadable.so");
  fs::permissions(at("closed"), fs::perms(0));
  fs::permissions(at("listed"), fs::perms(0600));  // Its names can be read, what they stand for cannot.
  fs::permissions(at("unreadable.so"), fs::perms(0));
  EXPECT_TRUE(holdsWithoutRights([&] {
    const FindResult found = findModules({folder.path()});
    std::vector<std::string> problems;
    for (const auto& one : found.unreadable) problems.push_back(relative(one.path) + ": " + one.reason);
    return found.modules.size() == 1 &&
           problems == std::vector<std::string>{"closed: Permission denied", "listed/c.so: Permission denied",
                                                "unreadable.so: Permission denied"};
  }));
  EXPECT_TRUE(holdsWithoutRights([&] {
    const FindResult found = findModules({at("unreadable.so")});
    return found.modules.empty() && found.missing.size() == 1;
  }));
  fs::permissions(at("closed"), fs::perms(0700));
  fs::permissions(at("listed"), fs::perms(0700));
}

TEST_F(FindModules, NamedPathsThatCannotBeUsedAreMissing) {
  putModule("a.so");
  const FindResult found = findModules({at("gone"), at("a.so") + "/", "", "/dev/null"});
  std::vector<std::string> problems;
  for (const auto& one : found.missing) problems.push_back(one.path + ": " + one.reason);
  EXPECT_THAT(problems,
              ElementsAre(at("gone") + ": No such file or directory", at("a.so") + "/: Not a directory",
                          ": No such file or directory", "/dev/null: it is neither a file nor a folder"));
  EXPECT_THAT(found.modules, IsEmpty());
}

TEST_F(FindModules, ANamedFileIsTriedWhateverItHolds) {
  putFile("text", "text");
  const FindResult found = findModules({at("text")});
  ASSERT_THAT(found.modules, SizeIs(1));
  EXPECT_EQ(found.modules[0].target.processor, "");
}

// ---- Bundles ----------------------------------------------------------------------------------------------

struct Layout {
  const char* name;
  const char* executable;
};
class BundleLayouts : public FindModules, public ::testing::WithParamInterface<Layout> {};

TEST_P(BundleLayouts, TheFolderIsTheModule) {
  putModule(std::string("Name.vst/") + GetParam().executable);
  putModule("Name.vst/Contents/Resources/other.so");
  const FindResult found = findModules({folder.path()});
  ASSERT_THAT(found.modules, SizeIs(1));
  EXPECT_EQ(found.modules[0].bundle, at("Name.vst"));
  EXPECT_EQ(found.modules[0].executable, at(std::string("Name.vst/") + GetParam().executable));
  EXPECT_THAT(bundles({at("Name.vst/")}), ElementsAre("Name.vst"));
}

INSTANTIATE_TEST_SUITE_P(Places, BundleLayouts,
                         ::testing::Values(Layout{"ArchitectureFolder", "Contents/x86_64-linux/Name.so"},
                                           Layout{"LinuxFolder", "Contents/Linux/Name"},
                                           Layout{"Contents", "Contents/libName.so"},
                                           Layout{"FolderItself", "Name.so"}),
                         [](const auto& parameter) { return std::string(parameter.param.name); });

TEST_F(FindModules, ABundleForTwoProcessorsIsTwoModules) {
  ElfForm other;
  other.is64Bit = false;
  other.machine = 3;
  putModule("Name.vst/Contents/x86_64-linux/Name.so");
  putModule("Name.vst/Contents/i386-linux/Name.so", other);
  std::vector<std::string> targets;
  for (const Module& module : findModules({folder.path()}).modules)
    targets.push_back(relative(module.bundle) + " " + module.target.processor);
  EXPECT_THAT(targets, ElementsAre("Name.vst i386", "Name.vst x86_64"));
}

TEST_F(FindModules, ABundleOfMacOsIsRecognised) {
  putFile("Name.vst/Contents/MacOS/Name", machBytes({}));
  const FindResult found = findModules({folder.path()});
  ASSERT_THAT(found.modules, SizeIs(1));
  EXPECT_EQ(found.modules[0].bundle, at("Name.vst"));
  EXPECT_EQ(found.modules[0].target.system, scanner::Target::System::kMacOs);
}

TEST_F(FindModules, AFolderNamedLikeABundleThatHoldsNoExecutableIsSearched) {
  putModule("collection.vst/a.so");
  putModule("collection.VST/b.so");
  EXPECT_THAT(bundles(), ElementsAre("collection.VST/b.so", "collection.vst/a.so"));
}

// ---- Places -----------------------------------------------------------------------------------------------

TEST(Places, VstPathIsAllThereIsWhereItIsSet) {
  EXPECT_THAT(scanner::namedPlaces("/one::/two:", "/home/me"), ElementsAre("/one", "/two"));
}

TEST(Places, WithoutVstPathTheyAreThoseOfHomeAndSystem) {
  using ::testing::Contains;
  for (const char* vstPath : {static_cast<const char*>(nullptr), ""}) {
    const std::vector<std::string> places = scanner::namedPlaces(vstPath, "/home/me");
    for (const char* place : {"/home/me/.vst", "/home/me/.lxvst", "/usr/lib/vst", "/usr/local/lib/vst",
                              "/usr/lib/lxvst", "/usr/lib/x86_64-linux-gnu/vst"})
      EXPECT_THAT(places, Contains(place));
  }
}

TEST(Places, OnlyFoldersThatExistAreSearched) {
  const TemporaryDirectory folder;
  const std::string path = "/nonexistent:" + folder.path().string() + ":/dev/null";
  EXPECT_THAT(scanner::defaultPlaces(path.c_str(), nullptr), ElementsAre(folder.path().string()));
}

}  // namespace
