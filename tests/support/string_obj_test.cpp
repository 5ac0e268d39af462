// SPDX-License-Identifier: MIT
// A text with three integers.
#include <cstdint>
#include <string>
#include <type_traits>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/string_obj.h"

namespace {

std::vector<int> wordsOf(const NiduStringObj& object) {
  return {object.firstWord, object.secondWord, object.thirdWord};
}

TEST(NiduStringObj, StartsEmptyWithItsWordsAtZero) {
  EXPECT_EQ(NiduStringObj().text, "");
  EXPECT_THAT(wordsOf(NiduStringObj()), testing::ElementsAre(0, 0, 0));
}

TEST(NiduStringObj, CopiesTheTextAndTakesTheFirstWord) {
  char source[] = "Cutoff";
  const NiduStringObj object(source, -7);
  source[0] = 'X';
  EXPECT_EQ(object.text, "Cutoff");
  EXPECT_THAT(wordsOf(object), testing::ElementsAre(-7, 0, 0));
}

TEST(NiduStringObj, KeepsItsFieldsInOrder) {
  const NiduStringObj object;
  EXPECT_EQ(static_cast<const void*>(&object.text), static_cast<const void*>(&object));
  EXPECT_EQ(&object.secondWord - &object.firstWord, 1);
  EXPECT_EQ(&object.thirdWord - &object.secondWord, 1);
  EXPECT_EQ(reinterpret_cast<const char*>(&object.firstWord) - reinterpret_cast<const char*>(&object.text),
            static_cast<std::ptrdiff_t>(sizeof(std::string)));
  EXPECT_TRUE((std::is_same_v<decltype(object.firstWord), std::int32_t>));
}

}  // namespace
