// SPDX-License-Identifier: MIT
// Another implementation of platform/core_foundation.h and platform/entry_point_name.h: it records every
// call, and a test chooses which bundles exist, what they export and which locale the user has.
//
//   RecordingCoreFoundation core_foundation;   // a member of the test fixture
//   core_foundation.addBundle("/b.vst", {{"VSTPluginMain", entry}});
//   core_foundation.failStep(Step::kLoadExecutable);
//   EXPECT_THAT(core_foundation.calls(), Contains("CFBundleLoadExecutable(\"/b.vst\") -> false"));
//
// The functions work on the latest RecordingCoreFoundation that exists and end the process when there is
// none. Objects stay in memory after their release, so that a later use of them is found. A bundle that was
// kept from an earlier test has the symbols that the present test gives to its path.
//
// A use that crashes in the real CoreFoundation fails the test when the RecordingCoreFoundation is destroyed:
// of a null object, of a released one, of one of another kind, and the release of an object that the caller
// does not own.
//
// Systems: those where platform/core_foundation.h declares the functions itself.
#pragma once

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "platform/core_foundation.h"

namespace doubles {

/// A step that a test can make fail.
enum class Step {
  kCreateString,    ///< CFStringCreateWithCString returns null.
  kCreateUrl,       ///< CFURLCreateWithFileSystemPath returns null.
  kCreateBundle,    ///< CFBundleCreate returns null.
  kLoadExecutable,  ///< CFBundleLoadExecutable returns false.
  kGetCString,      ///< CFStringGetCString returns false, although the text is in the buffer.
};

/// What a bundle exports under a name: any function, or any address.
class SymbolAddress {
 public:
  template <typename Result, typename... Arguments>
  SymbolAddress(Result (*function)(Arguments...)) : address(reinterpret_cast<void*>(function)) {}
  SymbolAddress(void* data) : address(data) {}
  void* get() const { return address; }

 private:
  void* address;
};

/// Names and addresses of what a bundle's executable exports.
using SymbolTable = std::map<std::string, SymbolAddress>;

class RecordingCoreFoundation {
 public:
  RecordingCoreFoundation();
  ~RecordingCoreFoundation();
  RecordingCoreFoundation(const RecordingCoreFoundation&) = delete;
  RecordingCoreFoundation& operator=(const RecordingCoreFoundation&) = delete;

  // ---- What the program finds ----

  /// Puts a bundle at `path`, whose executable exports these symbols. Replaces an earlier one there.
  void addBundle(const std::string& path, SymbolTable symbols);

  /// Makes a step fail from now on, or work again.
  void failStep(Step step);
  void mendStep(Step step);

  /// The identifier of the user's locale; "en_US" until set.
  void setLocale(const std::string& identifier);

  /// What systemEntryPointName() returns: a name ("main" until set), or null. Its calls are not recorded.
  void setSystemEntryPointName(std::optional<std::string> name);

  // ---- What the program did ----

  /// Every call in order, with arguments and result:
  ///   CFStringCreateWithCString("/b.vst", UTF-8) -> string
  ///   CFURLCreateWithFileSystemPath("/b.vst", POSIX, file) -> URL
  ///   CFRelease(string "/b.vst")
  ///   CFBundleCreate("/b.vst") -> bundle
  ///   CFBundleLoadExecutable("/b.vst") -> true
  ///   CFBundleGetFunctionPointerForName("/b.vst", "VSTPluginMain") -> function
  ///   CFBundleUnloadExecutable("/b.vst")
  ///   CFLocaleCopyCurrent() -> locale
  ///   CFLocaleGetIdentifier("de_CH") -> string
  ///   CFStringGetCString("de_CH", 255 bytes, ASCII) -> true
  /// Failures show null or false. An allocator other than the default one is shown as a last argument.
  /// CFSTR is not a call.
  const std::vector<std::string>& calls() const;
  /// Only the calls of one function.
  std::vector<std::string> callsOf(const std::string& function) const;
  void forgetCalls();

  /// The objects made and not released, in order of creation, such as: bundle "/b.vst". Without constants and
  /// the identifiers of locales.
  std::vector<std::string> aliveObjects() const;

  struct State;  ///< Of the functions; defined with them.

 private:
  std::unique_ptr<State> state;
};

}  // namespace doubles
