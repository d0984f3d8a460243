// Reference-counted strings and URLs with their encodings, under the host's spelling.
//
// Ownership: what a call with Create or Copy in its name returns belongs to the caller, who
// releases it with CFRelease; a call with Get in its name only lends. Null means that there is no
// such object, or not enough memory for it. No call throws. Immutable objects and all reference
// counts may be used from several threads at once; a mutable string belongs to one thread at a
// time.
//
// An object argument must not be null unless a call allows it. Every allocator argument is ignored:
// all objects come from the C++ heap.
#pragma once

#include <MacTypes.h>

struct FSRef;

extern "C" {

// --- Basic types ------------------------------------------------------------------------------

using CFIndex = long;                 // a count or a position
using CFOptionFlags = unsigned long;  // a set of bits
using CFTypeRef = const void*;        // any of the objects below
using CFAllocatorRef = const struct __CFAllocator*;
using CFDictionaryRef = const struct __CFDictionary*;
using CFStringRef = const struct __CFString*;   // an immutable string, or a mutable one only read
using CFMutableStringRef = struct __CFString*;  // a string that can change
using CFURLRef = const struct __CFURL*;         // an immutable URL

enum : CFIndex { kCFNotFound = -1 };

inline constexpr CFAllocatorRef kCFAllocatorDefault = nullptr;

struct CFRange {
  CFIndex location;  // of the first UTF-16 unit
  CFIndex length;    // in UTF-16 units
};
inline CFRange CFRangeMake(CFIndex location, CFIndex length) {
  return {location, length};
}

// --- Objects ----------------------------------------------------------------------------------

// Adds one reference and returns the object.
CFTypeRef CFRetain(CFTypeRef object);

// Releases one reference; releasing the last one destroys the object.
void CFRelease(CFTypeRef object);

// The number of references at this moment. For tests only.
CFIndex CFGetRetainCount(CFTypeRef object);

// Whether two strings have the same UTF-16 units, or two URLs the same text and the same base.
// Objects of different kinds are not equal.
Boolean CFEqual(CFTypeRef first, CFTypeRef second);

// --- Encodings --------------------------------------------------------------------------------

// The 8-bit or Unicode encoding of a run of bytes. The numbers are the published ones.
using CFStringEncoding = UInt32;
enum : CFStringEncoding {
  kCFStringEncodingMacRoman = 0,    // in its euro-sign revision: 0xDB is U+20AC, 0xF0 is U+F8FF
  kCFStringEncodingUTF16 = 0x0100,  // in the machine's byte order, no byte order mark
  kCFStringEncodingUnicode = kCFStringEncodingUTF16,
  kCFStringEncodingISOLatin1 = 0x0201,
  kCFStringEncodingASCII = 0x0600,
  kCFStringEncodingUTF8 = 0x08000100,
};
inline constexpr CFStringEncoding kCFStringEncodingInvalidId = 0xFFFFFFFF;

// The encoding of 8-bit text that does not tell its encoding: Mac Roman.
CFStringEncoding CFStringGetSystemEncoding();

// The encodings above, each once, terminated by kCFStringEncodingInvalidId. The list is static.
const CFStringEncoding* CFStringGetListOfAvailableEncodings();

// An upper bound, in bytes, of what `length` UTF-16 units need in an encoding. kCFNotFound for an
// encoding that is not available and for a bound beyond CFIndex.
CFIndex CFStringGetMaximumSizeForEncoding(CFIndex length, CFStringEncoding encoding);

// --- Strings: making --------------------------------------------------------------------------
//
// A string is a sequence of UTF-16 units. Unpaired surrogates are kept.

// A constant string, made on first use and never destroyed. REQUIRES: a literal of UTF-8 text. One
// of up to 7 UTF-16 units needs no memory; for a longer one, a process that runs out of memory
// terminates.
#define CFSTR(literal)                                                                       \
  ([]() -> CFStringRef {                                                                     \
    alignas(void*) static unsigned char sRoom[__kCFConstantStringSize];                      \
    static const CFStringRef sConstant = __CFStringMakeConstantString("" literal "", sRoom); \
    return sConstant;                                                                        \
  }())
enum { __kCFConstantStringSize = 56 };  // bytes
CFStringRef __CFStringMakeConstantString(const char* utf8, unsigned char* room);

// The string of `length` UTF-16 units.
CFStringRef CFStringCreateWithCharacters(CFAllocatorRef allocator, const UniChar* characters,
                                         CFIndex length);

// The string of NUL-terminated bytes; null when they are not valid in the encoding.
CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, const char* bytes,
                                      CFStringEncoding encoding);

// The string of a Pascal string; null when its bytes are not valid in the encoding.
CFStringRef CFStringCreateWithPascalString(CFAllocatorRef allocator, ConstStr255Param bytes,
                                           CFStringEncoding encoding);

// The string of a NUL-terminated file name or path as Linux stores it. Accepts any bytes: each byte
// that is not part of valid UTF-8 becomes the lone surrogate U+DC00 + byte. Nothing is normalised.
CFStringRef CFStringCreateWithFileSystemRepresentation(CFAllocatorRef allocator, const char* name);

// The format with each "%@" replaced by the next argument, a CFStringRef (null reads "(null)"), and
// each "%%" by "%". Null for any other directive and for an argument that is not a string.
// `options` is ignored.
CFStringRef CFStringCreateWithFormat(CFAllocatorRef allocator, CFDictionaryRef options,
                                     CFStringRef format, ...);

// An immutable string with the text that `string` has now.
CFStringRef CFStringCreateCopy(CFAllocatorRef allocator, CFStringRef string);

// The units of `range`. Null when the range does not lie within the string.
CFStringRef CFStringCreateWithSubstring(CFAllocatorRef allocator, CFStringRef string,
                                        CFRange range);

// A mutable string with the text that `string` has now. `capacity` is ignored: no length limit.
CFMutableStringRef CFStringCreateMutableCopy(CFAllocatorRef allocator, CFIndex capacity,
                                             CFStringRef string);

// --- Strings: changing ------------------------------------------------------------------------

// Appends the text of `appended`, which may be `string` itself. When memory runs out, the string
// keeps its text.
void CFStringAppend(CFMutableStringRef string, CFStringRef appended);

using CFStringCompareFlags = CFOptionFlags;

// Replaces every occurrence of `wanted` that lies within `range`, from front to back, without
// searching the replacements; returns the number of occurrences. Returns 0 and changes nothing when
// memory runs out, for an empty `wanted` and for a range outside the string. REQUIRES: no options.
CFIndex CFStringFindAndReplace(CFMutableStringRef string, CFStringRef wanted,
                               CFStringRef replacement, CFRange range,
                               CFStringCompareFlags options);

// --- Strings: reading -------------------------------------------------------------------------

// The number of UTF-16 units.
CFIndex CFStringGetLength(CFStringRef string);

// Copies the units of `range`. REQUIRES: the range lies within the string, and `buffer` has room.
void CFStringGetCharacters(CFStringRef string, CFRange range, UniChar* buffer);

// Whether the string begins with the units of `prefix`. Every string begins with the empty one.
Boolean CFStringHasPrefix(CFStringRef string, CFStringRef prefix);

// Whether the units of `wanted` occur within `range`; the first occurrence is stored in `found`
// unless that is null. An empty `wanted` is never found. REQUIRES: no options.
Boolean CFStringFindWithOptions(CFStringRef string, CFStringRef wanted, CFRange range,
                                CFStringCompareFlags options, CFRange* found);

// Converts the units of `range` from the front while whole characters fit into `capacity` bytes.
// Returns the number of units converted and stores the number of bytes in `used` (unless null). A
// character that the encoding lacks becomes `lossByte`; when that is 0, the conversion stops there.
// Mac Roman converts a letter and its combining mark together. With a null `buffer` it only counts,
// without limit. `isExternalRepresentation` is ignored. Returns 0 for an encoding that is not
// available and for a range outside the string.
CFIndex CFStringGetBytes(CFStringRef string, CFRange range, CFStringEncoding encoding,
                         UInt8 lossByte, Boolean isExternalRepresentation, UInt8* buffer,
                         CFIndex capacity, CFIndex* used);

// Writes the whole string as a Pascal string into `capacity` bytes, the length byte included.
// Returns false, with the buffer untouched, when the encoding lacks a character or the text does
// not fit (255 bytes at most).
Boolean CFStringGetPascalString(CFStringRef string, StringPtr buffer, CFIndex capacity,
                                CFStringEncoding encoding);

// Writes the string as the NUL-terminated file name or path that Linux stores. Returns false, with
// the buffer untouched, when that needs more than `capacity` bytes or the string is not a file
// name: it contains U+0000 or an unpaired surrogate other than U+DC80 to U+DCFF.
Boolean CFStringGetFileSystemRepresentation(CFStringRef string, char* buffer, CFIndex capacity);

// An upper bound, in bytes with the NUL, of what CFStringGetFileSystemRepresentation needs.
CFIndex CFStringGetMaximumSizeOfFileSystemRepresentation(CFStringRef string);

// --- URLs -------------------------------------------------------------------------------------
//
// A URL is an RFC 3986 reference. The URL of a relative path keeps the directory that was current
// at its creation as its base. A URL carries the folder mark when its path ends in "/" or its last
// component is "." or "..".

using CFURLPathStyle = CFIndex;
enum : CFURLPathStyle {
  kCFURLPOSIXPathStyle = 0,    // "/a/b", "a/b"
  kCFURLHFSPathStyle = 1,      // "Volume:a:b", ":a:b"; a folder ends in ":"
  kCFURLWindowsPathStyle = 2,  // "C:\a\b", "\a\b", "a\b"
};

// The URL of a path. With `isDirectory` it ends in "/"; without, trailing "/" are removed, except
// for "/" itself. Nothing is looked up except the mounted volumes, for the HFS style, and the
// current directory, for a relative path. Null for:
//
//   - an empty path;
//   - an unpaired surrogate that stands for no byte of a file name;
//   - an HFS path on a volume that is not mounted, one that climbs above a volume's root, or one
//     with a component "." or "..";
//   - a relative path when the current directory no longer exists.
CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path,
                                       CFURLPathStyle style, Boolean isDirectory);

// The URL with this text: exactly what the grammar of RFC 3986 accepts, absolute or relative, with
// any scheme. Null for anything else, for no bytes and for bytes that are not valid in the
// encoding. REQUIRES: `base` is null.
CFURLRef CFURLCreateWithBytes(CFAllocatorRef allocator, const UInt8* bytes, CFIndex length,
                              CFStringEncoding encoding, CFURLRef base);

// The path of a URL in a style, percent-decoded. A relative path stays relative. Only the HFS style
// marks folders ("/" and "\" are marked as they are). Null when the URL has no path, when its path
// contains an encoded NUL, and when the style cannot express it: an HFS path above a volume's root,
// a Windows path with "\" in a name or with a drive as its first folder.
CFStringRef CFURLCopyFileSystemPath(CFURLRef url, CFURLPathStyle style);

// The POSIX path of a URL. Stores in `isAbsolute`, unless null, whether it begins with "/".
CFStringRef CFURLCopyStrictPath(CFURLRef url, Boolean* isAbsolute);

// The last component, percent-decoded and without the folder mark: "/a/b/" → "b", "/" → "/". Null
// when the URL has no path or the component contains an encoded NUL.
CFStringRef CFURLCopyLastPathComponent(CFURLRef url);

// What follows the last "." of the last component. Null when there is no ".", when nothing follows
// it, and when the only "." is the first character.
CFStringRef CFURLCopyPathExtension(CFURLRef url);

// Whether the URL carries the folder mark.
Boolean CFURLHasDirectoryPath(CFURLRef url);

// The URL of the containing folder: "/a/b" → "/a/", "/a" → "/", "/" → "/", "a" → "./"; a last
// component "." or ".." gets "../" appended. Scheme, authority, query, fragment and base are kept.
// Null when the URL has no path.
CFURLRef CFURLCreateCopyDeletingLastPathComponent(CFAllocatorRef allocator, CFURLRef url);

// The URL with a component appended literally (with "/" in it, several), percent-encoded where the
// syntax requires it, with the folder mark as in CFURLCreateWithFileSystemPath. All else is kept.
// Null for a null component and for one with an unpaired surrogate that stands for no byte of a
// file name.
CFURLRef CFURLCreateCopyAppendingPathComponent(CFAllocatorRef allocator, CFURLRef url,
                                               CFStringRef component, Boolean isDirectory);

// --- URLs and items ---------------------------------------------------------------------------
//
// One thread at a time, together with the calls of <CoreServices/CoreServices.h>.

// Whether a file URL names an existing item; if so, its FSRef is written. A link as the last
// component is not followed, so a dangling link has an FSRef; all other links are followed.
Boolean CFURLGetFSRef(CFURLRef url, struct FSRef* item);

// The URL of an item's canonical absolute path, with the folder mark exactly for a folder. Null
// when the item is gone.
CFURLRef CFURLCreateFromFSRef(CFAllocatorRef allocator, const struct FSRef* item);
}
