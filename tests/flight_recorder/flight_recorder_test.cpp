// SPDX-License-Identifier: MIT
// What is stored where, and when: the record is read by its documented offsets while a request is under way.
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <unistd.h>

#include "flight_recorder/flight_recorder.h"
#include "flight_recorder/record_file.h"
#include "tests/flight_recorder/record_bytes.h"
#include "tests/shared/temporary_directory.h"
#include "vst2/dispatch.h"

namespace {

/// A run that is observed for as long as the test, and a plug-in that looks at the record when it is asked.
class FlightRecorder : public testing::Test {
 protected:
  FlightRecorder() {
    std::string whyNot;
    if (!keepRecordIn(path, whyNot)) throw std::runtime_error(whyNot);
    effect.dispatcher = [](AEffect*, VstInt32, VstInt32, VstIntPtr, void*, float) -> VstIntPtr {
      seen = RecordBytes::ofFile(current);
      if (throws) throw 5;
      return 9;
    };
    current = path;
    throws = false;
  }
  ~FlightRecorder() override { forgetObservedRun(); }

  [[nodiscard]] RecordBytes now() const { return RecordBytes::ofFile(path); }

  const TemporaryDirectory folder;
  const std::string path = (folder.path() / "record").string();
  AEffect effect = {};
  static inline std::string current;
  static inline RecordBytes seen;
  static inline bool throws = false;
};

TEST_F(FlightRecorder, BeginsWithMarkVersionSizesAndProcess) {
  EXPECT_EQ(now().bytes.substr(0, 8), "vstflrec");
  EXPECT_EQ(now().number32(8), 1u);
  EXPECT_EQ(now().number32(12), 4096u);
  EXPECT_EQ(now().number32(16), static_cast<std::uint32_t>(getpid()));
  EXPECT_EQ(now().number32(20), sizeof(void*));
}

TEST_F(FlightRecorder, HoldsARequestToTheDispatcherWhileItIsUnderWay) {
  EXPECT_EQ(dispatch(effect, effSetBypass, -3, -1, nullptr, 0.5f), 9);
  EXPECT_EQ(seen.number64(64), 1u);
  EXPECT_EQ(seen.number32(72), 1u);
  EXPECT_EQ(seen.number32(76), 3u);
  EXPECT_EQ(seen.number32(80), 44u);
  EXPECT_EQ(seen.number32(84), 0xFFFFFFFDu);
  EXPECT_EQ(seen.number64(88), 0xFFFFFFFFFFFFFFFFu);
  EXPECT_EQ(seen.number32(96), 0x3F000000u);
  EXPECT_EQ(now().number32(72), 2u);
}

TEST_F(FlightRecorder, KeepsTheLastRequestThatThrewBesideTheOneUnderWay) {
  noteStep(6, "inspect latency");
  throws = true;
  EXPECT_THROW(dispatch(effect, effGetTailSize, 1, 2, nullptr, 0.5f), int);
  EXPECT_EQ(now().number32(72), 3u);
  throws = false;
  dispatch(effect, effClose);
  EXPECT_EQ(now().number32(80), 1u);
  EXPECT_EQ(now().number64(64), 2u);
  EXPECT_EQ(now().number32(192), 3u);
  EXPECT_EQ(now().number32(196), 3u);
  EXPECT_EQ(now().number32(200), 52u);
  EXPECT_EQ(now().number32(204), 1u);
  EXPECT_EQ(now().number64(208), 2u);
  EXPECT_EQ(now().number32(216), 0x3F000000u);
  EXPECT_EQ(now().number32(220), 6u);
}

TEST_F(FlightRecorder, HoldsLoadingAndTheEntryByTheirKinds) {
  {
    RequestUnderWay request(kFlightLoad);
    EXPECT_EQ(now().number32(76), 1u);
    request.returned();
  }
  {
    RequestUnderWay request(kFlightEntry);
    EXPECT_EQ(now().number32(76), 2u);
    request.returned();
  }
}

TEST_F(FlightRecorder, HoldsTheLastOfValuesInARow) {
  ValuesUnderWay values;
  values.begin(3);
  values.reads(3);
  EXPECT_EQ(now().number32(72), 1u);
  EXPECT_EQ(now().number32(76), 4u);
  EXPECT_EQ(now().number32(84), 3u);
  values.reads(4);
  EXPECT_EQ(now().number32(84), 4u);
  values.sets(1.0f);
  EXPECT_EQ(now().number32(76), 5u);
  EXPECT_EQ(now().number32(96), 0x3F800000u);
  values.hasSet();
  EXPECT_EQ(now().number32(76), 4u);
  EXPECT_EQ(now().number32(72), 1u);
  values.end();
  EXPECT_EQ(now().number32(72), 2u);
  EXPECT_EQ(now().number64(64), 3u);
}

TEST_F(FlightRecorder, NotesAValueThatThrewAndGoesOnWithTheRow) {
  ValuesUnderWay values;
  values.begin(3);
  values.reads(3);
  values.sets(1.0f);
  values.hasThrown();
  EXPECT_EQ(now().number32(196), 5u);
  EXPECT_EQ(now().number32(204), 3u);
  EXPECT_EQ(now().number32(72), 1u);
  EXPECT_EQ(now().number32(76), 4u);
}

TEST_F(FlightRecorder, CountsTheRequestsOfManyThreadsToTheirHost) {
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([] {
      for (int j = 0; j < 10000; ++j) noteHostRequest(21, -1, -2, 5);
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(now().number64(128), 40000u);
  EXPECT_EQ(now().number32(136), 21u);
  EXPECT_EQ(now().number32(140), 0xFFFFFFFFu);
  EXPECT_EQ(now().number64(144), 0xFFFFFFFFFFFFFFFEu);
  EXPECT_EQ(now().number32(152), 5u);
}

TEST_F(FlightRecorder, HoldsTheStepAndItsTimeInTheirPlaceOfEighty) {
  noteStep(1, "a text of sixty-four characters, which is one more than there are.");
  EXPECT_EQ(now().number32(36), 1u);
  EXPECT_EQ(now().text(320), "a text of sixty-four characters, which is one more than there a");
  const std::uint64_t first = now().number64(384);
  EXPECT_GE(first, now().number64(40));
  noteStep(80, "inspect latency");
  EXPECT_EQ(now().text(320), "inspect latency");
  EXPECT_GE(now().number64(384 + 79 * 8), first);
  noteStep(81, "inspect latency");
  EXPECT_GE(now().number64(384), now().number64(384 + 79 * 8));
}

TEST_F(FlightRecorder, KeepsTheEndOfAPathThatIsTooLong) {
  noteBundle(std::string(2000, 'x') + "/effect.so");
  EXPECT_EQ(now().text(2048), std::string(1013, 'x') + "/effect.so");
}

TEST_F(FlightRecorder, StaysAsItWasAtTheFirstFault) {
  noteStep(5, "testing setting states");
  RequestUnderWay request(44, 0, 1, 0.0f);
  ASSERT_TRUE(noteFault(11));
  noteFaultDetails({1, 78, 0, 0x10, 0x7F0000001234});
  noteFaultModule("/usr/lib/vst/effect.so", 0x7F0000000000);
  request.returned();
  noteStep(6, "inspect latency");
  noteVerdict(kFlightPassed);
  EXPECT_FALSE(noteFault(6));
  EXPECT_EQ(now().number32(224), 11u);
  EXPECT_EQ(now().number32(228), 1u);
  EXPECT_EQ(now().number32(232), 78u);
  EXPECT_EQ(now().number32(236), 0u);
  EXPECT_EQ(now().number64(240), 0x10u);
  EXPECT_EQ(now().number64(248), 0x7F0000001234u);
  EXPECT_EQ(now().number64(256), 0x7F0000000000u);
  EXPECT_EQ(now().text(1024), "/usr/lib/vst/effect.so");
  EXPECT_EQ(now().number32(72), 1u);
  EXPECT_EQ(now().number32(36), 5u);
  EXPECT_EQ(now().number32(28), 0u);
}

TEST_F(FlightRecorder, TakesAFaultButNoRequestBehindAnUnexpectedExit) {
  noteUnexpectedExit();
  dispatch(effect, effClose);
  EXPECT_EQ(now().number32(48), 1u);
  EXPECT_EQ(now().number64(64), 0u);
  EXPECT_TRUE(noteFault(11));
  EXPECT_EQ(now().number32(224), 11u);
}

TEST_F(FlightRecorder, HearsNothingOfAForgottenRun) {
  forgetObservedRun();
  dispatch(effect, effClose);
  EXPECT_FALSE(noteFault(11));
  EXPECT_EQ(now().number64(64), 0u);
  EXPECT_EQ(now().number32(224), 0u);
}

}  // namespace
