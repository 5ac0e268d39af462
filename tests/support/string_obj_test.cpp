// SPDX-License-Identifier: MIT
// A text with three integers.
#include <cstring>
#include <string>
#include <type_traits>

#include "gtest/gtest.h"
#include "support/string_obj.h"

namespace {

TEST(NiduStringObj, StartsEmptyWithItsWordsAtZero) {
  const NiduStringObj object;
  EXPECT_EQ(object.text, "");
  EXPECT_EQ(object.firstWord, 0);
  EXPECT_EQ(object.secondWord, 0);
  EXPECT_EQ(object.thirdWord, 0);
}

TEST(NiduStringObj, CopiesTheTextAndTakesTheFirstWord) {
  char source[] = "Cutoff";
  const NiduStringObj object(source, -7);
  std::strcpy(source, "gone!!");
  EXPECT_EQ(object.text, "Cutoff");
  EXPECT_EQ(object.firstWord, -7);
  EXPECT_EQ(object.secondWord, 0);
  EXPECT_EQ(object.thirdWord, 0);
}

TEST(NiduStringObj, ACopyHasAllFourFieldsAndItsOwnText) {
  NiduStringObj object("Resonance", 1);
  object.secondWord = 2;
  object.thirdWord = 3;
  const NiduStringObj copy(object);
  object.text[0] = 'X';
  EXPECT_EQ(copy.text, "Resonance");
  EXPECT_EQ(copy.firstWord, 1);
  EXPECT_EQ(copy.secondWord, 2);
  EXPECT_EQ(copy.thirdWord, 3);
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
