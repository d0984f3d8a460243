#include "files/HFSNames.h"

#include <charconv>

#include "foundation/FileNameText.h"
#include "foundation/MacRoman.h"

namespace tallowmere::files {
namespace {

constexpr std::size_t kLongestShortName = 31;
constexpr std::size_t kLongestKeptExtension = 5;  // without its dot

std::u16string ExchangedText(std::string_view linuxName) {
  std::u16string text = foundation::TextOfFileName(linuxName);
  for (char16_t& unit : text) {
    if (unit == u':') {
      unit = u'/';
    } else if (unit == u'/') {
      unit = u':';
    }
  }
  return text;
}

// ".aif" of "a.aif", or nothing.
std::string KeptExtension(std::u16string_view text) {
  const std::size_t dot = text.rfind(u'.');
  if (dot == std::u16string_view::npos || dot == 0) return {};
  const auto extension = foundation::EncodeMacRoman(text.substr(dot + 1));
  if (!extension || extension->empty() || extension->size() > kLongestKeptExtension) return {};
  return "." + *extension;
}

std::string EncodeWithQuestionMarks(std::u16string_view text, std::size_t limit) {
  std::string bytes;
  while (!text.empty() && bytes.size() < limit) {
    const foundation::MacRomanStep step = foundation::NextMacRoman(text);
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

}  // namespace

std::optional<std::string> PlainHFSName(std::string_view linuxName, std::size_t limit) {
  auto name = foundation::EncodeMacRoman(ExchangedText(linuxName));
  if (name && name->size() > limit) return std::nullopt;
  return name;
}

std::string ShortHFSName(std::string_view linuxName, std::uint32_t nodeID) {
  const std::u16string text = ExchangedText(linuxName);
  const std::string extension = KeptExtension(text);
  const std::string tail = "#" + CapitalHexadecimal(nodeID) + extension;
  const std::u16string_view stem(text.data(), extension.empty() ? text.size() : text.rfind(u'.'));
  return EncodeWithQuestionMarks(stem, kLongestShortName - tail.size()) + tail;
}

}  // namespace tallowmere::files
