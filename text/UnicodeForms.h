// The forms that one name can have: letters with their marks as one character or as several,
// capitals or small letters. By the Unicode Character Database.
#pragma once

#include <string>
#include <string_view>

namespace tallowmere::text {

// The text with each letter and the marks behind it as one character, as far as there is one: for
// marks in canonical order, Unicode's normalization form C.
std::u16string Compose(std::u16string_view text);

// The text with each letter and its marks as characters of their own, the marks in the order in
// which they are: form D, but for characters that stand for one other character.
std::u16string Decompose(std::u16string_view text);

// Whether two texts are equal but for the case of letters, by Unicode's simple folding. Characters
// of two units have none.
bool EqualButForCase(std::u16string_view first, std::u16string_view second);

}  // namespace tallowmere::text
