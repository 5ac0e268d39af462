// SPDX-License-Identifier: MIT
// Makes the program's guard and lets it go again, as main() does, and tells on standard error what happens in
// between: what the delegate is, what it answers, when the pool is drained.
#include <cstdio>
#include <cstdlib>

#import <ExceptionHandling/NSExceptionHandler.h>
#import <Foundation/Foundation.h>
#include <objc/runtime.h>

#include "driver/crash_guard.h"

// Foundation declares this one no more.
@interface NSObject (OlderDelegate)
- (BOOL)shouldDisplayException:(NSException*)exception;
@end

@interface Witness : NSObject
@end

@implementation Witness
- (void)dealloc {
  std::fprintf(stderr, "pool: drained\n");
  [super dealloc];
}
@end

namespace {

void tellClass(Class delegate) {
  std::fprintf(stderr, "class: %s of %s\n", class_getName(delegate),
               class_getName(class_getSuperclass(delegate)));
  unsigned count = 0;
  Ivar* variables = class_copyIvarList(delegate, &count);
  std::fprintf(stderr, "class: %u variables\n", count);
  std::free(variables);
  Method* methods = class_copyMethodList(delegate, &count);
  // GNU's compiler lists them from the last to the first.
  for (unsigned i = count; i > 0; --i) {
    std::fprintf(stderr, "class: -%s\n", sel_getName(method_getName(methods[i - 1])));
  }
  std::free(methods);
}

void tellAnswers(id delegate) {
  NSException* exception = [NSException exceptionWithName:@"Asked" reason:@"for its answer" userInfo:nil];
  NSExceptionHandler* handler = [NSExceptionHandler defaultExceptionHandler];
  std::fprintf(stderr, "answer: display %d\n", [delegate shouldDisplayException:exception]);
  std::fprintf(stderr, "answer: log %d\n",
               [delegate exceptionHandler:handler shouldLogException:exception mask:NSLogOtherExceptionMask]);
}

}  // namespace

int main() {
  {
    const CPPAutoReleasePool pool(7);
    [[[Witness alloc] init] autorelease];
    id delegate = [[NSExceptionHandler defaultExceptionHandler] delegate];
    tellClass([delegate class]);
    tellAnswers(delegate);
  }
  std::fprintf(stderr, "end\n");
  return 0;
}
