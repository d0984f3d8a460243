// The parts of a URL's text, by the syntax of RFC 3986.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::foundation {

// Views into the text. A part that is present may be empty; the path is always present.
struct UrlParts {
  std::optional<std::string_view> scheme;     // without its ":"
  std::optional<std::string_view> authority;  // without its "//"
  std::string_view path;                      // percent-encoded
  std::optional<std::string_view> query;      // without its "?"
  std::optional<std::string_view> fragment;   // without its "#"
};

// Splits any text as RFC 3986, appendix B, does. It does not validate the parts; all that holds is
// what the split itself ensures: no '#' before the fragment, no ':' or '/' in the scheme, and so
// on.
UrlParts SplitUrl(std::string_view url);

// Whether a text is a URI or a non-empty relative reference by the grammar of RFC 3986, appendix A.
bool IsUrl(std::string_view text);

// The URL with its path replaced by another one (percent-encoded). A path that would be read as an
// authority gets "/." in front, which names the same place. REQUIRES: with an authority, the path
// begins with "/"; without scheme and authority, its first segment has no ":".
std::string WithPath(std::string_view url, std::string_view path);

}  // namespace tallowmere::foundation
