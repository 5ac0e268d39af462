// SPDX-License-Identifier: MIT
// Speaker arrangements, byte by byte: 4 bytes type, 4 bytes channel count, 20 entries of 112 bytes with the
// speaker's type at 80.
#include <climits>
#include <cstdint>
#include <cstring>
#include <new>
#include <string>
#include <vector>

#include "describe/speaker_arrangement.h"
#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "tests/shared/scarce_memory.h"

namespace {

constexpr std::size_t kBlockSizeInBytes = 2248;

/// Checks the whole block: zeros but for these values.
void expectBlock(const VstSpeakerArrangement& arrangement, std::int32_t type, std::int32_t channels,
                 const std::vector<std::int32_t>& speakers) {
  std::string expected(kBlockSizeInBytes, '\0');
  std::memcpy(&expected[0], &type, 4);
  std::memcpy(&expected[4], &channels, 4);
  for (std::size_t i = 0; i < speakers.size(); ++i) std::memcpy(&expected[8 + 112 * i + 80], &speakers[i], 4);
  EXPECT_EQ(std::string(reinterpret_cast<const char*>(&arrangement), kBlockSizeInBytes), expected);
}

OwnedSpeakerArrangement withSpeakers(const std::vector<int>& s) {
  return initSpeakerArrangement(-2, 20, s.at(0), s.at(1), s.at(2), s.at(3), s.at(4), s.at(5), s.at(6),
                                s.at(7), s.at(8), s.at(9), s.at(10), s.at(11), s.at(12));
}

TEST(InitSpeakerArrangement, StoresTwelveSpeakersAndIgnoresTheThirteenth) {
  expectBlock(*withSpeakers({101, 102, 103, 104, 105, 106, 107, 108, 109, 110, 111, 112, 113}), -2, 20,
              {101, 102, 103, 104, 105, 106, 107, 108, 109, 110, 111, 112});
}

TEST(InitSpeakerArrangement, LeavesASpeakerAtZeroForMinusOneOnly) {
  expectBlock(*withSpeakers({-1, 7, -2, 8, -1, -1, -1, -1, -1, -1, -32, 9, -1}), -2, 20,
              {0, 7, -2, 8, 0, 0, 0, 0, 0, 0, -32, 9});
}

TEST(InitSpeakerArrangement, AllocatesTheWholeBlockOrThrowsBadAlloc) {
  const std::vector<int> none(13, -1);
  {
    const preset_tests::ScarceMemory tooLittle(kBlockSizeInBytes - 1);
    EXPECT_THROW(withSpeakers(none), std::bad_alloc);
  }
  const preset_tests::ScarceMemory enough(kBlockSizeInBytes);
  EXPECT_NE(withSpeakers(none), nullptr);
}

TEST(SpeakerIn, FindsTheEntriesThatAreNotDeclared) {
  const auto arrangement = withSpeakers(std::vector<int>(13, -1));
  const char* const start = reinterpret_cast<const char*>(arrangement.get());
  EXPECT_EQ(reinterpret_cast<const char*>(speakerIn(*arrangement, 0)), start + 8);
  EXPECT_EQ(reinterpret_cast<const char*>(speakerIn(*arrangement, 19)), start + 2136);
}

struct LayoutCase {
  const char* name;
  int channels;
  int model;
  std::int32_t type;
  std::int32_t channelsKept;
  std::vector<std::int32_t> speakers;
};

class GetSpeakerArrangement : public testing::TestWithParam<LayoutCase> {};

TEST_P(GetSpeakerArrangement, MakesThisArrangement) {
  const LayoutCase& layout = GetParam();
  expectBlock(*getSpeakerArrangement(layout.channels, static_cast<KelSurroundModel>(layout.model)),
              layout.type, layout.channelsKept, layout.speakers);
}

INSTANTIATE_TEST_SUITE_P(
    Layouts, GetSpeakerArrangement,
    testing::ValuesIn(std::vector<LayoutCase>{
        {"None", 0, 1, -1, 0, {}},
        {"Mono", 1, 1, 0, 1, {0}},
        {"Stereo", 2, 1, 1, 2, {1, 2}},
        {"StereoWithTheQuadModel", 2, 2, 1, 2, {1, 2}},
        {"Quad", 4, 2, 11, 4, {1, 2, 5, 6}},
        {"Lcrs", 4, 3, 10, 4, {1, 2, 3, 9}},
        {"FourChannelsWithAnyOtherModel", 4, 1, 10, 4, {1, 2, 3, 9}},
        {"FourChannelsWithoutAModel", 4, 0, 10, 4, {1, 2, 3, 9}},
        {"Six", 6, 4, 15, 6, {1, 2, 3, 4, 5, 6}},
        {"SixWithTheQuadModel", 6, 2, 15, 6, {1, 2, 3, 4, 5, 6}},
        {"Seven", 7, 5, 18, 7, {1, 2, 3, 4, 5, 6, 9}},
        {"Eight", 8, 6, 22, 8, {1, 2, 3, 4, 5, 6, 7, 8}},
        {"EightWithThe102Model", 8, 7, 22, 8, {1, 2, 3, 4, 5, 6, 7, 8}},
        {"TwelveInThisHostsOwnOrder", 12, 7, 28, 12, {1, 2, 3, 4, 19, 5, 6, 9, 10, 11, 13, 15}},
        // On purpose: every other count becomes stereo.
        {"Three", 3, 1, 1, 2, {1, 2}},
        {"Five", 5, 4, 1, 2, {1, 2}},
        {"Nine", 9, 6, 1, 2, {1, 2}},
        {"Ten", 10, 7, 1, 2, {1, 2}},
        {"Eleven", 11, 7, 1, 2, {1, 2}},
        {"Thirteen", 13, 7, 1, 2, {1, 2}},
        {"TheHighestCount", INT_MAX, 7, 1, 2, {1, 2}},
        {"MinusOne", -1, 1, 1, 2, {1, 2}},
        {"TheLowestCount", INT_MIN, 2, 1, 2, {1, 2}},
    }),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
