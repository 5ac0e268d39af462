// SPDX-License-Identifier: MIT
// Which file of a bundle is loaded, on folders made for each test.
#include <filesystem>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/linux/bundle_layout.h"
#include "tests/platform/temporary_folder.h"

namespace {

using core_foundation::findBundleExecutable;

const std::string kArchitectureFolder = sizeof(void*) == 8 ? "Contents/x86_64-linux" : "Contents/i386-linux";

std::string infoPlist(const std::string& executable) {
  return "<plist><dict><key>CFBundleExecutable</key><string>" + executable + "</string></dict></plist>";
}

class BundleLayout : public testing::Test {
 protected:
  // What is found in the bundle, as a name below the temporary folder; "" when nothing is.
  std::string found(const std::string& bundle) const {
    const std::string path = findBundleExecutable(folder.path(bundle)).path;
    return path.empty() ? "" : std::filesystem::path(path).lexically_relative(folder.path("")).string();
  }
  std::string problem(const std::string& bundle) const {
    return findBundleExecutable(folder.path(bundle)).problem;
  }

  const TemporaryFolder folder;
};

TEST_F(BundleLayout, ARegularFileIsItsOwnBundleWhateverItsName) {
  folder.write("plug-in", "");
  EXPECT_EQ(found("plug-in"), "plug-in");
  EXPECT_EQ(problem("plug-in"), "");
}

TEST_F(BundleLayout, FoldersAndNamesAreTriedInTheirOrder) {
  const std::vector<std::string> places = {
      "Contents/Linux", kArchitectureFolder, "Contents/MacOS", "Contents", ".",
  };
  std::vector<std::string> inOrder;
  for (const std::string& place : places)
    for (const char* file : {"ProM", "ProM.so", "libProM.so"})
      inOrder.push_back(std::filesystem::path("ProM.vst/" + place + "/" + file).lexically_normal().string());
  for (const std::string& file : inOrder) folder.write(file, "");
  for (const std::string& file : inOrder) {
    EXPECT_EQ(found("ProM.vst"), file);
    std::filesystem::remove(folder.path(file));
  }
  EXPECT_EQ(found("ProM.vst"), "");
  EXPECT_EQ(problem("ProM.vst"), folder.path("ProM.vst") + " has no executable ProM");
}

TEST_F(BundleLayout, AnotherArchitecturesFolderIsNotLookedInto) {
  folder.write("ProM.vst/Contents/s390x-linux/ProM.so", "");
  EXPECT_EQ(found("ProM.vst"), "");
}

TEST_F(BundleLayout, OnlyTheLastExtensionIsCutOff) {
  folder.write("Pro.M.vst/Pro.M.so", "");
  EXPECT_EQ(found("Pro.M.vst"), "Pro.M.vst/Pro.M.so");
}

TEST_F(BundleLayout, ADirectoryWithoutExtensionGivesItsWholeName) {
  folder.write("ProM/ProM.so", "");
  EXPECT_EQ(found("ProM"), "ProM/ProM.so");
}

TEST_F(BundleLayout, SlashesAndDotsAtTheEndDoNotChangeTheName) {
  folder.write("ProM.vst/ProM.so", "");
  EXPECT_EQ(found("ProM.vst/"), "ProM.vst/ProM.so");
  EXPECT_EQ(found("ProM.vst//"), "ProM.vst/ProM.so");
  EXPECT_EQ(found("ProM.vst/."), "ProM.vst/ProM.so");
}

TEST_F(BundleLayout, ASymbolicLinkIsFollowedUnderItsOwnName) {
  folder.write("Real.vst/Link.so", "");
  std::filesystem::create_directory_symlink(folder.path("Real.vst"), folder.path("Link.vst"));
  EXPECT_EQ(found("Link.vst"), "Link.vst/Link.so");
  EXPECT_EQ(found("Real.vst"), "");
}

TEST_F(BundleLayout, TheKeyOfInfoPlistNamesTheExecutable) {
  folder.write("ProM.vst/Contents/Info.plist", infoPlist("Engine"));
  folder.write("ProM.vst/Contents/Linux/ProM.so", "");
  folder.write("ProM.vst/libEngine.so", "");
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/libEngine.so");
}

TEST_F(BundleLayout, InfoPlistMayLieInTheDirectoryItself) {
  folder.write("ProM.vst/Info.plist", infoPlist("Engine"));
  folder.write("ProM.vst/Engine", "");
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/Engine");
}

TEST_F(BundleLayout, InfoPlistOfContentsComesFirst) {
  folder.write("ProM.vst/Contents/Info.plist", infoPlist("First"));
  folder.write("ProM.vst/Info.plist", infoPlist("Second"));
  folder.write("ProM.vst/First", "");
  folder.write("ProM.vst/Contents/Linux/Second", "");
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/First");
}

TEST_F(BundleLayout, AKeyThatNamesAMissingFileFails) {
  folder.write("ProM.vst/Contents/Info.plist", infoPlist("Engine"));
  folder.write("ProM.vst/ProM.so", "");
  EXPECT_EQ(found("ProM.vst"), "");
  EXPECT_EQ(problem("ProM.vst"),
            folder.path("ProM.vst") + " has no executable Engine, which its Info.plist names");
}

TEST_F(BundleLayout, AKeyDoesNotLeaveTheBundle) {
  folder.write("outside", "");
  folder.write("outside.so", "");
  folder.write("ProM.vst/ProM.so", "");
  folder.write("ProM.vst/Contents/Linux/inner/file", "");
  for (const std::string& key :
       {std::string("../outside"), std::string("../../../outside"), folder.path("outside"),
        std::string("inner/file"), std::string("./ProM.so"), std::string("ProM.so/"), std::string("/"),
        std::string(".."), std::string(".")}) {
    folder.write("ProM.vst/Contents/Info.plist", infoPlist(key));
    EXPECT_EQ(found("ProM.vst"), "") << key;
    EXPECT_THAT(problem("ProM.vst"), testing::EndsWith(", which its Info.plist names"));
  }
}

class UnreadableInfoPlist : public BundleLayout {
 protected:
  UnreadableInfoPlist() {
    folder.makeFolder("ProM.vst/Contents");
    folder.write("ProM.vst/ProM.so", "");
    alarm(20);  // Ends a test that waits.
  }
  ~UnreadableInfoPlist() override { alarm(0); }
};

TEST_F(UnreadableInfoPlist, GarbageCountsAsAbsent) {
  folder.write("ProM.vst/Contents/Info.plist", std::string("bplist00\0\xFF", 10));
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/ProM.so");
}

TEST_F(UnreadableInfoPlist, GarbageInContentsLeavesTheOther) {
  folder.write("ProM.vst/Contents/Info.plist", "<plist>");
  folder.write("ProM.vst/Info.plist", infoPlist("Engine"));
  folder.write("ProM.vst/Engine", "");
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/Engine");
}

TEST_F(UnreadableInfoPlist, ADirectoryCountsAsAbsent) {
  folder.makeFolder("ProM.vst/Contents/Info.plist");
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/ProM.so");
}

TEST_F(UnreadableInfoPlist, AFifoCountsAsAbsentWithoutWaiting) {
  ASSERT_EQ(mkfifo(folder.path("ProM.vst/Contents/Info.plist").c_str(), 0600), 0);
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/ProM.so");
}

TEST_F(UnreadableInfoPlist, MoreThanAMebibyteCountsAsAbsent) {
  const std::string document = infoPlist("Engine");
  folder.write("ProM.vst/Engine", "");
  folder.write("ProM.vst/Contents/Info.plist", document + std::string(1048576 - document.size(), ' '));
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/Engine");
  folder.write("ProM.vst/Contents/Info.plist", document + std::string(1048577 - document.size(), ' '));
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/ProM.so");
}

TEST_F(BundleLayout, OnlyARegularFileIsAnExecutable) {
  folder.makeFolder("ProM.vst/Contents/Linux/ProM");
  ASSERT_EQ(mkfifo(folder.path("ProM.vst/Contents/Linux/ProM.so").c_str(), 0600), 0);
  std::filesystem::create_symlink("missing", folder.path("ProM.vst/Contents/Linux/libProM.so"));
  EXPECT_EQ(found("ProM.vst"), "");
  folder.write("ProM.vst/ProM", "");
  EXPECT_EQ(found("ProM.vst"), "ProM.vst/ProM");
}

TEST_F(BundleLayout, TheRootDirectoryHasNoName) {
  EXPECT_EQ(findBundleExecutable("/").path, "");
  EXPECT_EQ(findBundleExecutable("/").problem, "/ has no executable ");
}

}  // namespace
