#include <CoreFoundation/CoreFoundation.h>

#include <algorithm>
#include <cstdarg>
#include <exception>
#include <limits>
#include <new>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "foundation/Encodings.h"
#include "foundation/NoThrow.h"
#include "foundation/PascalStrings.h"
#include "foundation/String.h"
#include "text/FileNameText.h"
#include "text/Utf16.h"

namespace {

using namespace tallowmere::foundation;

// UTF-8 takes at most 3 bytes for a UTF-16 unit, an escaped byte takes 1.
constexpr CFIndex kFileNameBytesPerUnit = 3;

CFIndex IndexOf(std::size_t count) {
  return static_cast<CFIndex>(count);
}

std::size_t SizeOf(CFIndex index) {
  return static_cast<std::size_t>(std::max<CFIndex>(index, 0));
}

// The units of a range. Nullopt when it does not lie within the string.
std::optional<std::u16string_view> Slice(CFStringRef string, CFRange range) {
  const std::u16string_view text = StringOf(string).Text();
  if (range.location < 0 || range.length < 0 || SizeOf(range.location) > text.size() ||
      SizeOf(range.length) > text.size() - SizeOf(range.location)) {
    return std::nullopt;
  }
  return text.substr(SizeOf(range.location), SizeOf(range.length));
}

// A new string decoded from bytes. Null when they are not valid in the encoding.
CFStringRef CreateDecoded(std::string_view bytes, CFStringEncoding id) {
  const Encoding* const encoding = FindEncoding(id);
  if (encoding == nullptr) return nullptr;
  auto text = encoding->decode(bytes);
  return text ? CreateString(*std::move(text)) : nullptr;
}

// The text that "%@" is replaced by. Nullopt for an object that is not a string.
std::optional<std::u16string_view> Described(CFTypeRef object) {
  if (object == nullptr) return u"(null)";
  const auto* const string = dynamic_cast<const String*>(static_cast<const Object*>(object));
  if (string == nullptr) return std::nullopt;
  return string->Text();
}

std::optional<std::u16string> Formatted(std::u16string_view format, va_list arguments) {
  std::u16string text;
  for (std::size_t i = 0; i < format.size(); ++i) {
    if (format[i] != u'%') {
      text.push_back(format[i]);
      continue;
    }
    ++i;
    const char16_t directive = i < format.size() ? format[i] : u'\0';
    if (directive == u'%') {
      text.push_back(u'%');
    } else if (directive == u'@') {
      const auto description = Described(va_arg(arguments, CFTypeRef));
      if (!description) return std::nullopt;
      text += *description;
    } else {
      return std::nullopt;
    }
  }
  return text;
}

// Stores the bytes of a name and a terminating NUL. Returns false, with the buffer untouched, when
// they do not fit or contain a NUL, which no name has.
template <typename Char>
bool StoreName(const std::basic_string<Char>& bytes, char* buffer, std::size_t capacity) {
  if (bytes.size() >= capacity || bytes.find(Char{}) != bytes.npos) return false;
  *std::copy(bytes.begin(), bytes.end(), buffer) = '\0';
  return true;
}

}  // namespace

// --- Encodings --------------------------------------------------------------------------------

CFStringEncoding CFStringGetSystemEncoding() {
  return kCFStringEncodingMacRoman;
}

const CFStringEncoding* CFStringGetListOfAvailableEncodings() {
  return EncodingList();
}

CFIndex CFStringGetMaximumSizeForEncoding(CFIndex length, CFStringEncoding encoding) {
  const Encoding* const found = FindEncoding(encoding);
  if (found == nullptr) return kCFNotFound;
  const CFIndex bytesPerUnit = IndexOf(found->bytesPerUnit);
  if (length > std::numeric_limits<CFIndex>::max() / bytesPerUnit) return kCFNotFound;
  return length * bytesPerUnit;
}

// --- Making -----------------------------------------------------------------------------------

// A short text lies within the string object itself, so it needs no memory.
CFStringRef __CFStringMakeConstantString(const char* utf8, unsigned char* room) {
  static_assert(sizeof(String) <= __kCFConstantStringSize && alignof(String) <= alignof(void*));
  std::optional<std::u16string> text;
  try {
    text = FindEncoding(kCFStringEncodingUTF8)->decode(utf8);
  } catch (const std::bad_alloc&) {
    std::terminate();
  }
  if (!text) std::terminate();
  return ReferenceTo(new (room) String(*std::move(text), false));
}

CFStringRef CFStringCreateWithCharacters(CFAllocatorRef, const UniChar* characters,
                                         CFIndex length) {
  if (length < 0) return nullptr;
  return OrZero([&] { return CreateString({characters, characters + length}); });
}

CFStringRef CFStringCreateWithCString(CFAllocatorRef, const char* bytes,
                                      CFStringEncoding encoding) {
  return OrZero([&] { return CreateDecoded(bytes, encoding); });
}

CFStringRef CFStringCreateWithPascalString(CFAllocatorRef, ConstStr255Param bytes,
                                           CFStringEncoding encoding) {
  return OrZero([&] {
    return CreateDecoded({reinterpret_cast<const char*>(bytes + 1), bytes[0]}, encoding);
  });
}

CFStringRef CFStringCreateWithFileSystemRepresentation(CFAllocatorRef, const char* name) {
  return OrZero([&] { return CreateString(tallowmere::text::TextOfFileName(name)); });
}

CFStringRef CFStringCreateWithFormat(CFAllocatorRef, CFDictionaryRef, CFStringRef format, ...) {
  va_list arguments;
  va_start(arguments, format);
  const CFStringRef string = OrZero([&]() -> CFStringRef {
    auto text = Formatted(StringOf(format).Text(), arguments);
    return text ? CreateString(*std::move(text)) : nullptr;
  });
  va_end(arguments);
  return string;
}

CFStringRef CFStringCreateCopy(CFAllocatorRef, CFStringRef string) {
  return OrZero([&] { return CreateReference(CopyOf(StringOf(string))); });
}

CFStringRef CFStringCreateWithSubstring(CFAllocatorRef, CFStringRef string, CFRange range) {
  const auto text = Slice(string, range);
  if (!text) return nullptr;
  return OrZero([&] { return CreateString(std::u16string(*text)); });
}

CFMutableStringRef CFStringCreateMutableCopy(CFAllocatorRef, CFIndex, CFStringRef string) {
  return OrZero([&] { return CreateMutableString(StringOf(string).Text()); });
}

// --- Changing ---------------------------------------------------------------------------------

void CFStringAppend(CFMutableStringRef string, CFStringRef appended) {
  OrZero([&] { StringOf(string).Text() += StringOf(appended).Text(); });
}

CFIndex CFStringFindAndReplace(CFMutableStringRef string, CFStringRef wanted,
                               CFStringRef replacement, CFRange range, CFStringCompareFlags) {
  const auto slice = Slice(string, range);
  const std::u16string& pattern = StringOf(wanted).Text();
  if (!slice || pattern.empty()) return 0;
  auto at = slice->find(pattern);
  if (at == slice->npos) return 0;
  return OrZero([&]() -> CFIndex {
    std::u16string& text = StringOf(string).Text();
    std::u16string changed(text, 0, SizeOf(range.location));
    CFIndex count = 0;
    std::size_t copied = 0;
    for (; at != slice->npos; at = slice->find(pattern, copied)) {
      changed += slice->substr(copied, at - copied);
      changed += StringOf(replacement).Text();
      copied = at + pattern.size();
      ++count;
    }
    changed += slice->substr(copied);
    changed.append(text, SizeOf(range.location) + slice->size());
    text = std::move(changed);
    return count;
  });
}

// --- Reading ----------------------------------------------------------------------------------

CFIndex CFStringGetLength(CFStringRef string) {
  return IndexOf(StringOf(string).Text().size());
}

void CFStringGetCharacters(CFStringRef string, CFRange range, UniChar* buffer) {
  if (const auto text = Slice(string, range)) std::copy(text->begin(), text->end(), buffer);
}

Boolean CFStringHasPrefix(CFStringRef string, CFStringRef prefix) {
  return StringOf(string).Text().starts_with(StringOf(prefix).Text());
}

Boolean CFStringFindWithOptions(CFStringRef string, CFStringRef wanted, CFRange range,
                                CFStringCompareFlags, CFRange* found) {
  const auto slice = Slice(string, range);
  const std::u16string& pattern = StringOf(wanted).Text();
  if (!slice || pattern.empty()) return false;
  const auto at = slice->find(pattern);
  if (at == slice->npos) return false;
  if (found != nullptr) *found = {range.location + IndexOf(at), IndexOf(pattern.size())};
  return true;
}

CFIndex CFStringGetBytes(CFStringRef string, CFRange range, CFStringEncoding encoding,
                         UInt8 lossByte, Boolean, UInt8* buffer, CFIndex capacity, CFIndex* used) {
  const auto text = Slice(string, range);
  const Encoding* const found = FindEncoding(encoding);
  EncodedLength done{0, 0};
  if (text && found != nullptr) {
    const std::size_t room =
        buffer == nullptr ? std::numeric_limits<std::size_t>::max() : SizeOf(capacity);
    done = Encode(*text, *found, lossByte, buffer, room);
  }
  if (used != nullptr) *used = IndexOf(done.bytes);
  return IndexOf(done.units);
}

Boolean CFStringGetPascalString(CFStringRef string, StringPtr buffer, CFIndex capacity,
                                CFStringEncoding encoding) {
  const Encoding* const found = FindEncoding(encoding);
  if (found == nullptr || capacity < 1) return false;
  const std::u16string& text = StringOf(string).Text();
  const std::size_t room = std::min(SizeOf(capacity) - 1, kLongestPascalString);
  UInt8 encoded[kLongestPascalString];
  const EncodedLength done = Encode(text, *found, 0, encoded, room);
  if (done.units < text.size()) return false;
  std::copy_n(encoded, done.bytes, buffer + 1);
  buffer[0] = static_cast<unsigned char>(done.bytes);
  return true;
}

Boolean CFStringGetFileSystemRepresentation(CFStringRef string, char* buffer, CFIndex capacity) {
  const std::u16string& text = StringOf(string).Text();
  if (tallowmere::text::IsAllAscii(std::u16string_view(text)))
    return StoreName(text, buffer, SizeOf(capacity));
  return OrZero([&] {
    const auto name = tallowmere::text::FileNameOfText(text);
    return name && StoreName(*name, buffer, SizeOf(capacity));
  });
}

CFIndex CFStringGetMaximumSizeOfFileSystemRepresentation(CFStringRef string) {
  return CFStringGetLength(string) * kFileNameBytesPerUnit + 1;
}
