#include "names/HFSNames.h"

#include <algorithm>
#include <charconv>

#include "foundation/ColonsAndSlashes.h"
#include "names/NodeIDs.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"
#include "text/Utf16.h"

namespace tallowmere::names {
namespace {

constexpr char kMark = '#';
constexpr std::size_t kLongestShortName = 31;
constexpr std::size_t kLongestKeptExtension = 5;  // without its dot

// ASCII names, as most are, have the same letters in every form.
bool IsAsciiName(std::string_view name) {
  return std::all_of(name.begin(), name.end(),
                     [](char letter) { return text::IsAscii(static_cast<unsigned char>(letter)); });
}

std::u16string ExchangedText(std::string_view linuxName) {
  return foundation::ExchangeColonsAndSlashes(text::TextOfFileName(linuxName));
}

// The extension with its dot, ".aif" of "a.aif"; empty when there is none to keep.
std::string KeptExtension(std::u16string_view text) {
  const std::size_t dot = text.rfind(u'.');
  if (dot == std::u16string_view::npos || dot == 0) return {};
  const auto extension = text::EncodeMacRoman(text.substr(dot + 1));
  if (!extension || extension->empty() || extension->size() > kLongestKeptExtension) return {};
  return "." + *extension;
}

std::string EncodeWithQuestionMarks(std::u16string_view text, std::size_t limit) {
  std::string bytes;
  while (!text.empty() && bytes.size() < limit) {
    const text::MacRomanStep step = text::NextMacRoman(text);
    bytes.push_back(static_cast<char>(step.byte.value_or('?')));
    text.remove_prefix(step.units);
  }
  return bytes;
}

std::string CapitalHexadecimal(std::uint32_t number) {
  char digits[8];
  const auto end = std::to_chars(digits, digits + sizeof digits, number, 16).ptr;
  std::string text(digits, end);
  for (char& digit : text) {
    if (digit >= 'a') digit = static_cast<char>(digit - 'a' + 'A');
  }
  return text;
}

// Reads a short name without its extension.
std::optional<ShortNameParts> ReadShortStem(std::string_view stem) {
  const std::size_t mark = stem.rfind(kMark);
  if (mark == std::string_view::npos) return std::nullopt;
  const std::string_view number = stem.substr(mark + 1);
  std::uint32_t id = 0;
  const auto [end, error] = std::from_chars(number.data(), number.data() + number.size(), id, 16);
  if (error != std::errc{} || CapitalHexadecimal(id) != number) return std::nullopt;
  std::size_t marks = 1;
  if (!CanBeNodeID(id)) return std::nullopt;
  while (marks < kMostMarks && mark >= marks && stem[mark - marks] == kMark) ++marks;
  return ShortNameParts{id, marks};
}

}  // namespace

std::optional<std::string> PlainHFSName(std::string_view linuxName, std::size_t limit) {
  auto name = IsAsciiName(linuxName) ? foundation::ExchangeColonsAndSlashes(std::string(linuxName))
                                     : text::EncodeMacRoman(ExchangedText(linuxName));
  if (name && name->size() > limit) return std::nullopt;
  return name;
}

std::optional<std::string> UnmistakableHFSName(std::string_view linuxName, std::size_t limit) {
  // Most names are the same in both.
  const bool isSame = IsAsciiName(linuxName) && linuxName.find(':') == std::string_view::npos;
  if (isSame && linuxName.size() <= limit) return std::string(linuxName);
  auto name = PlainHFSName(linuxName, limit);
  if (name && SpellHFSName(*name).precomposed != linuxName) name.reset();
  return name;
}

std::string ShortHFSName(std::string_view linuxName, std::uint32_t nodeID, std::size_t marks) {
  const std::u16string text = ExchangedText(linuxName);
  const std::string extension = KeptExtension(text);
  const std::string tail = std::string(marks, kMark) + CapitalHexadecimal(nodeID) + extension;
  const std::u16string_view stem(text.data(), extension.empty() ? text.size() : text.rfind(u'.'));
  return EncodeWithQuestionMarks(stem, kLongestShortName - tail.size()) + tail;
}

bool CanBeShortForm(std::string_view name) {
  return name.size() == kLongestShortName || name.find('?') != std::string_view::npos;
}

std::vector<ShortNameParts> ReadShortHFSName(std::string_view name) {
  std::vector<ShortNameParts> readings;
  if (name.size() > kLongestShortName) return readings;
  if (const auto parts = ReadShortStem(name)) readings.push_back(*parts);
  const std::size_t dot = name.rfind('.');
  if (dot == std::string_view::npos) return readings;
  if (const auto parts = ReadShortStem(name.substr(0, dot))) readings.push_back(*parts);
  return readings;
}

bool CanBeLinuxName(std::string_view name) {
  const std::string_view impossible("/\0", 2);
  return !name.empty() && name != "." && name != ".." &&
         name.find_first_of(impossible) == std::string_view::npos;
}

SpelledNames SpellHFSName(std::string_view name) {
  SpelledNames names;
  if (IsAsciiName(name)) {
    names.precomposed = foundation::ExchangeColonsAndSlashes(std::string(name));
    return CanBeLinuxName(names.precomposed) ? names : SpelledNames();
  }
  const std::u16string text = foundation::ExchangeColonsAndSlashes(text::DecodeMacRoman(name));
  const std::u16string decomposed = text::DecomposeMacRoman(text);
  names.precomposed = text::FileNameOfText(text).value_or("");
  if (!CanBeLinuxName(names.precomposed)) return {};
  if (decomposed != text) names.decomposed = text::FileNameOfText(decomposed).value_or("");
  return names;
}

std::string NameInBytes(std::string_view name) {
  std::string bytes = foundation::ExchangeColonsAndSlashes(std::string(name));
  const std::u16string text = text::TextOfFileName(bytes);
  const bool isUtf8 = std::none_of(text.begin(), text.end(), text::IsEscapedByte);
  return isUtf8 || !CanBeLinuxName(bytes) ? std::string() : bytes;
}

bool HadShortForm(std::string_view linuxName) {
  return EncodeWithQuestionMarks(ExchangedText(linuxName), kLongestShortName + 1).size() >
         kLongestShortName;
}

}  // namespace tallowmere::names
