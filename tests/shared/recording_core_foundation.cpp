// SPDX-License-Identifier: MIT
// The test's side of the recording CoreFoundation: what it sets, and what it is told.
#include "tests/shared/recording_core_foundation.h"

#include <cstdio>
#include <cstdlib>
#include <utility>

#include "gtest/gtest.h"
#include "tests/shared/core_foundation_world.h"

namespace doubles {
namespace {

RecordingCoreFoundation* current = nullptr;

}  // namespace

CoreFoundationWorld& RecordingCoreFoundation::currentWorld() {
  if (current != nullptr) return *current->world;
  std::fputs("CoreFoundation called while no RecordingCoreFoundation exists\n", stderr);
  std::abort();
}

RecordingCoreFoundation::RecordingCoreFoundation()
    : world(std::make_unique<CoreFoundationWorld>()), previous(current) {
  current = this;
}

RecordingCoreFoundation::~RecordingCoreFoundation() {
  for (const std::string& misuse : takeMisuses()) ADD_FAILURE() << misuse;
  current = previous;
}

void RecordingCoreFoundation::addBundle(const std::string& path, SymbolTable symbols) {
  world->bundles[path] = {true, std::move(symbols)};
}

void RecordingCoreFoundation::addBundleWithoutExecutable(const std::string& path) {
  world->bundles[path] = {false, {}};
}

void RecordingCoreFoundation::failStep(Step step) { world->failing.insert(step); }

void RecordingCoreFoundation::mendStep(Step step) { world->failing.erase(step); }

void RecordingCoreFoundation::setLocale(const std::string& identifier) { world->locale = identifier; }

void RecordingCoreFoundation::setSystemEntryPointName(std::optional<std::string> name) {
  world->entryPointName = std::move(name);
}

void RecordingCoreFoundation::reset() { world = std::make_unique<CoreFoundationWorld>(); }

std::vector<std::string> RecordingCoreFoundation::calls() const {
  std::vector<std::string> whole;
  for (const auto& call : world->calls) whole.push_back(call.second);
  return whole;
}

std::vector<std::string> RecordingCoreFoundation::functionsCalled() const {
  std::vector<std::string> names;
  for (const auto& call : world->calls) names.push_back(call.first);
  return names;
}

std::vector<std::string> RecordingCoreFoundation::callsOf(const std::string& function) const {
  std::vector<std::string> chosen;
  for (const auto& call : world->calls) {
    if (call.first == function) chosen.push_back(call.second);
  }
  return chosen;
}

void RecordingCoreFoundation::forgetCalls() { world->calls.clear(); }

std::vector<std::string> RecordingCoreFoundation::aliveObjects() const {
  std::vector<std::string> alive;
  for (const CoreFoundationObject* object : world->made) {
    if (object->references > (object->isLent ? 1 : 0)) alive.push_back(described(object));
  }
  return alive;
}

std::vector<std::string> RecordingCoreFoundation::takeMisuses() { return std::exchange(world->misuses, {}); }

}  // namespace doubles
