// Converts between the bytes of a path as Linux stores them and the percent-encoded text of a URL
// (RFC 3986, section 2.1).
#pragma once

#include <string>
#include <string_view>

namespace tallowmere::foundation {

// Appends a path, percent-encoded. Bytes that a URL path may hold as they are, "/" included, are
// copied; every other byte becomes "%" and two capital hexadecimal digits. With
// `firstSegmentIsUrlStart` a ":" before the first "/" is encoded too, so that a relative path is
// not read as a scheme.
void AppendPercentEncodedPath(std::string& text, std::string_view bytes,
                              bool firstSegmentIsUrlStart);

// Decodes a text. A "%" that two hexadecimal digits do not follow is kept.
std::string PercentDecode(std::string_view text);

}  // namespace tallowmere::foundation
