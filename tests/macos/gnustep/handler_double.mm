// SPDX-License-Identifier: MIT
// A double of macOS's exception handler, which GNUstep lacks: it tells on standard error what the program
// does to it, and passes every exception that is raised on to its delegate, as macOS does.
//
// Signals whose handlers the program installs are told too (the linker's --wrap=signal).
#include <csignal>
#include <cstdio>
#include <cstring>

#import <ExceptionHandling/NSExceptionHandler.h>
#import <Foundation/Foundation.h>
#include <dlfcn.h>

namespace {

NSExceptionHandler* defaultHandler = nil;
id currentDelegate = nil;
NSUInteger currentMask = 0;

/// Whether `delegate` wants an exception logged or handled for a bit of the mask; tells the question and its
/// answer.
bool ask(const char* what, SEL question, NSException* exception, NSUInteger bit) {
  if ((currentMask & bit) == 0 || ![currentDelegate respondsToSelector:question]) return false;
  std::fprintf(stderr, "handler: %s %s, mask %u\n", what, [[exception name] UTF8String],
               static_cast<unsigned>(bit));
  const BOOL answer = bit == NSLogOtherExceptionMask ? [currentDelegate exceptionHandler:defaultHandler
                                                                      shouldLogException:exception
                                                                                    mask:bit]
                                                     : [currentDelegate exceptionHandler:defaultHandler
                                                                   shouldHandleException:exception
                                                                                    mask:bit];
  std::fprintf(stderr, "handler: %s answered %s\n", what, answer ? "yes" : "no");
  return answer;
}

}  // namespace

@implementation NSExceptionHandler

+ (NSExceptionHandler*)defaultExceptionHandler {
  if (defaultHandler == nil) defaultHandler = [[NSExceptionHandler alloc] init];
  return defaultHandler;
}

- (void)setExceptionHandlingMask:(NSUInteger)mask {
  std::fprintf(stderr, "handler: mask %u\n", static_cast<unsigned>(mask));
  currentMask = mask;
}

- (NSUInteger)exceptionHandlingMask {
  return currentMask;
}

- (void)setDelegate:(id)delegate {
  std::fprintf(stderr, "handler: delegate %s\n", delegate == nil ? "nil" : object_getClassName(delegate));
  currentDelegate = delegate;
}

- (id)delegate {
  return currentDelegate;
}

@end

extern "C" {

/// Stands in front of the runtime's function of this name.
void objc_exception_throw(id exception) {
  ask("log", @selector(exceptionHandler:shouldLogException:mask:), exception, NSLogOtherExceptionMask);
  ask("handle", @selector(exceptionHandler:shouldHandleException:mask:), exception,
      NSHandleOtherExceptionMask);
  using Throw = void (*)(id);
  reinterpret_cast<Throw>(dlsym(RTLD_NEXT, "objc_exception_throw"))(exception);
  __builtin_unreachable();
}

using SignalHandler = void (*)(int);
SignalHandler __real_signal(int signal, SignalHandler handler);
SignalHandler __wrap_signal(int signal, SignalHandler handler);

SignalHandler __wrap_signal(int signal, SignalHandler handler) {
  std::fprintf(stderr, "signal: SIG%s\n", signal == 0 ? "?" : sigabbrev_np(signal));
  return __real_signal(signal, handler);
}

}  // extern "C"
