// The limit of a Pascal string: a length byte, followed by that many bytes of text.
#pragma once

#include <cstddef>

namespace tallowmere::foundation {

constexpr std::size_t kLongestPascalString = 255;  // bytes of text

}  // namespace tallowmere::foundation
