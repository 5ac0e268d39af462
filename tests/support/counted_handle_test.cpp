// SPDX-License-Identifier: MIT
// Counted handles: when a reference is taken, when one is given back, and in which order.
#include <cstdint>
#include <functional>
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

std::vector<std::string> events;

// A count that records what is done to it: "+a" and "-a" of the object a.
class RecordedCount {
 public:
  RecordedCount(std::string owner, std::uint32_t start) : name(std::move(owner)), count(start) {}
  RecordedCount& operator++() {
    events.push_back('+' + name);
    ++count;
    return *this;
  }
  RecordedCount& operator--() {
    events.push_back('-' + name);
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
    events.push_back('~' + name);
    if (atItsEnd) atItsEnd();
  }
  Shared(const Shared&) = delete;
  Shared& operator=(const Shared&) = delete;

  std::string name;
  RecordedCount refCount;
  std::function<void()> atItsEnd;
};

class IPtr : public testing::Test {
 protected:
  IPtr() { a.reset(objectA, AddRef{0}), events.clear(); }
  static std::vector<std::string> takeEvents() { return std::exchange(events, {}); }

  Shared* const objectA = new Shared("a");
  i_ptr<Shared> a;
};

TEST_F(IPtr, IsOnePointerThatIsNullAtFirst) {
  EXPECT_EQ(sizeof(i_ptr<Shared>), sizeof(void*));
  {
    const i_ptr<Shared> handle;
    const i_ptr<Shared> copy(handle);
    EXPECT_EQ(handle.get(), nullptr);
    EXPECT_EQ(copy.get(), nullptr);
  }
  EXPECT_THAT(events, IsEmpty());
}

TEST_F(IPtr, AResetWithTagZeroTakesAReferenceBeforeItGivesTheOldOneBack) {
  auto* const objectB = new Shared("b");
  a.reset(objectB, AddRef{0});
  EXPECT_EQ(a.get(), objectB);
  EXPECT_EQ(objectB->refCount, 1u);
  EXPECT_THAT(takeEvents(), ElementsAre("+b", "-a", "~a"));
  a.reset(objectB, AddRef{0});
  EXPECT_EQ(objectB->refCount, 1u);
  EXPECT_THAT(takeEvents(), ElementsAre("+b", "-b"));
}

TEST_F(IPtr, AResetWithAnyOtherTagAdoptsTheCallersReference) {
  for (const int tag : {1, 2, -1}) {
    {
      i_ptr<Shared> handle;
      handle.reset(new Shared("b", 1), static_cast<AddRef>(tag));
      EXPECT_THAT(events, IsEmpty());
    }
    EXPECT_THAT(takeEvents(), ElementsAre("-b", "~b"));
  }
}

TEST_F(IPtr, AResetToNullGivesTheReferenceBackWhateverTheTag) {
  i_ptr<Shared> b(a);
  takeEvents();
  b.reset(nullptr, AddRef{1});
  a.reset(nullptr, AddRef{0});
  EXPECT_EQ(a.get(), nullptr);
  EXPECT_THAT(takeEvents(), ElementsAre("-a", "-a", "~a"));
}

TEST_F(IPtr, HoldsTheNewPointerAlreadyWhenTheOldObjectIsDestroyed) {
  auto* const objectB = new Shared("b");
  const Shared* heldAtTheEnd = nullptr;
  objectA->atItsEnd = [&] { heldAtTheEnd = a.get(); };
  a.reset(objectB, AddRef{0});
  EXPECT_EQ(heldAtTheEnd, objectB);
}

TEST_F(IPtr, ACopySharesTheObjectUntilTheLastHandleIsGone) {
  {
    const i_ptr<Shared> copy(a);
    EXPECT_EQ(copy.get(), objectA);
    EXPECT_EQ(objectA->refCount, 2u);
  }
  EXPECT_THAT(takeEvents(), ElementsAre("+a", "-a"));
  a = i_ptr<Shared>();
  EXPECT_EQ(a.get(), nullptr);
  EXPECT_THAT(takeEvents(), ElementsAre("-a", "~a"));
}

TEST_F(IPtr, AnAssignmentTakesAReferenceAndThenGivesTheOldOneBackExceptFromItself) {
  i_ptr<Shared> b;
  b.reset(new Shared("b"), AddRef{0});
  takeEvents();
  const i_ptr<Shared>& itself = a;
  a = itself;
  EXPECT_THAT(takeEvents(), IsEmpty());
  a = b;
  EXPECT_EQ(a.get(), b.get());
  EXPECT_THAT(takeEvents(), ElementsAre("+b", "-a", "~a"));
  a = b;
  EXPECT_THAT(takeEvents(), ElementsAre("+b", "-b"));
}

TEST_F(IPtr, ReachesTheObject) {
  (*a).name = "renamed";
  EXPECT_EQ(a->name, "renamed");
}

TEST(RefCountRelease, ReturnsTheNewCountAndDestroysTheObjectAtZero) {
  auto* const object = new Shared("a", 2);
  events.clear();
  EXPECT_EQ(NiduCOM::RefCount::Release(object), 1u);
  EXPECT_EQ(NiduCOM::RefCount::Release(object), 0u);
  EXPECT_THAT(events, ElementsAre("-a", "-a", "~a"));
}

TEST(RefCountRelease, CountsInUnsigned32Bits) {
  struct PlainShared {
    std::uint32_t refCount = 0xFFFFFFFFu;
  } object;
  EXPECT_EQ(NiduCOM::RefCount::Release(&object), 4294967294u);
  EXPECT_TRUE((std::is_same_v<decltype(NiduCOM::RefCount::Release(&object)), std::uint32_t>));
}

}  // namespace
