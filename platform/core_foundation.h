// SPDX-License-Identifier: MIT
// CoreFoundation, as far as this program uses it: strings, file URLs, bundles and the user's locale.
//
// On macOS this is the system's own header. Elsewhere the same names are declared here and implemented by
// the library platform_core_foundation, so that every caller is one portable source. A test may define all
// functions below by itself instead and is then linked without that library's objects.
//
// Ownership: what a function with Create or Copy in its name returns belongs to the caller, who ends that
//            with CFRelease. What a function with Get in its name returns lives as long as the object that
//            was asked. Nothing here takes a further reference, so each object has one owner.
// Failures:  null or false. A load that fails, at whichever step, leaves one line with the reason on
//            standard error: "vsttorture: ...".
// Threads:   CFSTR and CFLocaleCopyCurrent may be used on any thread. Any other object is used by one thread
//            at a time.
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

/// Destroys what `reference` refers to; it must not be null. Leaves constants alone.
void CFRelease(CFTypeRef reference);

/// The constant string with the text of a literal; equal texts give the same object. It has no owner and is
/// never destroyed.
#define CFSTR(literal) __CFStringMakeConstantString("" literal "")

/// What CFSTR calls; not called by name.
CFStringRef __CFStringMakeConstantString(const char* text);

/// Makes a string from zero-terminated `text`. Null, with a line on standard error, when `text` is not valid
/// in `encoding` (UTF-8 without overlong forms and surrogates, or ASCII) or `encoding` is another one.
CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, const char* text, CFStringEncoding encoding);

/// Copies `string` with a terminating zero to `buffer` of `bufferSize` bytes. False when it does not fit or
/// has characters that `encoding` lacks; the buffer's content is then unspecified.
Boolean CFStringGetCString(CFStringRef string, char* buffer, CFIndex bufferSize, CFStringEncoding encoding);

/// Makes the URL of `path`. A relative path is made absolute with the directory that is current now; slashes
/// at the end of the path are ignored, and so is `isDirectory`. Null, with a line on standard error, for an
/// empty path, a path style other than POSIX, or when there is no current directory.
CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path, CFURLPathStyle style,
                                       Boolean isDirectory);

/// Makes a bundle of the file or directory at `url`. Nothing is loaded yet. Null, with a line on standard
/// error, when nothing is there or when it is neither file nor directory.
CFBundleRef CFBundleCreate(CFAllocatorRef allocator, CFURLRef url);

/// Loads the bundle's code and runs its static constructors; what they throw reaches the caller. True when
/// the code is loaded, also when it was loaded before. False, with a line on standard error, when the bundle
/// has no executable, or one that this program cannot load.
///
/// A regular file is its own executable. In a folder ProM.vst, the regular files ProM, ProM.so and libProM.so
/// are looked for in Contents/x86_64-linux (or the name of another architecture), Contents/Linux, Contents
/// and the folder itself, in this order; the first one found is the executable.
Boolean CFBundleLoadExecutable(CFBundleRef bundle);

/// The address of the function `name` in the bundle's own executable; the libraries that it needs are not
/// searched. Null when there is none or the executable is not loaded.
void* CFBundleGetFunctionPointerForName(CFBundleRef bundle, CFStringRef name);

/// Unloads the bundle's code; pointers into it become invalid. Does nothing when none is loaded. CFRelease of
/// a bundle does this too.
void CFBundleUnloadExecutable(CFBundleRef bundle);

/// The user's locale. Never null.
CFLocaleRef CFLocaleCopyCurrent();

/// The locale's identifier, such as "de_CH"; owned by the locale. On Linux it comes from the first of LC_ALL,
/// LC_MESSAGES and LANG that is set and not empty, codeset and modifier cut off; it is "en_US_POSIX" for "C",
/// "POSIX", what is not UTF-8, and when none is set.
CFStringRef CFLocaleGetIdentifier(CFLocaleRef locale);
// NOLINTEND(bugprone-reserved-identifier,modernize-use-using)

}  // extern "C"

#endif
