#include <tallowmere/Types.h>

#include "text/FileNameText.h"
#include "text/MacRoman.h"

namespace tallowmere {

std::string Utf8OfHFSName(std::string_view name) {
  // No Mac Roman character is a surrogate, so there is always a value.
  return text::FileNameOfText(text::DecodeMacRoman(name)).value_or("");
}

std::optional<std::string> HFSNameOfUtf8(std::string_view text) {
  // A byte that is not part of valid UTF-8 becomes a surrogate, which Mac Roman lacks.
  return text::EncodeMacRoman(text::TextOfFileName(text));
}

}  // namespace tallowmere
