// SPDX-License-Identifier: MIT
#include "support/exceptions.h"

#include <exception>

AutoNiduException::AutoNiduException() : record{} { record.mode = 1; }

AutoNiduException::~AutoNiduException() noexcept(false) { doCheck(); }

void AutoNiduException::doCheck() {
  if (record.errorCode != 0 && std::uncaught_exceptions() == 0) throw NiduException(record);
}

void nidu_FailNULL(void* p) {
  if (p == nullptr) throw -1;
}
