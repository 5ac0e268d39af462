// SPDX-License-Identifier: MIT
// A set kept as a sorted vector.
#pragma once

#include <memory>
#include <utility>
#include <vector>

/// Unique elements in ascending order under `Less`. Two elements are the same key when neither is less than
/// the other. lower_bound() also takes a key of another type, if `Less` can compare an element with it.
template <class Element, class Less, class Allocator = std::allocator<Element>>
class sorted_vector_set {
 public:
  using vector_type = std::vector<Element, Allocator>;
  using iterator = typename vector_type::iterator;
  using const_iterator = typename vector_type::const_iterator;

  explicit sorted_vector_set(const Less& comparison = Less(), const Allocator& allocator = Allocator())
      : elements(allocator), less(comparison) {}

  /// The first element that is not less than `key`, or the end. By bisection.
  template <class Key>
  iterator lower_bound(const Key& key) {
    iterator first = begin();
    auto count = end() - first;
    while (count > 0) {
      const auto half = count / 2;
      if (less(first[half], key)) {
        first += half + 1;
        count -= half + 1;
      } else {
        count = half;
      }
    }
    return first;
  }

  /// The element with this key, or the end.
  iterator find(const Element& key) {
    const iterator p = lower_bound(key);
    return p != end() && !less(key, *p) ? p : end();
  }

  /// Inserts a copy in its place and returns its position and true. If an element with this key is there
  /// already, nothing is inserted and the result is its position and false.
  std::pair<iterator, bool> insert(const Element& value) {
    const iterator p = lower_bound(value);
    if (p != end() && !less(value, *p)) return {p, false};
    return {elements.insert(p, value), true};
  }

  iterator begin() { return elements.begin(); }
  iterator end() { return elements.end(); }
  [[nodiscard]] const_iterator begin() const { return elements.begin(); }
  [[nodiscard]] const_iterator end() const { return elements.end(); }
  [[nodiscard]] typename vector_type::size_type size() const { return elements.size(); }

 private:
  vector_type elements;
  Less less;
};
