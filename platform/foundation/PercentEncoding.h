// Paths between the bytes that Linux stores and the percent-encoded text of a URL (RFC 3986,
// section 2.1).
#pragma once

#include <string>
#include <string_view>

namespace tallowmere::foundation {

// Adds the text of a path's bytes. What may stand for itself in a path does, "/" among it; every
// other byte becomes "%" and two capital hexadecimal digits. With `firstSegmentIsUrlStart` a ":"
// before the first "/" is encoded too, so that a relative path does not read as a scheme.
void AppendPercentEncodedPath(std::string& text, std::string_view bytes,
                              bool firstSegmentIsUrlStart);

// The bytes of a text. A "%" without two hexadecimal digits behind it stands for itself.
std::string PercentDecode(std::string_view text);

}  // namespace tallowmere::foundation
