// SPDX-License-Identifier: MIT
// A plug-in module that lives in the test program: a bundle of the recording CoreFoundation whose entry point
// hands out the instances that the test prepared.
//
//   RecordingCoreFoundation core_foundation;
//   InProcessPlugin plugin(core_foundation, "/b.vst");
//   RecordingEffect effect;
//   plugin.willCreate(effect);
//   plugin.willRefuse();                       // ... and the second creation answers null
//   ... the host loads "/b.vst" and creates an instance ...
//   EXPECT_THAT(plugin.entryCalls(), SizeIs(1));
//
// Ownership: the test owns plug-in and instances, which must live as long as the host can reach them. At most
//            four plug-ins exist at a time; the fifth ends the process.
#pragma once

#include <cstddef>
#include <deque>
#include <functional>
#include <map>
#include <string>
#include <vector>

#include "tests/shared/recording_core_foundation.h"
#include "tests/shared/recording_effect.h"
#include "vst2/aeffect.h"

namespace doubles {

class InProcessPlugin {
 public:
  /// Adds the bundle `path`, which exports the entry point under these names.
  explicit InProcessPlugin(RecordingCoreFoundation& core_foundation, const std::string& path = "/test.vst",
                           const std::vector<std::string>& entryPointNames = {"VSTPluginMain"});
  ~InProcessPlugin();
  InProcessPlugin(const InProcessPlugin&) = delete;
  InProcessPlugin& operator=(const InProcessPlugin&) = delete;

  // ---- What the entry point will do, one line for each call of it, in order ----

  /// Answers this instance. The same one may be created again later.
  void willCreate(RecordingEffect& effect);
  /// Answers null.
  void willRefuse();
  /// Throws an int, 42, out of the entry point.
  void willThrow();
  /// Runs in every call of the entry point before it answers; may ask the host, or throw something else.
  std::function<void(audioMasterCallback host)> onEntry;

  // ---- What the host did ----

  /// The host callback of each call of the entry point, in order. A call beyond what was prepared answers
  /// null and fails the test.
  const std::vector<audioMasterCallback>& entryCalls() const { return hosts; }

  /// How many instances were handed out less how often these were closed since.
  int instancesAlive() const;

  /// The entry point's address, as the bundle exports it.
  PluginEntryProc entryPoint() const;

 private:
  struct Creation {
    RecordingEffect* effect;  // Null when the entry point gives none.
    bool throws;
  };
  struct HandedOut {
    int times;
    int timesClosedBefore;
  };
  friend struct EntryPoints;

  AEffect* entered(audioMasterCallback host);

  const std::size_t slot;  // Which of the entry points is this plug-in's.
  std::deque<Creation> creations;
  std::vector<audioMasterCallback> hosts;
  std::map<const RecordingEffect*, HandedOut> handedOut;
};

}  // namespace doubles
