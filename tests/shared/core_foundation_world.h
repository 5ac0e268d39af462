// SPDX-License-Identifier: MIT
// What the recording CoreFoundation knows, shared by the test's side and the program's side of it.
#pragma once

#include <map>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "platform/core_foundation.h"
#include "tests/shared/recording_core_foundation.h"

namespace doubles {

/// One object behind the opaque pointers of CoreFoundation. Never freed and never moved, so that a use after
/// the last release can be told.
struct CoreFoundationObject {
  enum class Kind { kString, kUrl, kBundle, kLocale };
  Kind kind;
  std::string text;                      ///< A string's text, a path, a locale's identifier.
  CFIndex references = 1;                ///< The largest CFIndex for a constant.
  bool loaded = false;                   ///< Of a bundle.
  CoreFoundationObject* lent = nullptr;  ///< Of a locale: its identifier, owned by the locale.
  bool isLent = false;                   ///< One of the references is that of a living owner.
};

/// string "text", with the name of the object's kind; "null".
std::string described(const CoreFoundationObject* object);

/// The state between two resets.
struct CoreFoundationWorld {
  using Kind = CoreFoundationObject::Kind;
  struct Bundle {
    bool hasExecutable;
    SymbolTable symbols;
  };

  std::map<std::string, Bundle> bundles;
  std::set<Step> failing;
  std::string locale = "en_US";
  std::optional<std::string> entryPointName = "main";
  std::vector<std::pair<std::string, std::string>> calls;  ///< The function's name, and the whole call.
  std::vector<const CoreFoundationObject*> made;
  std::vector<std::string> misuses;

  bool fails(Step step) const { return failing.count(step) > 0; }

  /// Records a call; an empty answer stands for a function without one.
  void record(const std::string& function, const std::string& arguments, const std::string& answer = "");

  /// Makes an object with one reference.
  CoreFoundationObject* make(Kind kind, const std::string& text);

  /// The argument of `function` as an object. Notes a misuse and answers null when it is null, released, or
  /// of another kind than wanted.
  CoreFoundationObject* use(const char* function, CFTypeRef reference,
                            std::optional<Kind> kind = std::nullopt);
};

}  // namespace doubles
