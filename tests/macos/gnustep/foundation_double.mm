// SPDX-License-Identifier: MIT
#include <vector>

#import <Foundation/Foundation.h>

namespace {

std::vector<id>* objectsInPool = nullptr;

NSUInteger& referencesOf(id object) { return *static_cast<NSUInteger*>(object_getIndexedIvars(object)); }

}  // namespace

@implementation NSObject

+ (id)alloc {
  id object = class_createInstance(self, sizeof(NSUInteger));
  referencesOf(object) = 1;
  return object;
}

+ (Class)class {
  return self;
}

- (id)init {
  return self;
}

- (void)dealloc {
  object_dispose(self);
}

- (Class)class {
  return object_getClass(self);
}

- (id)retain {
  ++referencesOf(self);
  return self;
}

- (void)release {
  if (--referencesOf(self) == 0) [self dealloc];
}

- (id)autorelease {
  objectsInPool->push_back(self);
  return self;
}

- (BOOL)respondsToSelector:(SEL)selector {
  return class_respondsToSelector(object_getClass(self), selector);
}

@end

@implementation NSString

- (const char*)UTF8String {
  return "";
}

@end

@implementation NSConstantString

- (const char*)UTF8String {
  return bytes;
}

@end

@implementation NSAutoreleasePool

- (id)init {
  objectsInPool = new std::vector<id>;
  return self;
}

- (void)dealloc {
  for (id object : *objectsInPool) [object release];
  delete objectsInPool;
  objectsInPool = nullptr;
  [super dealloc];
}

@end

@implementation NSException

+ (NSException*)exceptionWithName:(NSString*)itsName reason:(NSString*)reason userInfo:(id)userInfo {
  (void)reason;
  (void)userInfo;
  NSException* exception = [[[self alloc] init] autorelease];
  exception->name = itsName;
  return exception;
}

+ (void)raise:(NSString*)itsName format:(NSString*)format, ... {
  @throw [self exceptionWithName:itsName reason:format userInfo:nil];
}

- (NSString*)name {
  return name;
}

@end
