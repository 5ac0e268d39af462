// SPDX-License-Identifier: MIT
// A double of Foundation for 32-bit x86, for which Debian's 64-bit packages hold a runtime of Objective-C but no
// GNUstep: the few classes that the program and its checks use, and of those what they use.
#pragma once

#include <objc/objc.h>
#include <objc/runtime.h>

typedef unsigned int NSUInteger;

/// Counts its references behind its fields.
__attribute__((objc_root_class))
@interface NSObject {
  Class isa;
}
+ (id)alloc;
+ (Class)class;
- (id)init;
- (void)dealloc;
- (Class)class;
- (id)retain;
- (void)release;
- (id)autorelease;
- (BOOL)respondsToSelector:(SEL)selector;
@end

@interface NSString : NSObject
- (const char*)UTF8String;
@end

/// What the compiler makes of @"text".
@interface NSConstantString : NSString {
  const char* bytes;
  unsigned int length;
}
@end

/// Objects that are autoreleased go into the pool that was made last. Pools are not nested.
@interface NSAutoreleasePool : NSObject
@end

@interface NSException : NSObject {
  NSString* name;
}
+ (NSException*)exceptionWithName:(NSString*)name reason:(NSString*)reason userInfo:(id)userInfo;
+ (void)raise:(NSString*)name format:(NSString*)format, ...;
- (NSString*)name;
@end
