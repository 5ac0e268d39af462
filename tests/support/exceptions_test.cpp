// SPDX-License-Identifier: MIT
// The two things that are thrown, and the checks that throw them.
#include <algorithm>
#include <cstddef>
#include <cstring>
#include <new>
#include <optional>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/exceptions.h"

namespace {

using testing::Each;
using testing::StrEq;

// Every byte of the three texts differs from what a prepared slot holds, also behind the zero bytes.
NiduException aRecord(std::int32_t errorCode) {
  NiduException made{};
  std::memset(made.textA, 'a', sizeof made.textA);
  std::memset(made.textB, 'b', sizeof made.textB);
  std::memset(made.textC, 'c', sizeof made.textC);
  std::strcpy(made.textA, "no room");
  std::strcpy(made.textB, "on the medium");
  made.textC[49] = '\0';
  made.errorCode = errorCode;
  made.mode = 23;
  made.spare = 42;
  return made;
}

bool sameBytes(const NiduException& a, const NiduException& b) { return std::memcmp(&a, &b, sizeof a) == 0; }

// What `action` throws as a NiduException, if it does.
template <typename Action>
std::optional<NiduException> thrownBy(Action action) {
  try {
    action();
  } catch (const NiduException& thrown) {
    return thrown;
  }
  return std::nullopt;
}

TEST(NiduException, TravelsAsOneBlockOfThreeTextsAndThreeWords) {
  EXPECT_EQ(offsetof(NiduException, textA), 0u);
  EXPECT_EQ(offsetof(NiduException, textB), 50u);
  EXPECT_EQ(offsetof(NiduException, textC), 100u);
  EXPECT_EQ(offsetof(NiduException, errorCode), 152u);
  EXPECT_EQ(offsetof(NiduException, mode), 156u);
  EXPECT_EQ(offsetof(NiduException, spare), 160u);
  EXPECT_EQ(sizeof(NiduException), 164u);
  EXPECT_TRUE(std::is_trivially_copyable_v<NiduException>);
  EXPECT_FALSE(std::is_polymorphic_v<NiduException>);
}

TEST(AutoNiduException, HoldsOneRecordAndNothingElse) {
  EXPECT_EQ(sizeof(AutoNiduException), 164u);
  EXPECT_FALSE(std::is_polymorphic_v<AutoNiduException>);
  EXPECT_FALSE(std::is_copy_constructible_v<AutoNiduException>);
}

TEST(AutoNiduException, StartsWithEmptyTextsWithoutAnErrorInModeOne) {
  const AutoNiduException slot;
  EXPECT_THAT(slot.record.textA, StrEq(""));
  EXPECT_THAT(slot.record.textB, StrEq(""));
  EXPECT_THAT(slot.record.textC, StrEq(""));
  EXPECT_EQ(slot.record.errorCode, 0);
  EXPECT_EQ(slot.record.mode, 1);
}

TEST(AutoNiduException, WithoutAnErrorNeitherCheckNorEndThrows) {
  EXPECT_NO_THROW({
    AutoNiduException slot;
    slot.record = aRecord(0);  // Texts and mode alone are no error.
    slot.doCheck();
  });
}

TEST(AutoNiduException, TheCheckThrowsWhatTheStreamWrote) {
  const auto thrown = thrownBy([] {
    AutoNiduException slot;
    slot.record.errorCode = -1;
    std::strcpy(slot.record.textA, "first");
    std::strcpy(slot.record.textB, "second");
    std::strcpy(slot.record.textC, "third");
    slot.doCheck();
    ADD_FAILURE() << "the check returned";
  });
  ASSERT_TRUE(thrown);
  EXPECT_EQ(thrown->errorCode, -1);
  EXPECT_THAT(thrown->textA, StrEq("first"));
  EXPECT_THAT(thrown->textB, StrEq("second"));
  EXPECT_THAT(thrown->textC, StrEq("third"));
}

TEST(AutoNiduException, TheRecordIsCopiedWhole) {
  const auto thrown = thrownBy([] {
    AutoNiduException slot;
    slot.record = aRecord(7);
    slot.doCheck();
  });
  ASSERT_TRUE(thrown);
  EXPECT_TRUE(sameBytes(*thrown, aRecord(7)));
  EXPECT_EQ(thrown->mode, 23);
  EXPECT_EQ(thrown->spare, 42);
}

TEST(AutoNiduException, EveryCodeButZeroIsAnError) {
  for (const std::int32_t code : {1, -1, 256, 65536, INT32_MAX, INT32_MIN}) {
    const auto thrown = thrownBy([code] {
      AutoNiduException slot;
      slot.record.errorCode = code;
      slot.doCheck();
    });
    ASSERT_TRUE(thrown) << code;
    EXPECT_EQ(thrown->errorCode, code);
  }
}

TEST(AutoNiduException, TheModeIsNotExamined) {
  for (const std::int32_t mode : {0, 1, 2}) {
    EXPECT_TRUE(thrownBy([mode] {
      AutoNiduException slot;
      slot.record.errorCode = 5;
      slot.record.mode = mode;
      slot.doCheck();
    })) << mode;
  }
}

TEST(AutoNiduException, ItsEndThrowsWhenNobodyChecked) {
  const auto thrown = thrownBy([] {
    AutoNiduException slot;
    slot.record = aRecord(-3);
  });
  ASSERT_TRUE(thrown);
  EXPECT_TRUE(sameBytes(*thrown, aRecord(-3)));
}

TEST(AutoNiduException, ItsEndThrowsAgainWhatTheCheckThrewAndSomebodyCaughtBefore) {
  bool caughtBefore = false;
  const auto thrown = thrownBy([&] {
    AutoNiduException slot;
    slot.record.errorCode = 9;
    caughtBefore = thrownBy([&] { slot.doCheck(); }).has_value();
  });
  EXPECT_TRUE(caughtBefore);
  ASSERT_TRUE(thrown);
  EXPECT_EQ(thrown->errorCode, 9);
}

TEST(AutoNiduException, ItsEndIsSilentWhileAnotherExceptionPropagates) {
  for (const std::int32_t code : {0, 1, -1, INT32_MIN}) {
    try {
      AutoNiduException slot;
      slot.record.errorCode = code;
      throw std::runtime_error("from the stream");
    } catch (const std::runtime_error& passed) {
      EXPECT_STREQ(passed.what(), "from the stream") << code;
    }
  }
}

// Checks a failed slot as it is destroyed, and outlives that if the check does not throw.
struct CheckedDuringUnwinding {
  explicit CheckedDuringUnwinding(bool& out) : survived(out) {}
  ~CheckedDuringUnwinding() {
    AutoNiduException slot;
    slot.record.errorCode = -1;
    slot.doCheck();
    survived = true;
  }
  bool& survived;
};

TEST(AutoNiduException, TheCheckIsSilentWhileAnotherExceptionPropagates) {
  bool survived = false;
  EXPECT_THROW(
      {
        const CheckedDuringUnwinding checked(survived);
        throw std::runtime_error("under way");
      },
      std::runtime_error);
  EXPECT_TRUE(survived);
}

TEST(AutoNiduException, AnExceptionThatIsCaughtPropagatesNoLonger) {
  try {
    throw std::runtime_error("caught");
  } catch (const std::runtime_error&) {
    EXPECT_TRUE(thrownBy([] {
      AutoNiduException slot;
      slot.record.errorCode = -1;
      slot.doCheck();
    }));
  }
}

TEST(NiduFailNull, ThrowsTheIntMinusOneForNull) {
  try {
    nidu_FailNULL(nullptr);
    FAIL() << "returned";
  } catch (int thrown) {
    EXPECT_EQ(thrown, -1);
  }
}

TEST(NiduFailNull, LeavesAnyOtherPointerAlone) {
  int something = 5;
  EXPECT_NO_THROW(nidu_FailNULL(&something));
  EXPECT_NO_THROW(nidu_FailNULL(reinterpret_cast<void*>(1)));
  EXPECT_EQ(something, 5);
}

TEST(NiduFailNull, TakesAPlainPointer) {
  // With a pointer to const, the compiler would take the check of fresh memory for a reading of it.
  EXPECT_TRUE((std::is_same_v<decltype(&nidu_FailNULL), void (*)(void*)>));
}

TEST(AllocateOrFail, ThrowsTheIntMinusOneWhereMemoryCannotBeHad) {
  const auto thrownFor = [](auto allocate) {
    try {
      allocateOrFail(allocate);
    } catch (int thrown) {
      return thrown;
    }
    return 0;
  };
  EXPECT_EQ(thrownFor([] { throw std::bad_alloc(); }), -1);
  EXPECT_EQ(thrownFor([] { throw std::bad_array_new_length(); }), -1);
  std::string text;
  EXPECT_EQ(thrownFor([&] { text.reserve(text.max_size() + 1); }), -1);
}

TEST(AllocateOrFail, RunsWhatItIsGivenOnceAndLetsOtherExceptionsPass) {
  std::vector<int> grown;
  allocateOrFail([&] { grown.resize(grown.size() + 3, 8); });
  EXPECT_EQ(grown.size(), 3u);
  EXPECT_THAT(grown, Each(8));
  EXPECT_THROW(allocateOrFail([] { throw std::runtime_error("another"); }), std::runtime_error);
  EXPECT_THROW(allocateOrFail([] { throw NiduException{}; }), NiduException);
}

}  // namespace
