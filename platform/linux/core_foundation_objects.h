// SPDX-License-Identifier: MIT
// What the Linux sources behind platform/core_foundation.h share: their objects, the check for UTF-8, and the
// line on standard error.
#pragma once

#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <utility>

#include "platform/core_foundation.h"

namespace core_foundation {

/// The base of every object, at its front, so that a CFTypeRef of any kind can be released. No function of
/// the header adds a reference: an object has one owner, and its release deletes the object.
class Object {
 public:
  /// kConstant: has no owner; CFRelease does nothing to it.
  enum class Lifetime { kOwned, kConstant };

  Object(const Object&) = delete;
  Object& operator=(const Object&) = delete;
  virtual ~Object() = default;

  const Lifetime lifetime;  // NOLINT(misc-non-private-member-variables-in-classes): never changes

 protected:
  explicit Object(Lifetime howLong) : lifetime(howLong) {}
};

/// Constant objects by the text that they are made from: equal texts give the same object. Never destroyed,
/// because code that runs while the process ends may still ask. Any thread.
template <typename Constant>
class ConstantTable {
 public:
  /// The object for `text`, made on the first call with it.
  const Constant* intern(const std::string& text) {
    const std::lock_guard<std::mutex> guard(lock);
    std::unique_ptr<const Constant>& object = objects[text];
    if (!object) object = std::make_unique<const Constant>(text, Object::Lifetime::kConstant);
    return object.get();
  }

 private:
  std::mutex lock;
  std::map<std::string, std::unique_ptr<const Constant>> objects;
};

/// Writes "vsttorture: ", `reason` and a line end to standard error, as one line of valid UTF-8: control
/// characters become blanks, and in a text that is not UTF-8 every byte above 0x7F becomes \xNN.
void logFailure(std::string_view reason);

}  // namespace core_foundation

// NOLINTBEGIN(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes): the names that the
// references point to; records whose members never change
struct __CFString final : core_foundation::Object {
  explicit __CFString(std::string utf8, Lifetime howLong = Lifetime::kOwned)
      : Object(howLong), text(std::move(utf8)) {}
  const std::string text;  ///< Valid UTF-8.
};

struct __CFURL final : core_foundation::Object {
  explicit __CFURL(std::string absolutePath) : Object(Lifetime::kOwned), path(std::move(absolutePath)) {}
  const std::string path;  ///< Absolute, not ending with a slash except for "/".
};
// NOLINTEND(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes)
