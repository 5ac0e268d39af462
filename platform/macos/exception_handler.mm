// SPDX-License-Identifier: MIT
// The default exception handler on macOS: Foundation's, with a delegate of ours.
#include "platform/exception_handler.h"

#import <ExceptionHandling/NSExceptionHandler.h>
#import <Foundation/Foundation.h>

namespace {

constexpr NSUInteger kAllExceptionsMask = 1023;

ExceptionDelegateActions delegateActions;

}  // namespace

@interface nidu_VST_Support_ExceptionHandlerDelegate : NSObject
@end

@implementation nidu_VST_Support_ExceptionHandlerDelegate

- (id)init {
  self = [super init];
  [[NSExceptionHandler defaultExceptionHandler] setDelegate:self];
  [[NSExceptionHandler defaultExceptionHandler] setExceptionHandlingMask:kAllExceptionsMask];
  delegateActions.installSignalGuard();
  return self;
}

- (void)dealloc {
  [[NSExceptionHandler defaultExceptionHandler] setDelegate:nil];
  [super dealloc];
}

- (BOOL)shouldDisplayException:(NSException*)exception {
  (void)exception;
  return NO;
}

- (BOOL)exceptionHandler:(NSExceptionHandler*)sender
      shouldLogException:(NSException*)exception
                    mask:(NSUInteger)mask {
  (void)sender;
  (void)exception;
  (void)mask;
  return YES;
}

- (BOOL)exceptionHandler:(NSExceptionHandler*)sender
    shouldHandleException:(NSException*)exception
                     mask:(NSUInteger)mask {
  (void)sender;
  (void)exception;
  (void)mask;
  delegateActions.exitProcess();
  return YES;
}

@end

AutoreleasePool* makeAutoreleasePool() {
  return reinterpret_cast<AutoreleasePool*>([[NSAutoreleasePool alloc] init]);
}

void releaseAutoreleasePool(AutoreleasePool* pool) { [reinterpret_cast<NSAutoreleasePool*>(pool) release]; }

ExceptionDelegate* makeExceptionDelegate(const ExceptionDelegateActions& actions) {
  delegateActions = actions;
  return reinterpret_cast<ExceptionDelegate*>([[nidu_VST_Support_ExceptionHandlerDelegate alloc] init]);
}

void releaseExceptionDelegate(ExceptionDelegate* delegate) {
  [reinterpret_cast<nidu_VST_Support_ExceptionHandlerDelegate*>(delegate) release];
}
