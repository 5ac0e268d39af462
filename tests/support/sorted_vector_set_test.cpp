// SPDX-License-Identifier: MIT
// A set kept as a sorted vector.
#include <cstddef>
#include <functional>
#include <memory>
#include <new>
#include <string>
#include <type_traits>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/sorted_vector_set.h"

namespace {

// An element with a key and a mark that the order ignores.
struct Entry {
  int key;
  char mark;
};

// Counts its calls; the count is shared, because the set keeps a copy.
struct ByKey {
  bool operator()(const Entry& a, const Entry& b) const { return before(a.key, b.key); }
  bool operator()(const Entry& a, const std::string& key) const { return before(a.key, std::stoi(key)); }
  bool before(int a, int b) const {
    ++*calls;
    return descending ? b < a : a < b;
  }
  bool descending = false;
  std::shared_ptr<int> calls = std::make_shared<int>(0);
};

using Set = sorted_vector_set<Entry, ByKey>;
static_assert(std::is_same_v<Set::iterator, std::vector<Entry>::iterator>);
static_assert(std::is_same_v<Set::const_iterator, std::vector<Entry>::const_iterator>);

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

TEST(SortedVectorSet, IsEmptyAtFirst) {
  Set set;
  EXPECT_EQ(set.size(), 0u);
  EXPECT_EQ(set.lower_bound(Entry{1, 'a'}), set.end());
  EXPECT_EQ(set.find({1, 'a'}), set.end());
}

TEST(SortedVectorSet, InsertsEachElementInItsPlaceAndReturnsThat) {
  Set set;
  const std::vector<int> keys = {5, -1, 9, 3, 0, 7};
  const std::vector<std::ptrdiff_t> positions = {0, 0, 2, 1, 1, 4};
  for (std::size_t i = 0; i < keys.size(); ++i) {
    const auto [p, inserted] = set.insert({keys[i], 'a'});
    EXPECT_TRUE(inserted);
    EXPECT_EQ(p - set.begin(), positions[i]) << keys[i];
  }
  EXPECT_EQ(shown(set), "-1a 0a 3a 5a 7a 9a ");
  EXPECT_EQ(set.size(), 6u);
}

TEST(SortedVectorSet, ASecondEqualKeyIsNotInserted) {
  Set set = setOf({1, 2, 3});
  for (const int key : {1, 2, 3}) {
    const auto [p, inserted] = set.insert({key, 'b'});
    EXPECT_FALSE(inserted);
    EXPECT_EQ(p - set.begin(), key - 1);
  }
  EXPECT_EQ(shown(set), "1a 2a 3a ");
}

TEST(SortedVectorSet, FindsTheFirstElementThatIsNotLessAlsoForAKeyOfAnotherType) {
  struct Lookup {
    int key;
    std::ptrdiff_t lowerBound;
    std::ptrdiff_t found;  // 4 is the end
  };
  Set set = setOf({10, 20, 30, 40});
  for (const auto& [key, lowerBound, found] :
       {Lookup{9, 0, 4}, Lookup{10, 0, 0}, Lookup{11, 1, 4}, Lookup{20, 1, 1}, Lookup{30, 2, 2},
        Lookup{40, 3, 3}, Lookup{41, 4, 4}}) {
    EXPECT_EQ(set.lower_bound(Entry{key, '?'}) - set.begin(), lowerBound) << key;
    EXPECT_EQ(set.lower_bound(std::to_string(key)) - set.begin(), lowerBound) << key;
    EXPECT_EQ(set.find({key, '?'}) - set.begin(), found) << key;
  }
}

TEST(SortedVectorSet, UsesTheComparisonObjectThatItWasGiven) {
  ByKey order;
  order.descending = true;
  Set set = setOf({2, 1, 3}, order);
  EXPECT_EQ(shown(set), "3a 2a 1a ");
  EXPECT_EQ(set.find({1, '?'}) - set.begin(), 2);
}

TEST(SortedVectorSet, SearchesByBisection) {
  const ByKey order;
  std::vector<int> keys;
  for (int key = 0; key < 1023; ++key) keys.push_back(key);
  Set set = setOf(keys, order);
  for (const int key : {-1, 0, 511, 700, 1022, 1023}) {
    *order.calls = 0;
    set.lower_bound(Entry{key, '?'});
    EXPECT_LE(*order.calls, 10) << key;
  }
}

// Counts the allocations that are made through it.
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
  sorted_vector_set<int, std::less<int>, CountingAllocator<int>> set(std::less<int>{},
                                                                     CountingAllocator<int>(&allocations));
  EXPECT_EQ(allocations, 0);
  set.insert(1);
  EXPECT_EQ(allocations, 1);
}

}  // namespace
