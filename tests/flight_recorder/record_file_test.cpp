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

RecordBytes bytesIn(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  RecordBytes record;
  record.bytes.assign(std::istreambuf_iterator<char>(file), {});
  return record;
}

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

  FlightRecord* map() { return mapRecordFile(path, whyNot); }

  const TemporaryDirectory folder;
  const std::string path = (folder.path() / "record").string();
  std::string whyNot;
};

TEST_F(RecordFile, IsMadeWithZerosAndLeavesNoDescriptorOpen) {
  const std::size_t before = openDescriptors();
  ASSERT_NE(map(), nullptr) << whyNot;
  EXPECT_EQ(bytesIn(path).bytes, std::string(4096, '\0'));
  EXPECT_EQ(openDescriptors(), before);
}

TEST_F(RecordFile, OfAnEarlierRunStartsOver) {
  std::ofstream(path) << std::string(4096, 'x');
  ASSERT_NE(map(), nullptr) << whyNot;
  EXPECT_EQ(bytesIn(path).bytes, std::string(4096, '\0'));
}

TEST_F(RecordFile, HoldsAStepAtOnce) {
  observeThisProcess(*map());
  noteStep(3, "inspect preset info");
  EXPECT_EQ(bytesIn(path).number32(16), static_cast<std::uint32_t>(getpid()));
  EXPECT_EQ(bytesIn(path).number32(36), 3u);
}

TEST_F(RecordFile, HoldsNothingOfAForkedProcess) {
  observeThisProcess(*map());
  noteStep(3, "inspect preset info");
  const pid_t child = fork();
  if (child == 0) {
    noteStep(4, "inspect parameter info");
    noteFault(11);
    _exit(0);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  EXPECT_EQ(bytesIn(path).number32(36), 3u);
  EXPECT_EQ(bytesIn(path).number32(224), 0u);
  noteStep(5, "testing setting states");
  EXPECT_EQ(bytesIn(path).number32(36), 5u);
}

}  // namespace
