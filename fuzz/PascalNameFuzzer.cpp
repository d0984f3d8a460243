// Converts names between Linux, text and Pascal strings in both directions, with arbitrary bytes as
// each of them.
#include <LegacyHFSBridge.h>
#include <tallowmere/Types.h>

#include <algorithm>
#include <string>

#include "CFOwned.h"
#include "foundation/ColonsAndSlashes.h"
#include "fuzz/Check.h"
#include "names/HFSNames.h"
#include "names/NodeIDs.h"
#include "names/PascalNames.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"

namespace tallowmere::fuzz {
namespace {

using names::kLongestSpecName;
using names::kLongestStr255Name;

// Arbitrary bytes are text, and also Mac Roman text, and survive the round trip.
void CheckText(std::string_view bytes) {
  Check(text::FileNameOfText(text::TextOfFileName(bytes)) == bytes);
  const std::u16string text = text::DecodeMacRoman(bytes);
  Check(text::EncodeMacRoman(text) == bytes);
  Check(text::EncodeMacRoman(text::DecomposeMacRoman(text)) == bytes);
  Check(HFSNameOfUtf8(Utf8OfHFSName(bytes)) == bytes);
}

// A Linux name's HFS names are within their limits, and the plain one belongs to a Linux name that
// it can stand for.
void CheckLinuxName(std::string_view name, std::uint32_t id, std::size_t marks) {
  for (const std::size_t limit : {kLongestSpecName, kLongestStr255Name}) {
    const auto plain = names::PlainHFSName(name, limit);
    if (!plain) continue;
    Check(plain->size() <= limit);
    const auto spelled = names::SpellHFSName(*plain);
    Check(spelled.precomposed.empty() == !names::CanBeLinuxName(name));
    if (!spelled.precomposed.empty()) {
      Check(names::PlainHFSName(spelled.precomposed, limit) == plain);
    }
  }
  if (!names::CanBeNodeID(id)) return;
  const std::string shortName = names::ShortHFSName(name, id, marks);
  Check(shortName.size() <= 31);
  const auto readings = names::ReadShortHFSName(shortName);
  Check(std::any_of(readings.begin(), readings.end(), [&](const names::ShortNameParts& parts) {
    return parts.nodeID == id && parts.marks >= marks;
  }));
}

// Each name that an HFS name can stand for has that HFS name.
void CheckHFSName(std::string_view name) {
  const auto spelled = names::SpellHFSName(name);
  if (spelled.precomposed.empty()) return;
  Check(names::CanBeLinuxName(spelled.precomposed));
  Check(names::PlainHFSName(spelled.precomposed, name.size()) == name);
  if (spelled.decomposed.empty()) return;
  Check(spelled.decomposed != spelled.precomposed);
  Check(names::PlainHFSName(spelled.decomposed, name.size()) == name);
}

// Converts C strings to Pascal strings and back.
void CheckPascalStrings(std::string_view bytes) {
  const std::string text(bytes.substr(0, bytes.find('\0')));
  Str255 pascal;
  c2pstrcpy(pascal, text.c_str());
  const auto kept = std::string_view(text).substr(0, kLongestStr255Name);
  Check(names::TextOfPascal(pascal) == kept);
  char back[kLongestStr255Name + 1];
  p2cstrcpy(back, pascal);
  Check(back == kept);
  P2CStr(pascal);
  Check(reinterpret_cast<const char*>(pascal) == kept);
}

// Converts a string to a Pascal name in a buffer of this size, and back. Each ':' of the string
// becomes a '/', and every '/' is turned back into ':'.
void CheckBridge(std::string_view bytes, SInt32 bufferSize) {
  const std::u16string text = text::TextOfFileName(bytes);
  const CFOwned<CFStringRef> string(CFStringCreateWithCharacters(
      kCFAllocatorDefault, reinterpret_cast<const UniChar*>(text.data()),
      static_cast<CFIndex>(text.size())));
  Check(string.Get() != nullptr);
  Str255 name;
  std::fill(std::begin(name), std::end(name), 0xAA);
  const bool isWhole = GetPascalStringFromCFString(string.Get(), name, bufferSize);
  Check(std::all_of(name + bufferSize, std::end(name), [](int byte) { return byte == 0xAA; }));
  if (bufferSize < 1) return;
  Check(name[0] < bufferSize);
  if (isWhole) {
    Check(foundation::ExchangeColonsAndSlashes(std::string(names::TextOfPascal(name))) ==
          text::EncodeMacRoman(text));
  }
  const CFOwned<CFMutableStringRef> back(CreateCFStringFromPascalString(name));
  Check(back.Get() != nullptr);
  std::u16string expected = text::DecodeMacRoman(names::TextOfPascal(name));
  std::replace(expected.begin(), expected.end(), u'/', u':');
  const CFIndex length = CFStringGetLength(back.Get());
  Check(static_cast<std::size_t>(length) == expected.size());
  UniChar units[kLongestStr255Name];
  CFStringGetCharacters(back.Get(), CFRangeMake(0, length), units);
  Check(std::equal(expected.begin(), expected.end(), units));
}

// Repeats short inputs so that they reach the longest names.
constexpr unsigned kMostTimes = 4;

std::string Repeated(std::string_view bytes, unsigned times) {
  std::string repeated;
  for (unsigned i = 0; i < times; ++i) repeated += bytes;
  return repeated;
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: the direction, how many times the name is repeated, a buffer's size, the number of
// marks, a node id, then the name.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  Input input(data, size);
  const unsigned way = input.TakeByte() % 5;
  const unsigned times = 1 + input.TakeByte() % kMostTimes;
  const auto bufferSize = static_cast<SInt32>(input.TakeByte());
  const std::size_t marks = 1 + input.TakeByte() % tallowmere::names::kMostMarks;
  const std::uint32_t id = input.TakeTwoBytes() | input.TakeTwoBytes() << 16;
  const std::string repeated = times > 1 ? Repeated(input.Rest(), times) : "";
  const std::string_view name = times > 1 ? repeated : input.Rest();
  switch (way) {
    case 0:
      CheckText(name);
      break;
    case 1:
      CheckLinuxName(name, id, marks);
      break;
    case 2:
      CheckHFSName(name);
      break;
    case 3:
      CheckPascalStrings(name);
      break;
    default:
      CheckBridge(name, bufferSize);
  }
  return 0;
}
