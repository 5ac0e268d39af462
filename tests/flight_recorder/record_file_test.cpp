// SPDX-License-Identifier: MIT
// The file behind a record. Which files are refused is tested with the program (tests/worker).
#include <fstream>

#include <dirent.h>
#include <gmock/gmock.h>
#include <sys/wait.h>
#include <unistd.h>

#include "flight_recorder/flight_recorder.h"
#include "flight_recorder/record_file.h"
#include "tests/flight_recorder/record_bytes.h"
#include "tests/shared/temporary_directory.h"

namespace {

std::size_t openDescriptors() {
  std::size_t count = 0;
  DIR* folder = opendir("/proc/self/fd");
  while (readdir(folder) != nullptr) ++count;
  closedir(folder);
  return count;
}

class RecordFile : public testing::Test {
 protected:
  ~RecordFile() override { forgetObservedRun(); }

  bool keep() { return keepRecordIn(path, whyNot); }

  const TemporaryDirectory folder;
  const std::string path = (folder.path() / "record").string();
  std::string whyNot;
};

TEST_F(RecordFile, IsMadeWithZerosAndLeavesNoDescriptorOpen) {
  const std::size_t before = openDescriptors();
  ASSERT_TRUE(keep()) << whyNot;
  EXPECT_EQ(RecordBytes::ofFile(path).bytes.substr(64), std::string(4032, '\0'));
  EXPECT_EQ(openDescriptors(), before);
}

TEST_F(RecordFile, OfAnEarlierRunStartsOver) {
  std::ofstream(path) << std::string(4096, 'x');
  ASSERT_TRUE(keep()) << whyNot;
  EXPECT_EQ(RecordBytes::ofFile(path).bytes.substr(64), std::string(4032, '\0'));
}

TEST_F(RecordFile, HoldsAStepAtOnce) {
  ASSERT_TRUE(keep()) << whyNot;
  noteStep(3, "inspect preset info");
  EXPECT_EQ(RecordBytes::ofFile(path).number32(16), static_cast<std::uint32_t>(getpid()));
  EXPECT_EQ(RecordBytes::ofFile(path).number32(36), 3u);
}

TEST_F(RecordFile, HoldsNothingOfAForkedProcess) {
  ASSERT_TRUE(keep()) << whyNot;
  noteStep(3, "inspect preset info");
  const pid_t child = fork();
  if (child == 0) {
    noteStep(4, "inspect parameter info");
    noteFault(11);
    _exit(0);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  EXPECT_EQ(RecordBytes::ofFile(path).number32(36), 3u);
  EXPECT_EQ(RecordBytes::ofFile(path).number32(224), 0u);
  noteStep(5, "testing setting states");
  EXPECT_EQ(RecordBytes::ofFile(path).number32(36), 5u);
}

}  // namespace
