// SPDX-License-Identifier: MIT
// Speaker arrangements, byte by byte: 4 bytes type, 4 bytes channel count, 20 entries of 112 bytes with the
// speaker's type at 80.
#include <climits>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "describe/speaker_arrangement.h"
#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace {

using testing::Each;
using testing::ElementsAre;
using testing::ElementsAreArray;

constexpr std::size_t kBlockSizeInBytes = 2248;

std::int32_t wordAt(const VstSpeakerArrangement& arrangement, std::size_t offset) {
  std::int32_t word = 0;
  std::memcpy(&word, reinterpret_cast<const char*>(&arrangement) + offset, sizeof word);
  return word;
}

std::int32_t typeOf(const VstSpeakerArrangement& arrangement) { return wordAt(arrangement, 0); }
std::int32_t channelsOf(const VstSpeakerArrangement& arrangement) { return wordAt(arrangement, 4); }

// The types of all 20 entries.
std::vector<std::int32_t> speakersOf(const VstSpeakerArrangement& arrangement) {
  std::vector<std::int32_t> types;
  for (std::size_t i = 0; i < 20; ++i) types.push_back(wordAt(arrangement, 8 + 112 * i + 80));
  return types;
}

// Everything in the block but the type, the channel count and the speakers' types.
std::string restOf(const VstSpeakerArrangement& arrangement) {
  std::string block(reinterpret_cast<const char*>(&arrangement), kBlockSizeInBytes);
  for (std::size_t i = 20; i-- > 0;) block.erase(8 + 112 * i + 80, 4);
  return block.substr(8);
}

std::vector<std::int32_t> followedByZeros(std::vector<std::int32_t> types) {
  types.resize(20, 0);
  return types;
}

OwnedSpeakerArrangement withTypes(const std::vector<int>& s) {
  return initSpeakerArrangement(-2, 20, s.at(0), s.at(1), s.at(2), s.at(3), s.at(4), s.at(5), s.at(6),
                                s.at(7), s.at(8), s.at(9), s.at(10), s.at(11), s.at(12));
}

TEST(InitSpeakerArrangement, StoresTypeCountAndTwelveSpeakers) {
  const auto arrangement = withTypes({101, 102, 103, 104, 105, 106, 107, 108, 109, 110, 111, 112, -1});
  EXPECT_EQ(typeOf(*arrangement), -2);
  EXPECT_EQ(channelsOf(*arrangement), 20);
  EXPECT_THAT(
      speakersOf(*arrangement),
      ElementsAreArray(followedByZeros({101, 102, 103, 104, 105, 106, 107, 108, 109, 110, 111, 112})));
}

TEST(InitSpeakerArrangement, IgnoresTheThirteenthType) {
  const auto arrangement = withTypes({1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 113});
  EXPECT_THAT(speakersOf(*arrangement),
              ElementsAreArray(followedByZeros({1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1})));
}

TEST(InitSpeakerArrangement, LeavesATypeAtZeroForMinusOneAndGoesOn) {
  const auto arrangement = withTypes({-1, 7, -1, 8, -1, -1, -1, -1, -1, -1, -1, 9, -1});
  EXPECT_THAT(speakersOf(*arrangement),
              ElementsAreArray(followedByZeros({0, 7, 0, 8, 0, 0, 0, 0, 0, 0, 0, 9})));
}

TEST(InitSpeakerArrangement, StoresOtherNegativeTypes) {
  const auto arrangement = withTypes({-2, -32, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1});
  EXPECT_THAT(speakersOf(*arrangement), ElementsAreArray(followedByZeros({-2, -32})));
}

TEST(InitSpeakerArrangement, ClearsAllElseInTheBlock) {
  const auto arrangement = withTypes({1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13});
  EXPECT_THAT(restOf(*arrangement), Each('\0'));
}

TEST(InitSpeakerArrangement, GivesRoomForTwentySpeakers) {
  const auto arrangement = withTypes(std::vector<int>(13, -1));
  std::memset(static_cast<void*>(arrangement.get()), 0x7f, kBlockSizeInBytes);
  EXPECT_THAT(speakersOf(*arrangement), Each(0x7f7f7f7f));
}

TEST(SpeakerIn, FindsTheEntriesThatAreNotDeclared) {
  const auto arrangement = withTypes(std::vector<int>(13, -1));
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

void PrintTo(const LayoutCase& layout, std::ostream* stream) { *stream << layout.name; }

class GetSpeakerArrangement : public testing::TestWithParam<LayoutCase> {};

TEST_P(GetSpeakerArrangement, KnowsTheLayout) {
  const LayoutCase& layout = GetParam();
  const auto arrangement =
      getSpeakerArrangement(layout.channels, static_cast<KelSurroundModel>(layout.model));
  EXPECT_EQ(typeOf(*arrangement), layout.type);
  EXPECT_EQ(channelsOf(*arrangement), layout.channelsKept);
  EXPECT_THAT(speakersOf(*arrangement), ElementsAreArray(followedByZeros(layout.speakers)));
  EXPECT_THAT(restOf(*arrangement), Each('\0'));
}

INSTANTIATE_TEST_SUITE_P(
    Layouts, GetSpeakerArrangement,
    testing::ValuesIn(std::vector<LayoutCase>{
        {"None", 0, 1, -1, 0, {}},
        {"Mono", 1, 1, 0, 1, {0}},
        {"Stereo", 2, 1, 1, 2, {1, 2}},
        {"Quad", 4, 2, 11, 4, {1, 2, 5, 6}},
        {"Lcrs", 4, 3, 10, 4, {1, 2, 3, 9}},
        {"FourChannelsMonoStereo", 4, 1, 10, 4, {1, 2, 3, 9}},
        {"FourChannels102", 4, 7, 10, 4, {1, 2, 3, 9}},
        {"FourChannelsNoModel", 4, 0, 10, 4, {1, 2, 3, 9}},
        {"Six", 6, 4, 15, 6, {1, 2, 3, 4, 5, 6}},
        {"Seven", 7, 5, 18, 7, {1, 2, 3, 4, 5, 6, 9}},
        {"Eight", 8, 6, 22, 8, {1, 2, 3, 4, 5, 6, 7, 8}},
        {"EightWithThe102Model", 8, 7, 22, 8, {1, 2, 3, 4, 5, 6, 7, 8}},
        {"TwelveInThisHostsOwnOrder", 12, 7, 28, 12, {1, 2, 3, 4, 19, 5, 6, 9, 10, 11, 13, 15}},
        {"TwoWithTheQuadModel", 2, 2, 1, 2, {1, 2}},
        {"SixWithTheQuadModel", 6, 2, 15, 6, {1, 2, 3, 4, 5, 6}},
        {"Three", 3, 1, 1, 2, {1, 2}},
        {"Five", 5, 4, 1, 2, {1, 2}},
        {"Nine", 9, 6, 1, 2, {1, 2}},
        {"Ten", 10, 7, 1, 2, {1, 2}},
        {"Eleven", 11, 7, 1, 2, {1, 2}},
        {"Thirteen", 13, 7, 1, 2, {1, 2}},
        {"Most", INT_MAX, 7, 1, 2, {1, 2}},
        {"MinusOne", -1, 1, 1, 2, {1, 2}},
        {"Least", INT_MIN, 2, 1, 2, {1, 2}},
    }),
    [](const auto& tested) { return tested.param.name; });

TEST(GetSpeakerArrangementOwnership, EveryCallMakesABlockOfItsOwn) {
  const auto first = getSpeakerArrangement(2, kKelSurroundMonoStereo);
  const auto second = getSpeakerArrangement(2, kKelSurroundMonoStereo);
  ASSERT_NE(first.get(), second.get());
  std::memset(static_cast<void*>(first.get()), 0x7f, kBlockSizeInBytes);
  EXPECT_EQ(typeOf(*second), 1);
  EXPECT_EQ(typeOf(*getSpeakerArrangement(2, kKelSurroundMonoStereo)), 1);
}

}  // namespace
