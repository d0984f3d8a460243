#include <tallowmere/Types.h>

#include <charconv>
#include <cstdint>
#include <limits>

#include "service/Protocol.h"

namespace tallowmere {
namespace {

constexpr char kSeparator = ':';

// A number in decimal that a Number holds.
template <class Number>
std::optional<Number> ReadNumber(std::string_view digits) {
  Number number = 0;
  const char* const end = digits.data() + digits.size();
  const auto [stop, error] = std::from_chars(digits.data(), end, number);
  if (error != std::errc() || stop != end) return std::nullopt;
  return number;
}

std::optional<std::int32_t> ReadParent(std::string_view digits) {
  if (const auto parent = ReadNumber<std::int32_t>(digits)) return parent;
  const auto parent = ReadNumber<std::uint32_t>(digits);
  return parent ? std::optional(static_cast<std::int32_t>(*parent)) : std::nullopt;
}

}  // namespace

std::string TextOfFSSpec(const FSSpec& spec) {
  return std::to_string(spec.vRefNum) + kSeparator + std::to_string(spec.parID) + kSeparator +
         Utf8OfHFSName(spec.name);
}

std::optional<FSSpec> FSSpecOfText(std::string_view text) {
  const std::size_t first = text.find(kSeparator);
  const std::size_t second = text.find(kSeparator, first + 1);
  if (first == std::string_view::npos || second == std::string_view::npos) return std::nullopt;
  const auto volume = ReadNumber<std::int16_t>(text.substr(0, first));
  const auto parent = ReadParent(text.substr(first + 1, second - first - 1));
  auto name = HFSNameOfUtf8(text.substr(second + 1));
  if (!volume || !parent || !name || name->size() > protocol::kLongestSpecName) {
    return std::nullopt;
  }
  return FSSpec{*volume, *parent, *std::move(name)};
}

}  // namespace tallowmere
