// SPDX-License-Identifier: MIT
// A stream of typed values, through which identity records are stored and sent.
//
// The records decide the order of the values, the stream decides how a value is encoded. This program has no
// implementation.
#pragma once

#include <cstdint>

#include "support/exceptions.h"

/// Each operation is given a fresh error slot and sets its error code when it fails.
class INiduStream {
 public:
  virtual ~INiduStream() = default;

  virtual void writeString(AutoNiduException* error, const char* text) = 0;
  virtual void writeBool(AutoNiduException* error, bool value) = 0;
  virtual void writeInt32(AutoNiduException* error, std::int32_t value) = 0;
  /// Leaves a zero-terminated text of at most `maxLength` characters in `buffer`, which has room for one
  /// more.
  virtual void readString(AutoNiduException* error, char* buffer, int maxLength) = 0;
  /// Any value but 0 is true.
  virtual char readBool(AutoNiduException* error) = 0;
  virtual std::int32_t readInt32(AutoNiduException* error) = 0;
};
