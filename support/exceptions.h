// SPDX-License-Identifier: MIT
// The two things that this program throws, and the checks that throw them.
//
// - The int -1: a resource could not be obtained.
// - NiduException, a record of fixed size: a stream operation failed.
// Nothing is printed here; the driver catches both in one place.
#pragma once

#include <cstdint>
#include <new>
#include <stdexcept>

/// What went wrong in a stream operation. Thrown by value, and copied as one block of bytes.
struct NiduException {
  char textA[50];          ///< First text of the description, zero-terminated.
  char textB[50];          ///< Second text, zero-terminated.
  char textC[50];          ///< Third text, zero-terminated.
  std::int32_t errorCode;  ///< 0 = no error; any other value = the operation failed.
  std::int32_t mode;       ///< 1 in a prepared error slot; not examined by the check.
  std::int32_t spare;      ///< Not used by the check; copied as it is.
};

/// The error slot of one stream operation.
///
/// Made on the stack for a single operation and passed to it by pointer; the stream sets the error code (and
/// may fill the texts) when it fails. Call doCheck() right after the operation. If the operation itself
/// throws, the slot's destructor does not throw, because an exception is already propagating.
class AutoNiduException {
 public:
  /// Texts empty, error code 0, mode 1.
  AutoNiduException();
  /// Calls doCheck(), so it may throw.
  ~AutoNiduException() noexcept(false);
  AutoNiduException(const AutoNiduException&) = delete;
  AutoNiduException& operator=(const AutoNiduException&) = delete;

  /// Throws a copy of the whole record when its error code is not 0 and no exception is propagating.
  void doCheck();

  NiduException record;
};

/// Throws the int -1 when `p` is null.
void nidu_FailNULL(void* p);

/// Runs `allocate`, which grows a container, and throws the int -1 when there is no memory for it.
template <class Allocate>
void allocateOrFail(Allocate allocate) {
  try {
    allocate();
  } catch (const std::bad_alloc&) {
    throw -1;
  } catch (const std::length_error&) {
    throw -1;
  }
}
