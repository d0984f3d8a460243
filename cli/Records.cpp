#include "cli/Records.h"

#include <charconv>
#include <limits>
#include <nlohmann/json.hpp>

#include "service/Protocol.h"

namespace tallowmere::cli {
namespace {

constexpr char kSeparator = ':';

std::optional<std::int64_t> ReadNumber(std::string_view digits) {
  std::int64_t number = 0;
  const char* const end = digits.data() + digits.size();
  const auto [stop, error] = std::from_chars(digits.data(), end, number);
  if (error != std::errc() || stop != end) return std::nullopt;
  return number;
}

bool IsIn(std::int64_t number, std::int64_t lowest, std::int64_t highest) {
  return number >= lowest && number <= highest;
}

std::optional<FSSpec> ReadText(std::string_view text) {
  const std::size_t first = text.find(kSeparator);
  const std::size_t second = text.find(kSeparator, first + 1);
  if (first == std::string_view::npos || second == std::string_view::npos) return std::nullopt;
  const auto volume = ReadNumber(text.substr(0, first));
  const auto parent = ReadNumber(text.substr(first + 1, second - first - 1));
  auto name = HFSNameOfUtf8(text.substr(second + 1));
  using Volume = std::numeric_limits<std::int16_t>;
  using Parent = std::numeric_limits<std::int32_t>;
  using UnsignedParent = std::numeric_limits<std::uint32_t>;
  if (!volume || !parent || !name || !IsIn(*volume, Volume::min(), Volume::max()) ||
      !IsIn(*parent, Parent::min(), UnsignedParent::max()) ||
      name->size() > protocol::kLongestSpecName) {
    return std::nullopt;
  }
  return FSSpec{static_cast<std::int16_t>(*volume), static_cast<std::int32_t>(*parent),
                *std::move(name)};
}

std::optional<std::string> ReadHex(std::string_view digits) {
  std::string bytes;
  for (std::size_t at = 0; at + 1 < digits.size(); at += 2) {
    std::uint8_t byte = 0;
    const char* const end = digits.data() + at + 2;
    if (std::from_chars(digits.data() + at, end, byte, 16).ptr != end) return std::nullopt;
    bytes.push_back(static_cast<char>(byte));
  }
  return bytes;
}

}  // namespace

std::string TextOfRecord(const FSSpec& spec) {
  return std::to_string(spec.vRefNum) + kSeparator + std::to_string(spec.parID) + kSeparator +
         Utf8OfHFSName(spec.name);
}

std::string HexOfRecord(const FSSpec& spec) {
  return Hex(EncodeFSSpec(spec));
}

std::optional<FSSpec> ReadRecord(std::string_view text) {
  const bool isHex =
      text.size() == 2 * protocol::kFileSpecSize && text.find(kSeparator) == text.npos;
  if (!isHex) return ReadText(text);
  const auto bytes = ReadHex(text);
  return bytes ? DecodeFSSpec(*bytes) : std::nullopt;
}

void Put(nlohmann::ordered_json& json, const FSSpec& spec) {
  json["volume"] = spec.vRefNum;
  json["parent"] = spec.parID;
  json["name"] = Utf8OfHFSName(spec.name);
  json["record"] = HexOfRecord(spec);
}

std::string Hex(std::string_view bytes) {
  constexpr std::string_view kDigits = "0123456789abcdef";
  std::string text;
  text.reserve(2 * bytes.size());
  for (const char character : bytes) {
    const auto byte = static_cast<unsigned char>(character);
    text.push_back(kDigits[byte >> 4]);
    text.push_back(kDigits[byte & 0xF]);
  }
  return text;
}

}  // namespace tallowmere::cli
