// SPDX-License-Identifier: MIT
// The two things that are thrown, and the checks that throw them.
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
#include "tests/shared/thrown.h"

namespace {

// A record in which every byte differs from a prepared slot, those behind the texts' zero bytes too.
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

TEST(NiduException, IsOneBlockOfThreeTextsAndThreeWords) {
  EXPECT_EQ(offsetof(NiduException, textA), 0u);
  EXPECT_EQ(offsetof(NiduException, textB), 50u);
  EXPECT_EQ(offsetof(NiduException, textC), 100u);
  EXPECT_EQ(offsetof(NiduException, errorCode), 152u);
  EXPECT_EQ(offsetof(NiduException, mode), 156u);
  EXPECT_EQ(offsetof(NiduException, spare), 160u);
  EXPECT_EQ(sizeof(NiduException), 164u);
  EXPECT_TRUE(std::is_trivially_copyable_v<NiduException>);
}

TEST(AutoNiduException, HoldsOneRecordWithEmptyTextsWithoutAnErrorInModeOne) {
  EXPECT_EQ(sizeof(AutoNiduException), 164u);
  EXPECT_FALSE(std::is_copy_constructible_v<AutoNiduException>);
  const AutoNiduException slot;
  EXPECT_STREQ(slot.record.textA, "");
  EXPECT_STREQ(slot.record.textB, "");
  EXPECT_STREQ(slot.record.textC, "");
  EXPECT_EQ(slot.record.errorCode, 0);
  EXPECT_EQ(slot.record.mode, 1);
}

TEST(AutoNiduException, WithoutAnErrorCodeNeitherCheckNorDestructorThrows) {
  EXPECT_NO_THROW({
    AutoNiduException slot;
    slot.record = aRecord(0);
    slot.doCheck();
  });
}

TEST(AutoNiduException, TheCheckThrowsACopyOfTheWholeRecordForEveryCodeButZero) {
  for (const std::int32_t code : {1, -1, 256, 65536, INT32_MAX, INT32_MIN}) {
    const auto thrown = thrownBy([code] {
      AutoNiduException slot;
      slot.record = aRecord(code);
      slot.doCheck();
      ADD_FAILURE() << "the check returned";
    });
    ASSERT_TRUE(thrown) << code;
    EXPECT_TRUE(sameBytes(*thrown, aRecord(code)));
  }
}

TEST(AutoNiduException, TheModeIsNotExamined) {
  for (const std::int32_t mode : {0, 1}) {
    EXPECT_TRUE(thrownBy([mode] {
      AutoNiduException slot;
      slot.record.errorCode = 5;
      slot.record.mode = mode;
      slot.doCheck();
    })) << mode;
  }
}

TEST(AutoNiduException, TheDestructorThrowsAlsoWhatTheCheckThrewAndSomebodyCaught) {
  EXPECT_TRUE(thrownBy([] {
    AutoNiduException slot;
    slot.record.errorCode = -3;
  }));
  bool caughtBefore = false;
  EXPECT_TRUE(thrownBy([&] {
    AutoNiduException slot;
    slot.record.errorCode = 9;
    caughtBefore = thrownBy([&] { slot.doCheck(); }).has_value();
  }));
  EXPECT_TRUE(caughtBefore);
}

// Checks a failed slot, and destroys it, when it is destroyed itself.
struct FailsWhenDestroyed {
  ~FailsWhenDestroyed() {
    AutoNiduException slot;
    slot.record.errorCode = -1;
    slot.doCheck();
    survived = true;
  }
  bool& survived;
};

TEST(AutoNiduException, NeitherCheckNorDestructorThrowsWhileAnotherExceptionPropagates) {
  bool survived = false;
  EXPECT_THROW(
      {
        const FailsWhenDestroyed failing{survived};
        throw std::runtime_error("propagating");
      },
      std::runtime_error);
  EXPECT_TRUE(survived);
}

TEST(AutoNiduException, ACaughtExceptionPropagatesNoLonger) {
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

TEST(NiduFailNull, ThrowsTheIntMinusOneForNullOnly) {
  EXPECT_EQ(thrownInt([] { nidu_FailNULL(nullptr); }), -1);
  EXPECT_EQ(thrownInt([] { nidu_FailNULL(reinterpret_cast<void*>(1)); }), std::nullopt);
}

TEST(NiduFailNull, TakesAPointerToWhatIsNotConst) {
  // With a pointer to const, the compiler warns that the check of fresh memory reads it.
  EXPECT_TRUE((std::is_same_v<decltype(&nidu_FailNULL), void (*)(void*)>));
}

TEST(AllocateOrFail, ThrowsTheIntMinusOneWhenThereIsNoMemory) {
  const auto thrownFor = [](auto allocate) { return thrownInt([&] { allocateOrFail(allocate); }); };
  EXPECT_EQ(thrownFor([] { throw std::bad_alloc(); }), -1);
  std::string text;
  EXPECT_EQ(thrownFor([&] { text.reserve(text.max_size() + 1); }), -1);
}

TEST(AllocateOrFail, RunsItsArgumentOnceAndLetsOtherExceptionsPass) {
  int runs = 0;
  allocateOrFail([&] { ++runs; });
  EXPECT_EQ(runs, 1);
  EXPECT_THROW(allocateOrFail([] { throw std::runtime_error("another"); }), std::runtime_error);
  EXPECT_THROW(allocateOrFail([] { throw NiduException{}; }), NiduException);
}

}  // namespace
