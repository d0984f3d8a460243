#include "foundation/UrlParts.h"

namespace tallowmere::foundation {
namespace {

constexpr std::string_view kAuthorityMark = "//";

// Cuts off what follows the first `mark`, if there is one.
std::optional<std::string_view> CutAfter(std::string_view& text, char mark) {
  const auto at = text.find(mark);
  if (at == text.npos) return std::nullopt;
  const std::string_view part = text.substr(at + 1);
  text = text.substr(0, at);
  return part;
}

}  // namespace

UrlParts SplitUrl(std::string_view url) {
  UrlParts parts;
  parts.fragment = CutAfter(url, '#');
  parts.query = CutAfter(url, '?');
  const auto schemeEnd = url.find_first_of(":/");
  if (schemeEnd != url.npos && url[schemeEnd] == ':') {
    parts.scheme = url.substr(0, schemeEnd);
    url.remove_prefix(schemeEnd + 1);
  }
  if (url.starts_with(kAuthorityMark)) {
    url.remove_prefix(kAuthorityMark.size());
    parts.authority = url.substr(0, url.find('/'));
    url.remove_prefix(parts.authority->size());
  }
  parts.path = url;
  return parts;
}

std::string WithPath(std::string_view url, std::string_view path) {
  const UrlParts parts = SplitUrl(url);
  const auto pathStart = static_cast<std::size_t>(parts.path.data() - url.data());
  std::string result;
  result.reserve(url.size() + path.size());
  result += url.substr(0, pathStart);
  if (!parts.authority && path.starts_with(kAuthorityMark)) result += "/.";
  result += path;
  result += url.substr(pathStart + parts.path.size());
  return result;
}

}  // namespace tallowmere::foundation
