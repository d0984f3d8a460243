#include "cli/Text.h"

#include <algorithm>

#include "foundation/FileNameText.h"
#include "foundation/MacRoman.h"

namespace tallowmere::cli {

std::string Utf8OfHFSName(std::string_view name) {
  // No Mac Roman character is a surrogate, so there always is one.
  return foundation::FileNameOfText(foundation::DecodeMacRoman(name)).value_or("");
}

std::string Printable(std::string_view text) {
  std::string printable;
  for (const char c : text) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte >= ' ' && byte != 0x7F) {
      printable.push_back(c);
    } else {
      printable.push_back('\\');
      for (const int shift : {6, 3, 0}) {
        printable.push_back(static_cast<char>('0' + (byte >> shift & 7)));
      }
    }
  }
  return printable;
}

std::size_t CharacterCount(std::string_view text) {
  const auto begins = [](char c) { return (static_cast<unsigned char>(c) & 0xC0) != 0x80; };
  return static_cast<std::size_t>(std::count_if(text.begin(), text.end(), begins));
}

}  // namespace tallowmere::cli
