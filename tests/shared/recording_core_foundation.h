// SPDX-License-Identifier: MIT
// Another implementation of platform/core_foundation.h: it records every call and takes its bundles and its
// locale from the test.
//
//   RecordingCoreFoundation core_foundation;   // a member of the test fixture
//   core_foundation.addBundle("/b.vst", {{"VSTPluginMain", entry}});
//   core_foundation.failStep(Step::kLoadExecutable);
//   EXPECT_THAT(core_foundation.calls(), Contains("CFBundleLoadExecutable(\"/b.vst\") -> false"));
//
// The functions of the header work on the latest RecordingCoreFoundation that exists and end the process when
// there is none. Objects stay in memory after their last release, so that a late use can be told: a bundle
// that somebody kept from an earlier test finds its symbols among those that the present test gives its path.
//
// Ownership: one per test at a time; its destruction fails the test for misuses that nobody took.
// Systems:   those where platform/core_foundation.h declares the functions itself.
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
  kCreateString,    ///< CFStringCreateWithCString answers null.
  kCreateUrl,       ///< CFURLCreateWithFileSystemPath answers null.
  kCreateBundle,    ///< CFBundleCreate answers null.
  kLoadExecutable,  ///< CFBundleLoadExecutable answers false.
  kGetCString,      ///< CFStringGetCString answers false, although the text lies in the buffer.
};

/// What a bundle's symbol stands for: any function, or any address.
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

struct CoreFoundationWorld;

class RecordingCoreFoundation {
 public:
  RecordingCoreFoundation();
  ~RecordingCoreFoundation();
  RecordingCoreFoundation(const RecordingCoreFoundation&) = delete;
  RecordingCoreFoundation& operator=(const RecordingCoreFoundation&) = delete;

  // ---- The world as the program finds it ----

  /// There is a bundle at `path` with an executable that exports these symbols. Replaces an earlier one
  /// there.
  void addBundle(const std::string& path, SymbolTable symbols);
  /// There is a bundle at `path`, but it cannot be loaded.
  void addBundleWithoutExecutable(const std::string& path);

  /// Makes a step fail from now on, or work again.
  void failStep(Step step);
  void mendStep(Step step);

  /// The identifier of the user's locale; "en_US" until set.
  void setLocale(const std::string& identifier);

  /// What systemEntryPointName() answers: a name ("main" until set), or null. Asking it is not recorded.
  void setSystemEntryPointName(std::optional<std::string> name);

  /// Forgets calls, bundles, failures and objects; the state is as after construction.
  void reset();

  // ---- What the program did ----

  /// Every call in order, with arguments and answer:
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
  ///   CFGetRetainCount(bundle "/b.vst") -> 1
  /// Failures answer null or false. An allocator other than the default one is shown as a last argument.
  /// CFSTR is not a call.
  std::vector<std::string> calls() const;
  /// Only the functions' names, or only the calls of one function.
  std::vector<std::string> functionsCalled() const;
  std::vector<std::string> callsOf(const std::string& function) const;
  void forgetCalls();

  /// The objects made and not yet released for the last time, in order of creation: bundle "/b.vst".
  /// Constants, and what a live object lends, do not count.
  std::vector<std::string> aliveObjects() const;

  /// What real CoreFoundation would answer with a crash, since the start or the last taking: a null object, a
  /// released one, or one of another kind.
  std::vector<std::string> takeMisuses();

  /// For the functions of the header: the state of the latest RecordingCoreFoundation that exists.
  static CoreFoundationWorld& currentWorld();

 private:
  std::unique_ptr<CoreFoundationWorld> world;
  RecordingCoreFoundation* const previous;
};

}  // namespace doubles
