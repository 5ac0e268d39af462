// SPDX-License-Identifier: MIT
// A set kept as a sorted vector.
#include <cstddef>
#include <functional>
#include <memory>
#include <new>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/sorted_vector_set.h"

namespace {

using testing::ElementsAre;

// An element with a key and a mark that the order does not see.
struct Entry {
  int key;
  char mark;
};

// Counts how often it is asked; shared, as the set keeps a copy.
struct ByKey {
  bool operator()(const Entry& a, const Entry& b) const { return before(a.key, b.key); }
  bool operator()(const Entry& a, const std::string& key) const { return before(a.key, std::stoi(key)); }
  bool before(int a, int b) const {
    ++*asked;
    return descending ? b < a : a < b;
  }
  bool descending = false;
  std::shared_ptr<int> asked = std::make_shared<int>(0);
};

using Set = sorted_vector_set<Entry, ByKey>;

std::string shown(const Set& set) {
  std::string all;
  for (const Entry& entry : set) all += std::to_string(entry.key) + entry.mark + ' ';
  return all;
}

Set setOf(const std::vector<int>& keys, const ByKey& order = ByKey()) {
  Set set(order);
  for (const int key : keys) set.insert({key, 'a'});
  return set;
}

std::ptrdiff_t positionOf(Set& set, Set::iterator p) { return p - set.begin(); }

TEST(SortedVectorSet, IsEmptyAtFirst) {
  Set set;
  EXPECT_EQ(set.size(), 0u);
  EXPECT_EQ(set.begin(), set.end());
  EXPECT_EQ(set.lower_bound(Entry{1, 'a'}), set.end());
  EXPECT_EQ(set.find({1, 'a'}), set.end());
}

TEST(SortedVectorSet, PutsEachElementInItsPlace) {
  EXPECT_EQ(shown(setOf({5, -1, 9, 3, 0, 7})), "-1a 0a 3a 5a 7a 9a ");
}

TEST(SortedVectorSet, AnInsertionTellsWhereItPutTheElement) {
  Set set = setOf({10, 20});
  const std::vector<std::pair<int, std::ptrdiff_t>> steps = {{5, 0}, {15, 2}, {25, 4}};
  for (const auto& [key, position] : steps) {
    const auto [p, inserted] = set.insert({key, 'n'});
    EXPECT_TRUE(inserted);
    EXPECT_EQ(positionOf(set, p), position) << key;
  }
  EXPECT_EQ(shown(set), "5n 10a 15n 20a 25n ");
}

TEST(SortedVectorSet, ASecondEqualKeyIsNotInserted) {
  Set set = setOf({1, 2, 3});
  for (const int key : {1, 2, 3}) {
    const auto [p, inserted] = set.insert({key, 'b'});
    EXPECT_FALSE(inserted);
    EXPECT_EQ(positionOf(set, p), key - 1);
    EXPECT_EQ(p->mark, 'a');
  }
  EXPECT_EQ(shown(set), "1a 2a 3a ");
}

struct Lookup {
  const char* name;
  int key;
  std::ptrdiff_t lowerBound;
  std::ptrdiff_t found;  // 4 is the end
};

class SortedVectorSetLookup : public testing::TestWithParam<Lookup> {};

TEST_P(SortedVectorSetLookup, FindsTheFirstElementThatIsNotLess) {
  Set set = setOf({10, 20, 30, 40});
  EXPECT_EQ(positionOf(set, set.lower_bound(Entry{GetParam().key, '?'})), GetParam().lowerBound);
  EXPECT_EQ(positionOf(set, set.find({GetParam().key, '?'})), GetParam().found);
  EXPECT_EQ(shown(set), "10a 20a 30a 40a ");
}

TEST_P(SortedVectorSetLookup, TakesAKeyOfAnotherType) {
  Set set = setOf({10, 20, 30, 40});
  EXPECT_EQ(positionOf(set, set.lower_bound(std::to_string(GetParam().key))), GetParam().lowerBound);
}

INSTANTIATE_TEST_SUITE_P(Keys, SortedVectorSetLookup,
                         testing::Values(Lookup{"BeforeAll", 9, 0, 4}, Lookup{"First", 10, 0, 0},
                                         Lookup{"Between", 11, 1, 4}, Lookup{"Second", 20, 1, 1},
                                         Lookup{"Third", 30, 2, 2}, Lookup{"Last", 40, 3, 3},
                                         Lookup{"BehindAll", 41, 4, 4}),
                         [](const auto& tested) { return std::string(tested.param.name); });

TEST(SortedVectorSet, UsesTheComparisonObjectThatItWasGiven) {
  ByKey order;
  order.descending = true;
  Set set = setOf({2, 1, 3}, order);
  EXPECT_EQ(shown(set), "3a 2a 1a ");
  EXPECT_EQ(positionOf(set, set.find({1, '?'})), 2);
}

TEST(SortedVectorSet, SearchesByBisection) {
  const ByKey order;
  std::vector<int> keys;
  for (int key = 0; key < 1023; ++key) keys.push_back(key);
  Set set = setOf(keys, order);
  for (const int key : {-1, 0, 511, 700, 1022, 1023}) {
    *order.asked = 0;
    set.lower_bound(Entry{key, '?'});
    EXPECT_LE(*order.asked, 10) << key;
  }
}

TEST(SortedVectorSet, CopiesWhatItIsGiven) {
  sorted_vector_set<std::string, std::less<std::string>> set;
  std::string value = "kept";
  set.insert(value);
  value = "changed";
  ASSERT_EQ(set.size(), 1u);
  EXPECT_EQ(*set.begin(), "kept");
}

TEST(SortedVectorSet, ACopyIsASetOfItsOwn) {
  Set set = setOf({1});
  const Set copy = set;
  set.insert({2, 'a'});
  EXPECT_EQ(shown(copy), "1a ");
}

// Tells what passes through it.
template <typename T>
struct CountingAllocator {
  using value_type = T;
  explicit CountingAllocator(int* counter) : allocations(counter) {}
  template <typename Other>
  CountingAllocator(const CountingAllocator<Other>& other) : allocations(other.allocations) {}
  T* allocate(std::size_t n) {
    ++*allocations;
    return static_cast<T*>(::operator new(n * sizeof(T)));
  }
  void deallocate(T* p, std::size_t) { ::operator delete(p); }
  bool operator==(const CountingAllocator& other) const { return allocations == other.allocations; }
  bool operator!=(const CountingAllocator& other) const { return !(*this == other); }
  int* allocations;
};

TEST(SortedVectorSet, TakesItsMemoryFromTheAllocatorThatItWasGiven) {
  int allocations = 0;
  const CountingAllocator<int> allocator(&allocations);
  sorted_vector_set<int, std::less<int>, CountingAllocator<int>> set(std::less<int>{}, allocator);
  EXPECT_EQ(set.size(), 0u);
  EXPECT_EQ(allocations, 0);
  for (const int key : {2, 1}) set.insert(key);
  EXPECT_GT(allocations, 0);
  EXPECT_THAT(std::vector<int>(set.begin(), set.end()), ElementsAre(1, 2));
}

TEST(SortedVectorSet, IteratesLikeTheVectorThatItIs) {
  EXPECT_TRUE((std::is_same_v<Set::iterator, std::vector<Entry>::iterator>));
  EXPECT_TRUE((std::is_same_v<Set::const_iterator, std::vector<Entry>::const_iterator>));
}

}  // namespace
