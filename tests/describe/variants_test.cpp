// SPDX-License-Identifier: MIT
// The table of prototypes, and the variants made from its rows.
#include <cstdint>
#include <vector>

#include "describe/variants.h"
#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace {

using Row = std::vector<int>;

Row fieldsOf(const PrototypeVSTVariant& p) { return {p.variantID, p.numIns, p.numOuts, p.surroundModel}; }
Row fieldsOf(const VSTBundle& bundle) { return {bundle.mainChannels, bundle.extraChannels}; }

const PrototypeVSTVariant& row(std::size_t number) { return GetPrototypeVariants().at(number); }

TEST(GetPrototypeVariants, AlwaysHasTheSame29Rows) {
  EXPECT_EQ(&GetPrototypeVariants(), &GetPrototypeVariants());
  std::vector<Row> rows;
  for (const PrototypeVSTVariant& prototype : GetPrototypeVariants()) rows.push_back(fieldsOf(prototype));
  EXPECT_THAT(
      rows, testing::ElementsAreArray(std::vector<Row>{
                {0, 1, 1, 1},   {1, 1, 2, 1},   {2, 2, 2, 1},    {3, 1, 4, 2},  {4, 2, 4, 2},  {5, 4, 4, 2},
                {6, 1, 6, 4},   {7, 2, 6, 4},   {8, 6, 6, 4},    {9, 1, 4, 3},  {10, 2, 4, 3}, {11, 4, 4, 3},
                {12, 1, 7, 5},  {13, 2, 7, 5},  {14, 7, 7, 5},   {15, 1, 8, 6}, {16, 2, 8, 6}, {17, 8, 8, 6},
                {18, 1, 12, 7}, {19, 2, 12, 7}, {20, 12, 12, 7}, {21, 0, 1, 1}, {22, 0, 2, 1}, {23, 0, 4, 2},
                {24, 0, 6, 4},  {25, 0, 4, 3},  {26, 0, 7, 5},   {27, 0, 8, 6}, {28, 0, 8, 7}}));
}

struct BundleCase {
  const char* name;
  int count;
  int limit;
  std::int32_t mainChannels;
  std::int32_t extraChannels;
};

class SetupBundle : public testing::TestWithParam<BundleCase> {};

TEST_P(SetupBundle, SplitsTheCount) {
  VSTBundle bundle = {77, 77};
  setupBundle(GetParam().count, GetParam().limit, bundle);
  EXPECT_EQ(bundle.mainChannels, GetParam().mainChannels);
  EXPECT_EQ(bundle.extraChannels, GetParam().extraChannels);
}

INSTANTIATE_TEST_SUITE_P(Counts, SetupBundle,
                         testing::ValuesIn(std::vector<BundleCase>{
                             {"One", 1, 100, 1, 0},
                             {"Two", 2, 100, 2, 0},
                             {"Three", 3, 100, 2, 1},
                             {"Six", 6, 100, 2, 4},
                             {"EightWithLimitTwo", 8, 2, 2, 6},
                             {"FourWithLimitOne", 4, 1, 1, 3},
                             {"TwoWithLimitOne", 2, 1, 1, 1},
                             {"TwoWithLimitZero", 2, 0, 0, 2},
                             {"Zero", 0, 100, 0, 0},
                             {"Negative", -3, 100, -3, 0},
                         }),
                         [](const auto& tested) { return tested.param.name; });

TEST(VSTVariant, MadeFromARowAloneIsAcceptedAndHasOnlyMainChannels) {
  const VSTVariant variant(row(5));
  EXPECT_EQ(fieldsOf(static_cast<const PrototypeVSTVariant&>(variant)), (Row{5, 4, 4, 2}));
  EXPECT_EQ(fieldsOf(variant.inBundle), (Row{4, 0}));
  EXPECT_EQ(fieldsOf(variant.outBundle), (Row{4, 0}));
  EXPECT_TRUE(variant.accepted);
}

TEST(VSTVariant, MadeWithBundlesIsNotAcceptedAndHasTheArrangementsOfItsRow) {
  const VSTVariant variant(row(7), VSTBundle{3, 4}, VSTBundle{5, 6});
  EXPECT_EQ(fieldsOf(static_cast<const PrototypeVSTVariant&>(variant)), (Row{7, 2, 6, 4}));
  EXPECT_EQ(fieldsOf(variant.inBundle), (Row{3, 4}));
  EXPECT_EQ(fieldsOf(variant.outBundle), (Row{5, 6}));
  EXPECT_FALSE(variant.accepted);
  EXPECT_EQ(variant.getInArrangement()->numChannels, 2);
  EXPECT_EQ(variant.getOutArrangement()->numChannels, 6);
}

// The types of the input arrangement and the output arrangement, row by row. On purpose: the last row has the
// arrangement of 7.1 as its output.
TEST(VSTVariant, HasTheseArrangementsInEachRow) {
  std::vector<Row> types;
  for (const PrototypeVSTVariant& prototype : GetPrototypeVariants()) {
    const VSTVariant variant(prototype);
    types.push_back({variant.getInArrangement()->type, variant.getOutArrangement()->type});
  }
  EXPECT_THAT(types, testing::ElementsAreArray(
                         std::vector<Row>{{0, 0},   {0, 1},   {1, 1},              // mono and stereo
                                          {0, 11},  {1, 11},  {11, 11},            // quad
                                          {0, 15},  {1, 15},  {15, 15},            // 5.1
                                          {0, 10},  {1, 10},  {10, 10},            // LCRS
                                          {0, 18},  {1, 18},  {18, 18},            // 6.1
                                          {0, 22},  {1, 22},  {22, 22},            // 7.1
                                          {0, 28},  {1, 28},  {28, 28},            // 10.2
                                          {-1, 0},  {-1, 1},  {-1, 11}, {-1, 15},  // instruments
                                          {-1, 10}, {-1, 18}, {-1, 22}, {-1, 22}}));
}

}  // namespace
