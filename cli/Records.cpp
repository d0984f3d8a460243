#include "cli/Records.h"

#include <charconv>
#include <nlohmann/json.hpp>

#include "service/Protocol.h"

namespace tallowmere::cli {
namespace {

constexpr char kSeparator = ':';

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

std::string HexOfRecord(const FSSpec& spec) {
  return Hex(EncodeFSSpec(spec));
}

std::optional<FSSpec> ReadRecord(std::string_view text) {
  const bool isHex =
      text.size() == 2 * protocol::kFileSpecSize && text.find(kSeparator) == text.npos;
  if (!isHex) return FSSpecOfText(text);
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
