#include <arpa/inet.h>

#include <algorithm>

#include "foundation/UrlCharacters.h"
#include "foundation/UrlParts.h"

namespace tallowmere::foundation {
namespace {

// *( characters that `isAllowed` accepts / pct-encoded )
template <typename Predicate>
bool IsEncodedText(std::string_view text, Predicate isAllowed) {
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (text[i] != '%') {
      if (!isAllowed(text[i])) return false;
      continue;
    }
    if (text.size() - i < 3 || HexValue(text[i + 1]) < 0 || HexValue(text[i + 2]) < 0) return false;
    i += 2;
  }
  return true;
}

bool IsScheme(std::string_view text) {
  return !text.empty() && IsAsciiLetter(text[0]) &&
         std::all_of(text.begin(), text.end(), [](char c) {
           return IsAsciiLetter(c) || IsAsciiDigit(c) || c == '+' || c == '-' || c == '.';
         });
}

bool IsRegisteredName(std::string_view text) {
  return IsEncodedText(text, [](char c) { return IsUnreserved(c) || IsSubDelimiter(c); });
}

bool IsUserInfo(std::string_view text) {
  return IsEncodedText(text,
                       [](char c) { return IsUnreserved(c) || IsSubDelimiter(c) || c == ':'; });
}

bool IsPort(std::string_view text) {
  return std::all_of(text.begin(), text.end(), IsAsciiDigit);
}

// "v" 1*HEXDIG "." 1*( unreserved / sub-delims / ":" )
bool IsFutureAddress(std::string_view text) {
  if (text.empty() || (text[0] != 'v' && text[0] != 'V')) return false;
  const auto dot = text.find('.');
  if (dot == text.npos) return false;
  const std::string_view version = text.substr(1, dot - 1);
  const std::string_view address = text.substr(dot + 1);
  return !version.empty() && !address.empty() &&
         std::all_of(version.begin(), version.end(), [](char c) { return HexValue(c) >= 0; }) &&
         std::all_of(address.begin(), address.end(),
                     [](char c) { return IsUnreserved(c) || IsSubDelimiter(c) || c == ':'; });
}

bool IsIpv6Address(std::string_view text) {
  if (text.size() >= INET6_ADDRSTRLEN || text.find('\0') != text.npos) return false;
  char address[INET6_ADDRSTRLEN] = {};
  text.copy(address, text.size());
  in6_addr parsed;
  return inet_pton(AF_INET6, address, &parsed) == 1;
}

bool IsHost(std::string_view text) {
  if (!text.starts_with('[')) return IsRegisteredName(text);  // covers every IPv4 address
  if (!text.ends_with(']')) return false;
  const std::string_view literal = text.substr(1, text.size() - 2);
  return IsIpv6Address(literal) || IsFutureAddress(literal);
}

bool IsAuthority(std::string_view text) {
  if (const auto at = text.find('@'); at != text.npos) {
    if (!IsUserInfo(text.substr(0, at))) return false;
    text.remove_prefix(at + 1);
  }
  // An IP literal has colons within its brackets.
  const auto hostEnd = text.find(':', text.starts_with('[') ? text.find(']') : 0);
  if (hostEnd != text.npos) {
    if (!IsPort(text.substr(hostEnd + 1))) return false;
    text = text.substr(0, hostEnd);
  }
  return IsHost(text);
}

bool IsPath(std::string_view text) {
  return IsEncodedText(text, [](char c) { return IsPathCharacter(c) || c == '/'; });
}

bool IsQueryOrFragment(std::string_view text) {
  return IsEncodedText(text, [](char c) { return IsPathCharacter(c) || c == '/' || c == '?'; });
}

}  // namespace

// The split itself ensures the rest of the grammar: a path after an authority is empty or begins
// with "/", one without an authority does not begin with "//", and one without a scheme has no ":"
// in its first segment.
bool IsUrl(std::string_view text) {
  const UrlParts parts = SplitUrl(text);
  return !text.empty() && (!parts.scheme || IsScheme(*parts.scheme)) &&
         (!parts.authority || IsAuthority(*parts.authority)) && IsPath(parts.path) &&
         (!parts.query || IsQueryOrFragment(*parts.query)) &&
         (!parts.fragment || IsQueryOrFragment(*parts.fragment));
}

}  // namespace tallowmere::foundation
