#include "cli/Text.h"

#include <algorithm>
#include <climits>

#include "text/FileNameText.h"
#include "text/Utf16.h"

namespace tallowmere::cli {
namespace {

constexpr char16_t kReplacement = 0xFFFD;
constexpr std::size_t kPartOfAGiant = 100;  // bytes

// C0 and C1 control characters and DEL, each of one UTF-16 unit.
bool IsControl(char16_t unit) {
  return unit < 0x20 || (unit >= 0x7F && unit < 0xA0);
}

bool IsPlain(std::u16string_view character) {
  return !IsControl(character[0]) && !text::IsEscapedByte(character[0]);
}

void AppendOctal(std::string_view bytes, std::string& text) {
  for (const char byte : bytes) {
    text.push_back('\\');
    for (const int shift : {6, 3, 0}) {
      text.push_back(static_cast<char>('0' + (static_cast<unsigned char>(byte) >> shift & 7)));
    }
  }
}

}  // namespace

std::string Printable(std::string_view text) {
  std::string printable;
  const std::u16string units = text::TextOfFileName(text);
  for (std::u16string_view rest = units; !rest.empty();) {
    const bool isPair = rest.size() > 1 && text::IsHighSurrogate(rest[0]);
    const std::u16string_view character = rest.substr(0, isPair ? 2 : 1);
    rest.remove_prefix(character.size());
    const std::string bytes = text::FileNameOfText(character).value_or("");
    if (IsPlain(character)) {
      printable.append(bytes);
    } else {
      AppendOctal(bytes, printable);
    }
  }
  return printable;
}

std::string Shortened(std::string_view text) {
  if (text.size() <= PATH_MAX) return std::string(text);
  return std::string(text.substr(0, kPartOfAGiant)) + "... (" + std::to_string(text.size()) +
         " bytes)";
}

std::string Utf8OfAnyBytes(std::string_view bytes) {
  std::u16string text = text::TextOfFileName(bytes);
  std::replace_if(
      text.begin(), text.end(), [](char16_t unit) { return text::IsEscapedByte(unit); },
      kReplacement);
  return text::FileNameOfText(text).value_or("");
}

std::string WhyNotHFSNames(std::string_view text) {
  if (Utf8OfAnyBytes(text) != text) return "it is not UTF-8";
  return "it has a character that HFS names cannot have";
}

std::size_t CharacterCount(std::string_view text) {
  const auto begins = [](char c) { return (static_cast<unsigned char>(c) & 0xC0) != 0x80; };
  return static_cast<std::size_t>(std::count_if(text.begin(), text.end(), begins));
}

}  // namespace tallowmere::cli
