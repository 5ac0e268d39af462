// SPDX-License-Identifier: MIT
// A program may define CoreFoundation by itself. This one does, on counters, and links the library as well:
// it would not link if the library's own functions came along.
#include <string>

#include <gtest/gtest.h>

#include "platform/core_foundation.h"
#include "platform/entry_point_name.h"

namespace {

// Any address will do for an object that nobody looks into.
const int anObject = 0;
std::string constantAskedFor;

template <typename Reference>
Reference reference() {
  return reinterpret_cast<Reference>(const_cast<int*>(&anObject));
}

}  // namespace

CFTypeRef CFRetain(CFTypeRef object) { return object; }
void CFRelease(CFTypeRef) {}
CFIndex CFGetRetainCount(CFTypeRef) { return 5; }
CFStringRef __CFStringMakeConstantString(const char* text) {
  constantAskedFor = text;
  return reference<CFStringRef>();
}
CFStringRef CFStringCreateWithCString(CFAllocatorRef, const char*, CFStringEncoding) { return nullptr; }
Boolean CFStringGetCString(CFStringRef, char*, CFIndex, CFStringEncoding) { return 0; }
CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef, CFStringRef, CFURLPathStyle, Boolean) {
  return nullptr;
}
CFBundleRef CFBundleCreate(CFAllocatorRef, CFURLRef) { return nullptr; }
Boolean CFBundleLoadExecutable(CFBundleRef) { return 1; }
void* CFBundleGetFunctionPointerForName(CFBundleRef, CFStringRef) { return nullptr; }
void CFBundleUnloadExecutable(CFBundleRef) {}
CFLocaleRef CFLocaleCopyCurrent() { return nullptr; }
CFStringRef CFLocaleGetIdentifier(CFLocaleRef) { return nullptr; }

namespace {

TEST(CoreFoundationDouble, TakesTheLibrarysPlace) {
  EXPECT_EQ(systemEntryPointName(), reference<CFStringRef>());
  EXPECT_EQ(constantAskedFor, "main");
  EXPECT_EQ(CFGetRetainCount(&anObject), 5);
  EXPECT_TRUE(CFBundleLoadExecutable(nullptr));
}

}  // namespace
