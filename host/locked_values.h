// SPDX-License-Identifier: MIT
// Reads and sets several parameter values of an instance under one hold of the wrapper's lock.
//
// Taking the lock costs more than reading a value from a simple plug-in. Code that reads or sets all values
// in a row therefore takes the lock once; VSTWrapper::getParameter and setParameter take it for one value.
#pragma once

#include "flight_recorder/flight_recorder.h"
#include "host/vst_wrapper.h"

/// Takes the lock when the first value is read or set, and releases it when destroyed. Without any value it
/// takes no lock. An index outside 0 to numParams - 1 (numParams is read afresh each time) reads as 0.0 and
/// sets nothing. Exceptions from the plug-in are swallowed, separately for each value.
class LockedValues {
 public:
  explicit LockedValues(VSTWrapper& wrapper)
      : effect(wrapper.effect), lock(wrapper.lock), paramBeingSet(wrapper.paramBeingSet) {}
  ~LockedValues() {
    if (!isLocked) return;
    record.end();
    lock.unlock();
  }
  LockedValues(const LockedValues&) = delete;
  LockedValues& operator=(const LockedValues&) = delete;

  [[nodiscard]] bool has(VstInt32 index) const {
    return effect != nullptr && index >= 0 && index < effect->numParams;
  }

  [[nodiscard]] float get(VstInt32 index) {
    if (!has(index)) return 0.0f;
    takeLock(index);
    try {
      return ask(index);
    } catch (...) {
      record.hasThrown();
      return 0.0f;
    }
  }

  void set(VstInt32 index, float value) {
    if (!has(index)) return;
    takeLock(index);
    try {
      // On purpose: a value equal to the present one is never sent.
      if (ask(index) == value) return;
      const ParamBeingSet being(paramBeingSet, index);
      record.sets(value);
      effect->setParameter(effect, index, value);
      record.hasSet();
    } catch (...) {  // The parameter keeps the value that the plug-in left it with.
      record.hasThrown();
    }
  }

 private:
  /// Sets paramBeingSet to `index`, and back to -1 when destroyed.
  /// On purpose: also -1 when an outer setParameter is still running.
  class ParamBeingSet {
   public:
    ParamBeingSet(VstInt32& itsSlot, VstInt32 index) : slot(itsSlot) { slot = index; }
    ~ParamBeingSet() { slot = -1; }
    ParamBeingSet(const ParamBeingSet&) = delete;
    ParamBeingSet& operator=(const ParamBeingSet&) = delete;

   private:
    VstInt32& slot;
  };

  void takeLock(VstInt32 index) {
    if (isLocked) return;
    lock.lock();
    isLocked = true;
    record.begin(index);
  }

  /// Asks the plug-in for a value. The volatile variable rounds it to 32 bits: where floats are returned in a
  /// wider register, the answer could otherwise differ from the value that the plug-in was given.
  [[nodiscard]] float ask(VstInt32 index) {
    record.reads(index);
    const volatile float value = effect->getParameter(effect, index);
    return value;
  }

  AEffect* const effect;
  const NiduCoreRecursiveMutex& lock;
  VstInt32& paramBeingSet;
  ValuesUnderWay record;
  bool isLocked = false;
};
