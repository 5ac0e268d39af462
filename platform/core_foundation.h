// SPDX-License-Identifier: MIT
// CoreFoundation, as far as this program uses it: strings, file URLs, bundles and the user's locale.
//
// On macOS this is the system's own header. Elsewhere the same names are declared here and implemented by
// the library platform_core_foundation, so that every caller is one portable source. A test may define all
// functions below by itself instead and is then linked without that library's objects.
//
// Ownership: a function with Create or Copy in its name gives the caller one reference, to be given back with
//            CFRelease. A function with Get in its name lends: the object lives as long as its owner.
// Failures:  null or false. A load that fails, at whichever step, leaves one line with the reason on
//            standard error: "vsttorture: ...".
// Threads:   counts are atomic; CFSTR and CFLocaleCopyCurrent may be used on any thread. One bundle is used
//            by one thread at a time.
#pragma once

#if defined(__APPLE__)

#include <CoreFoundation/CoreFoundation.h>

#else

#include <cstdint>

extern "C" {

// NOLINTBEGIN(bugprone-reserved-identifier,modernize-use-using): the system's own names, as it spells them
typedef unsigned char Boolean;
typedef std::uint32_t UInt32;
typedef long CFIndex;  ///< Counts and sizes in bytes.

typedef const void* CFTypeRef;  ///< Any of the objects below.
typedef const struct __CFAllocator* CFAllocatorRef;
typedef const struct __CFString* CFStringRef;
typedef const struct __CFURL* CFURLRef;
typedef const struct __CFLocale* CFLocaleRef;
typedef struct __CFBundle* CFBundleRef;

typedef UInt32 CFStringEncoding;
typedef CFIndex CFURLPathStyle;

constexpr CFAllocatorRef kCFAllocatorDefault = nullptr;  ///< The only allocator in use.
constexpr CFStringEncoding kCFStringEncodingASCII = 0x0600;
constexpr CFStringEncoding kCFStringEncodingUTF8 = 0x08000100;
constexpr CFURLPathStyle kCFURLPOSIXPathStyle = 0;

/// Takes one more reference to `object`, which must not be null. Returns `object`. Constants are left alone.
CFTypeRef CFRetain(CFTypeRef object);

/// Gives one reference to `object` back; the last one destroys it. Must not be null. Constants are left
/// alone.
void CFRelease(CFTypeRef object);

/// The number of references to `object`; the largest CFIndex for a constant.
CFIndex CFGetRetainCount(CFTypeRef object);

/// The constant string with the text of a literal; equal texts give the same object. It lives as long as the
/// process and is owned by nobody.
#define CFSTR(literal) __CFStringMakeConstantString("" literal "")

/// What CFSTR calls.
CFStringRef __CFStringMakeConstantString(const char* text);

/// Makes a string from zero-terminated `text`. Null, with a line on standard error, when `text` is not valid
/// in `encoding` (UTF-8 without overlong forms and surrogates, or ASCII) or `encoding` is another one.
CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, const char* text, CFStringEncoding encoding);

/// Copies `string` with a terminating zero to `buffer` of `bufferSize` bytes. False when it does not fit or
/// cannot be said in `encoding`; the buffer's content is then unspecified.
Boolean CFStringGetCString(CFStringRef string, char* buffer, CFIndex bufferSize, CFStringEncoding encoding);

/// Makes the URL of `path`; a relative path counts from the current directory of this moment, and slashes at
/// its end do not matter. `isDirectory` is a hint and not believed. Null, with a line on standard error, for
/// an empty path, a path style other than POSIX, or when there is no current directory.
CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path, CFURLPathStyle style,
                                       Boolean isDirectory);

/// Makes a bundle of the file or directory at `url`. Nothing is loaded yet. Null, with a line on standard
/// error, when nothing is there or when it is neither file nor directory.
CFBundleRef CFBundleCreate(CFAllocatorRef allocator, CFURLRef url);

/// Loads the bundle's code and runs its static constructors, whose exceptions pass through. True when the
/// code is loaded, also when it was loaded before. False, with a line on standard error, when the bundle has
/// no executable, or one that this program cannot load.
Boolean CFBundleLoadExecutable(CFBundleRef bundle);

/// The address of the function `name` in the bundle's own executable, libraries that this one needs left
/// aside. Null when there is none or the executable is not loaded.
void* CFBundleGetFunctionPointerForName(CFBundleRef bundle, CFStringRef name);

/// Unloads the bundle's code; pointers into it end here. Harmless when nothing is loaded. The last CFRelease
/// of a bundle does this too.
void CFBundleUnloadExecutable(CFBundleRef bundle);

/// The user's locale, with one reference for the caller. Never null.
CFLocaleRef CFLocaleCopyCurrent();

/// The locale's identifier, such as "de_CH"; owned by the locale.
CFStringRef CFLocaleGetIdentifier(CFLocaleRef locale);
// NOLINTEND(bugprone-reserved-identifier,modernize-use-using)

}  // extern "C"

#endif
