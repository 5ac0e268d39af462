// SPDX-License-Identifier: MIT
// Counted handles: when a reference is taken, when one is given back, and in which order.
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/counted_handle.h"

namespace {

using NiduCOM::AddRef;
using NiduCOM::i_ptr;
using testing::ElementsAre;
using testing::IsEmpty;

std::vector<std::string>& log() {
  static std::vector<std::string> entries;
  return entries;
}

// A count that says what is done with it: "+a" and "-a" of the object a.
class LoggedCount {
 public:
  LoggedCount(std::string owner, std::uint32_t start) : name(std::move(owner)), count(start) {}
  LoggedCount& operator++() {
    log().push_back('+' + name);
    ++count;
    return *this;
  }
  LoggedCount& operator--() {
    log().push_back('-' + name);
    --count;
    return *this;
  }
  operator std::uint32_t() const { return count; }

 private:
  std::string name;
  std::uint32_t count;
};

struct Shared {
  explicit Shared(const std::string& objectName, std::uint32_t start = 0)
      : name(objectName), refCount(objectName, start) {}
  ~Shared() {
    log().push_back('~' + name);
    if (atItsEnd) atItsEnd();
  }
  Shared(const Shared&) = delete;
  Shared& operator=(const Shared&) = delete;

  std::string name;
  LoggedCount refCount;
  std::function<void()> atItsEnd;
};

class Handle : public testing::Test {
 protected:
  void SetUp() override { log().clear(); }
  static std::vector<std::string> takeLog() { return std::exchange(log(), {}); }
};

using IPtr = Handle;
using RefCountRelease = Handle;

TEST_F(IPtr, IsNullAtFirstAndAtItsEndDoesNothing) {
  {
    const i_ptr<Shared> handle;
    EXPECT_EQ(handle.get(), nullptr);
    const i_ptr<Shared> copy(handle);
    EXPECT_EQ(copy.get(), nullptr);
  }
  EXPECT_THAT(log(), IsEmpty());
}

TEST_F(IPtr, AResetWithTagZeroTakesAReference) {
  auto* object = new Shared("a");
  {
    i_ptr<Shared> handle;
    handle.reset(object, AddRef{0});
    EXPECT_EQ(handle.get(), object);
    EXPECT_EQ(object->refCount, 1u);
    EXPECT_THAT(takeLog(), ElementsAre("+a"));
  }
  EXPECT_THAT(takeLog(), ElementsAre("-a", "~a"));
}

TEST_F(IPtr, AResetWithAnyOtherTagAdoptsTheCallersReference) {
  for (const int tag : {1, 2, -1}) {
    auto* object = new Shared("a", 1);
    {
      i_ptr<Shared> handle;
      handle.reset(object, static_cast<AddRef>(tag));
      EXPECT_EQ(handle.get(), object);
      EXPECT_THAT(takeLog(), IsEmpty()) << tag;
    }
    EXPECT_THAT(takeLog(), ElementsAre("-a", "~a")) << tag;
  }
}

TEST_F(IPtr, TheNewReferenceIsTakenBeforeTheOldIsGivenUp) {
  i_ptr<Shared> handle;
  handle.reset(new Shared("a"), AddRef{0});
  takeLog();
  handle.reset(new Shared("b"), AddRef{0});
  EXPECT_THAT(takeLog(), ElementsAre("+b", "-a", "~a"));
}

TEST_F(IPtr, MayBeResetToTheOnlyPointerThatItHolds) {
  auto* object = new Shared("a");
  i_ptr<Shared> handle;
  handle.reset(object, AddRef{0});
  takeLog();
  handle.reset(object, AddRef{0});
  EXPECT_EQ(handle.get(), object);
  EXPECT_EQ(object->refCount, 1u);
  EXPECT_THAT(takeLog(), ElementsAre("+a", "-a"));
}

TEST_F(IPtr, AResetToNullGivesTheReferenceUp) {
  for (const int tag : {0, 1}) {
    i_ptr<Shared> handle;
    handle.reset(new Shared("a"), AddRef{0});
    takeLog();
    handle.reset(nullptr, static_cast<AddRef>(tag));
    EXPECT_EQ(handle.get(), nullptr);
    EXPECT_THAT(takeLog(), ElementsAre("-a", "~a")) << tag;
  }
}

TEST_F(IPtr, HoldsTheNewPointerAlreadyWhenTheOldObjectEnds) {
  i_ptr<Shared> handle;
  auto* old = new Shared("a");
  auto* fresh = new Shared("b");
  handle.reset(old, AddRef{0});
  const Shared* heldAtTheEnd = nullptr;
  old->atItsEnd = [&] { heldAtTheEnd = handle.get(); };
  handle.reset(fresh, AddRef{0});
  EXPECT_EQ(heldAtTheEnd, fresh);
}

TEST_F(IPtr, ACopySharesTheObject) {
  auto* object = new Shared("a");
  i_ptr<Shared> handle;
  handle.reset(object, AddRef{0});
  {
    const i_ptr<Shared> copy(handle);
    EXPECT_EQ(copy.get(), object);
    EXPECT_EQ(object->refCount, 2u);
  }
  EXPECT_EQ(object->refCount, 1u);
  EXPECT_EQ(handle.get(), object);
}

TEST_F(IPtr, AnAssignmentSharesTheObjectAndGivesTheOldOneUp) {
  i_ptr<Shared> a;
  i_ptr<Shared> b;
  a.reset(new Shared("a"), AddRef{0});
  b.reset(new Shared("b"), AddRef{0});
  takeLog();
  a = b;
  EXPECT_EQ(a.get(), b.get());
  EXPECT_EQ(b->refCount, 2u);
  EXPECT_THAT(takeLog(), ElementsAre("+b", "-a", "~a"));
}

TEST_F(IPtr, AnAssignmentFromItselfTouchesNothing) {
  i_ptr<Shared> handle;
  handle.reset(new Shared("a"), AddRef{0});
  takeLog();
  const i_ptr<Shared>& itself = handle;
  handle = itself;
  EXPECT_THAT(takeLog(), IsEmpty());
  EXPECT_EQ(handle->refCount, 1u);
}

TEST_F(IPtr, AnAssignmentFromAnotherHandleToTheSameObjectCountsUpAndDown) {
  i_ptr<Shared> handle;
  handle.reset(new Shared("a"), AddRef{0});
  const i_ptr<Shared> other(handle);
  takeLog();
  handle = other;
  EXPECT_THAT(takeLog(), ElementsAre("+a", "-a"));
}

TEST_F(IPtr, AnAssignmentOfNullGivesTheReferenceUp) {
  i_ptr<Shared> handle;
  handle.reset(new Shared("a"), AddRef{0});
  takeLog();
  handle = i_ptr<Shared>();
  EXPECT_EQ(handle.get(), nullptr);
  EXPECT_THAT(takeLog(), ElementsAre("-a", "~a"));
}

TEST_F(IPtr, ReachesTheObject) {
  i_ptr<Shared> handle;
  handle.reset(new Shared("a"), AddRef{0});
  EXPECT_EQ(handle->name, "a");
  (*handle).name = "renamed";
  EXPECT_EQ(handle.get()->name, "renamed");
}

TEST_F(IPtr, IsOnePointerWide) { EXPECT_EQ(sizeof(i_ptr<Shared>), sizeof(void*)); }

TEST_F(RefCountRelease, AnswersTheNewCountAndEndsTheObjectAtZero) {
  auto* object = new Shared("a", 3);
  EXPECT_EQ(NiduCOM::RefCount::Release(object), 2u);
  EXPECT_EQ(NiduCOM::RefCount::Release(object), 1u);
  EXPECT_THAT(takeLog(), ElementsAre("-a", "-a"));
  EXPECT_EQ(NiduCOM::RefCount::Release(object), 0u);
  EXPECT_THAT(takeLog(), ElementsAre("-a", "~a"));
}

struct PlainShared {
  std::uint32_t refCount = 0xFFFFFFFFu;
};

TEST_F(RefCountRelease, CountsInUnsigned32Bits) {
  const auto object = std::make_unique<PlainShared>();
  EXPECT_EQ(NiduCOM::RefCount::Release(object.get()), 4294967294u);
  EXPECT_TRUE((std::is_same_v<decltype(NiduCOM::RefCount::Release(object.get())), std::uint32_t>));
}

}  // namespace
