// SPDX-License-Identifier: MIT
// What this program uses of macOS's CoreFoundation, declared from general knowledge, to compile the macOS
// sources on another system. A test, not a header to build with: it holds nothing else.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

typedef unsigned char Boolean;
#if defined(__LP64__)
typedef unsigned int UInt32;
#else
typedef unsigned long UInt32;
#endif
typedef long CFIndex;

typedef const void* CFTypeRef;
typedef const struct __CFAllocator* CFAllocatorRef;
typedef const struct __CFString* CFStringRef;
typedef const struct __CFURL* CFURLRef;
typedef const struct __CFLocale* CFLocaleRef;
typedef struct __CFBundle* CFBundleRef;

typedef UInt32 CFStringEncoding;
enum { kCFStringEncodingASCII = 0x0600, kCFStringEncodingUTF8 = 0x08000100 };

// An enumeration of its own, as CF_ENUM makes it: no plain integer converts to it.
typedef enum : CFIndex {
  kCFURLPOSIXPathStyle = 0,
  kCFURLHFSPathStyle,
  kCFURLWindowsPathStyle
} CFURLPathStyle;

extern const CFAllocatorRef kCFAllocatorDefault;

CFTypeRef CFRetain(CFTypeRef object);
void CFRelease(CFTypeRef object);
CFIndex CFGetRetainCount(CFTypeRef object);

#define CFSTR(literal) ((CFStringRef)__builtin___CFStringMakeConstantString("" literal ""))

CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, const char* text, CFStringEncoding encoding);
Boolean CFStringGetCString(CFStringRef string, char* buffer, CFIndex bufferSize, CFStringEncoding encoding);
CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path, CFURLPathStyle style,
                                       Boolean isDirectory);
CFBundleRef CFBundleCreate(CFAllocatorRef allocator, CFURLRef url);
Boolean CFBundleLoadExecutable(CFBundleRef bundle);
void* CFBundleGetFunctionPointerForName(CFBundleRef bundle, CFStringRef name);
void CFBundleUnloadExecutable(CFBundleRef bundle);
CFLocaleRef CFLocaleCopyCurrent(void);
CFStringRef CFLocaleGetIdentifier(CFLocaleRef locale);

#ifdef __cplusplus
}
#endif
