// SPDX-License-Identifier: MIT
// A system that has no handler for exceptions which nobody caught: the delegate is made, and never asked.
#include "platform/exception_handler.h"

struct AutoreleasePool {};
struct ExceptionDelegate {};

AutoreleasePool* makeAutoreleasePool() { return new AutoreleasePool(); }
void releaseAutoreleasePool(AutoreleasePool* pool) { delete pool; }

ExceptionDelegate* makeExceptionDelegate(const ExceptionDelegateActions& actions) {
  actions.installSignalGuard();
  return new ExceptionDelegate();
}
void releaseExceptionDelegate(ExceptionDelegate* delegate) { delete delegate; }
