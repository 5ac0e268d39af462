// SPDX-License-Identifier: MIT
// A plug-in module that lives in the test program: a bundle of the recording CoreFoundation whose entry point
// returns the instances that the test prepared.
//
//   RecordingCoreFoundation core_foundation;
//   InProcessPlugin plugin(core_foundation, "/b.vst");
//   RecordingEffect effect;
//   plugin.willCreate(effect);
//   plugin.willRefuse();                       // The second call of the entry point returns null.
//   ... the host loads "/b.vst" and creates an instance ...
//   EXPECT_THAT(plugin.entryCalls(), SizeIs(1));
//
// Ownership: the test owns plug-in and instances; they must outlive the host's use of them. At most four
//            plug-ins exist at a time; a fifth aborts the process.
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

  // ---- What the entry point will do: each of these prepares one call, in order ----

  /// Returns this instance. It can be prepared more than once.
  void willCreate(RecordingEffect& effect);
  /// Returns null.
  void willRefuse();
  /// Runs first in every call of the entry point; may call the host, or throw.
  std::function<void(audioMasterCallback host)> onEntry;

  // ---- What the host did ----

  /// The host callback of each call of the entry point, in order. A call that was not prepared returns null
  /// and fails the test.
  const std::vector<audioMasterCallback>& entryCalls() const { return hosts; }

  /// The number of instances returned minus the number of times they were closed after that.
  int instancesAlive() const;

  /// The entry point's address, as the bundle exports it.
  PluginEntryProc entryPoint() const;

 private:
  struct HandedOut {
    int times;
    int timesClosedBefore;
  };
  friend struct EntryPoints;

  AEffect* entered(audioMasterCallback host);

  const std::size_t slot;                  // Index of this plug-in's entry point.
  std::deque<RecordingEffect*> creations;  // Null: the entry point returns null.
  std::vector<audioMasterCallback> hosts;
  std::map<const RecordingEffect*, HandedOut> handedOut;
};

}  // namespace doubles
