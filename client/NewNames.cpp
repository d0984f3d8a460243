#include "client/NewNames.h"

#include <tallowmere/Types.h>

#include <algorithm>

#include "service/Protocol.h"
#include "text/Utf16.h"

namespace tallowmere {
namespace {

constexpr char kMarkOfShortForms = '#';

std::string Exchanged(std::string_view name, char from, char to) {
  std::string exchanged(name);
  std::replace(exchanged.begin(), exchanged.end(), from, to);
  return exchanged;
}

}  // namespace

std::optional<std::string> HFSNameOfLinuxName(std::string_view name) {
  return HFSNameOfUtf8(Exchanged(name, protocol::kSeparator, '/'));
}

std::string LinuxNameOfHFSName(std::string_view name) {
  return Exchanged(Utf8OfHFSName(name), '/', protocol::kSeparator);
}

std::optional<std::string> WhyNoHFSName(std::string_view name) {
  if (name.empty()) return "an empty HFS name names nothing";
  if (name == "." || name == "..") return "no item has the HFS name \"" + std::string(name) + '"';
  if (name.find(protocol::kSeparator) != std::string_view::npos) {
    return "the HFS name \"" + Utf8OfHFSName(name) + "\" has a colon";
  }
  if (name.find('\0') != std::string_view::npos) return "an HFS name with a NUL names nothing";
  return std::nullopt;
}

bool MayBeAnothersName(std::string_view name) {
  return !text::IsAllAscii(name) || name.find(kMarkOfShortForms) != std::string_view::npos;
}

}  // namespace tallowmere
