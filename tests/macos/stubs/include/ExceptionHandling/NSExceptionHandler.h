// SPDX-License-Identifier: MIT
// macOS's handler of exceptions, as far as this program and its test double use it, declared from general
// knowledge. The bits of the mask are those that the delegate is told.
#pragma once

#import <Foundation/Foundation.h>

enum {
  NSLogUncaughtExceptionMask = 1 << 0,
  NSHandleUncaughtExceptionMask = 1 << 1,
  NSLogUncaughtSystemExceptionMask = 1 << 2,
  NSHandleUncaughtSystemExceptionMask = 1 << 3,
  NSLogUncaughtRuntimeErrorMask = 1 << 4,
  NSHandleUncaughtRuntimeErrorMask = 1 << 5,
  NSLogTopLevelExceptionMask = 1 << 6,
  NSHandleTopLevelExceptionMask = 1 << 7,
  NSLogOtherExceptionMask = 1 << 8,
  NSHandleOtherExceptionMask = 1 << 9
};

@interface NSExceptionHandler : NSObject
+ (NSExceptionHandler*)defaultExceptionHandler;
- (void)setExceptionHandlingMask:(NSUInteger)mask;
- (NSUInteger)exceptionHandlingMask;
- (void)setDelegate:(id)delegate;
- (id)delegate;
@end

@interface NSObject (NSExceptionHandlerDelegate)
- (BOOL)exceptionHandler:(NSExceptionHandler*)sender
      shouldLogException:(NSException*)exception
                    mask:(NSUInteger)mask;
- (BOOL)exceptionHandler:(NSExceptionHandler*)sender
    shouldHandleException:(NSException*)exception
                     mask:(NSUInteger)mask;
@end
