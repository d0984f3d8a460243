#include "foundation/PathText.h"

#include <algorithm>

#include "foundation/PercentEncoding.h"

namespace tallowmere::foundation {
namespace {

// The path without "/" at its end. Empty when it consists of "/" alone.
std::string_view WithoutTrailingSlashes(std::string_view path) {
  return path.substr(0, path.find_last_not_of('/') + 1);
}

constexpr std::string_view kLongestDotDot = "%2E%2E";

// Whether a component of a URL's path is "." or "..", with "%2E" read as "." (RFC 3986, section
// 2.3).
bool IsDotOrDotDot(std::string_view component) {
  if (component.size() > kLongestDotDot.size()) return false;
  const std::string bytes = PercentDecode(component);
  return bytes == "." || bytes == "..";
}

}  // namespace

std::string_view WithoutFolderMark(std::string_view path) {
  const std::string_view trimmed = WithoutTrailingSlashes(path);
  return trimmed.empty() ? path.substr(0, 1) : trimmed;
}

std::string WithFolderMark(std::string_view path, bool folder) {
  std::string marked;
  if (!folder) return marked.assign(WithoutFolderMark(path));
  marked.reserve(path.size() + 1);
  marked += path;
  if (!path.ends_with('/')) marked += '/';
  return marked;
}

std::optional<std::string_view> LastComponent(std::string_view path) {
  if (path.empty()) return std::nullopt;
  const std::string_view trimmed = WithoutTrailingSlashes(path);
  if (trimmed.empty()) return path.substr(0, 1);
  return trimmed.substr(trimmed.rfind('/') + 1);
}

bool HasFolderMark(std::string_view path) {
  return path.ends_with('/') || IsDotOrDotDot(path.substr(path.rfind('/') + 1));
}

std::string ParentPath(std::string_view path) {
  const std::string_view trimmed = WithoutTrailingSlashes(path);
  if (trimmed.empty()) return "/";
  const auto lastStart = trimmed.rfind('/') + 1;
  if (IsDotOrDotDot(trimmed.substr(lastStart))) return WithFolderMark(path, true) + "../";
  if (lastStart == 0) return "./";
  return std::string(trimmed.substr(0, lastStart));
}

std::string FolderOf(std::string_view path) {
  return std::string(path.substr(0, std::max<std::size_t>(path.rfind('/'), 1)));
}

std::string JoinPath(std::string_view path, std::string_view component) {
  std::string joined;
  joined.reserve(path.size() + 1 + component.size());
  joined += path;
  if (!joined.empty() && !joined.ends_with('/')) joined += '/';
  return joined += component;
}

bool IsWithin(std::string_view path, std::string_view folder) {
  if (folder == "/") return path.starts_with('/');
  return path.starts_with(folder) && (path.size() == folder.size() || path[folder.size()] == '/');
}

std::optional<std::string_view> Extension(std::string_view component) {
  const auto dot = component.rfind('.');
  if (dot == component.npos || dot == 0 || dot + 1 == component.size()) return std::nullopt;
  return component.substr(dot + 1);
}

}  // namespace tallowmere::foundation
