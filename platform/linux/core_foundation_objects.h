// SPDX-License-Identifier: MIT
// The objects behind CoreFoundation's references: one counted base and the two kinds that several sources
// look into.
//
// Every object begins with its CountedObject, so that a CFTypeRef of any kind can be counted.
#pragma once

#include <atomic>
#include <limits>
#include <string>
#include <utility>

#include "platform/core_foundation.h"

namespace core_foundation {

/// Begins with one reference, which belongs to the maker; the last release deletes it. Any thread.
class CountedObject {
 public:
  enum class Lifetime { kCounted, kConstant };

  CountedObject(const CountedObject&) = delete;
  CountedObject& operator=(const CountedObject&) = delete;
  virtual ~CountedObject() = default;

  void retain() const {
    if (lifetime == Lifetime::kCounted) references.fetch_add(1, std::memory_order_relaxed);
  }
  void release() const {
    if (lifetime == Lifetime::kCounted && references.fetch_sub(1, std::memory_order_acq_rel) == 1)
      delete this;
  }
  [[nodiscard]] CFIndex retainCount() const {
    return lifetime == Lifetime::kCounted ? references.load() : std::numeric_limits<CFIndex>::max();
  }

 protected:
  explicit CountedObject(Lifetime howLong = Lifetime::kCounted) : lifetime(howLong) {}

 private:
  const Lifetime lifetime;
  mutable std::atomic<CFIndex> references{1};
};

}  // namespace core_foundation

// NOLINTBEGIN(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes): the names that the
// references point to; records whose members never change
struct __CFString final : core_foundation::CountedObject {
  explicit __CFString(std::string utf8, Lifetime howLong = Lifetime::kCounted)
      : CountedObject(howLong), text(std::move(utf8)) {}
  const std::string text;  ///< Valid UTF-8.
};

struct __CFURL final : core_foundation::CountedObject {
  explicit __CFURL(std::string absolutePath) : path(std::move(absolutePath)) {}
  const std::string path;  ///< Absolute, not ending with a slash except for "/".
};
// NOLINTEND(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes)
