// SPDX-License-Identifier: MIT
// Parameter values of an instance, one after the other under one hold of the wrapper's lock.
//
// The lock costs more than a plug-in that just tells a value. Where all values are read or written in a row
// it is taken once for all of them; VSTWrapper::getParameter and setParameter take it for their one.
#pragma once

#include <mutex>

#include "host/vst_wrapper.h"

/// Holds the lock for as long as it lives. An index outside 0 to numParams - 1, as it is at that moment,
/// reads as 0.0 and writes nothing. What the plug-in throws is swallowed, value by value.
class LockedValues {
 public:
  explicit LockedValues(VSTWrapper& wrapper)
      : effect(wrapper.effect), paramBeingSet(wrapper.paramBeingSet), guard(wrapper.lock) {}

  [[nodiscard]] bool has(VstInt32 index) const {
    return effect != nullptr && index >= 0 && index < effect->numParams;
  }

  [[nodiscard]] float get(VstInt32 index) const {
    if (!has(index)) return 0.0f;
    try {
      return ask(index);
    } catch (...) {
      return 0.0f;
    }
  }

  void set(VstInt32 index, float value) {
    if (!has(index)) return;
    try {
      // On purpose: a value that the plug-in holds already is never sent.
      if (ask(index) == value) return;
      const ParamBeingSet being(paramBeingSet, index);
      effect->setParameter(effect, index, value);
    } catch (...) {  // The plug-in's own trouble: the parameter stays as it is.
    }
  }

 private:
  /// Names the parameter that is being set, for as long as it lives.
  class ParamBeingSet {
   public:
    ParamBeingSet(VstInt32& itsSlot, VstInt32 index) : slot(itsSlot) { slot = index; }
    ~ParamBeingSet() { slot = -1; }
    ParamBeingSet(const ParamBeingSet&) = delete;
    ParamBeingSet& operator=(const ParamBeingSet&) = delete;

   private:
    VstInt32& slot;
  };

  /// The answer goes through memory: where floats are returned in a wider register, it would otherwise differ
  /// from the 32-bit value that the plug-in was given.
  [[nodiscard]] float ask(VstInt32 index) const {
    const volatile float value = effect->getParameter(effect, index);
    return value;
  }

  AEffect* const effect;
  VstInt32& paramBeingSet;
  const std::lock_guard<const NiduCoreRecursiveMutex> guard;
};
