// SPDX-License-Identifier: MIT
// What this program uses of macOS's Foundation, declared from general knowledge, to compile the Objective-C++
// source on another system. The run on GNUstep takes that system's own Foundation instead.
#pragma once

typedef struct objc_class* Class;
typedef struct objc_object {
  Class isa;
} * id;
typedef struct objc_selector* SEL;

#if defined(__OBJC_BOOL_IS_BOOL) && __OBJC_BOOL_IS_BOOL
typedef bool BOOL;
#else
typedef signed char BOOL;
#endif

#define YES __objc_yes
#define NO  __objc_no
#define nil __null

#if defined(__LP64__)
typedef long NSInteger;
typedef unsigned long NSUInteger;
#else
typedef int NSInteger;
typedef unsigned int NSUInteger;
#endif

@protocol NSObject
- (instancetype)retain;
- (oneway void)release;
- (instancetype)autorelease;
- (NSUInteger)retainCount;
@end

__attribute__((objc_root_class))
@interface NSObject<NSObject> {
  Class isa;
}
+ (instancetype)alloc;
- (instancetype)init;
- (void)dealloc;
@end

@interface NSAutoreleasePool : NSObject
- (void)drain;
@end

@interface NSException : NSObject
- (void)raise;
@end
