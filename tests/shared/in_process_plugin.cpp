// SPDX-License-Identifier: MIT
// An entry point has no argument that says which plug-in it belongs to, so each plug-in has a function of its
// own.
#include "tests/shared/in_process_plugin.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <iterator>

#include "gtest/gtest.h"

namespace doubles {

struct EntryPoints {
  static InProcessPlugin* plugins[4];

  template <std::size_t kSlot>
  static AEffect* enter(audioMasterCallback host) {
    if (plugins[kSlot] != nullptr) return plugins[kSlot]->entered(host);
    ADD_FAILURE() << "entry point called of a plug-in that was destroyed";
    return nullptr;
  }

  static std::size_t freeSlot() {
    const auto found = std::find(std::begin(plugins), std::end(plugins), nullptr);
    if (found != std::end(plugins)) return static_cast<std::size_t>(found - std::begin(plugins));
    std::fputs("more than four plug-ins at a time\n", stderr);
    std::abort();
  }
};

InProcessPlugin* EntryPoints::plugins[4] = {};

InProcessPlugin::InProcessPlugin(RecordingCoreFoundation& core_foundation, const std::string& path,
                                 const std::vector<std::string>& entryPointNames)
    : slot(EntryPoints::freeSlot()) {
  EntryPoints::plugins[slot] = this;
  SymbolTable symbols;
  for (const std::string& name : entryPointNames) symbols.emplace(name, entryPoint());
  core_foundation.addBundle(path, symbols);
}

InProcessPlugin::~InProcessPlugin() { EntryPoints::plugins[slot] = nullptr; }

void InProcessPlugin::willCreate(RecordingEffect& effect) { creations.push_back(&effect); }

void InProcessPlugin::willRefuse() { creations.push_back(nullptr); }

int InProcessPlugin::instancesAlive() const {
  int alive = 0;
  for (const auto& [effect, handed] : handedOut) {
    alive += handed.times - (effect->timesClosed() - handed.timesClosedBefore);
  }
  return alive;
}

PluginEntryProc InProcessPlugin::entryPoint() const {
  constexpr PluginEntryProc kEntryPoints[] = {EntryPoints::enter<0>, EntryPoints::enter<1>,
                                              EntryPoints::enter<2>, EntryPoints::enter<3>};
  return kEntryPoints[slot];
}

AEffect* InProcessPlugin::entered(audioMasterCallback host) {
  hosts.push_back(host);
  if (onEntry) onEntry(host);
  if (creations.empty()) {
    ADD_FAILURE() << "entry point called more often than prepared";
    return nullptr;
  }
  RecordingEffect* const next = creations.front();
  creations.pop_front();
  if (next == nullptr) return nullptr;
  ++handedOut.try_emplace(next, HandedOut{0, next->timesClosed()}).first->second.times;
  return &next->aeffect;
}

}  // namespace doubles
