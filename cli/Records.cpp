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

// Nullopt for a character outside base64, and for padding.
std::optional<std::uint32_t> ReadSixBits(char digit) {
  constexpr std::string_view kDigits =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  const std::size_t value = kDigits.find(digit);
  return value == kDigits.npos ? std::nullopt : std::optional(static_cast<std::uint32_t>(value));
}

// Decodes groups of six bits; drops the bits that are left over at the end.
std::optional<std::string> ReadBase64(std::string_view digits) {
  std::string bytes;
  std::uint32_t bits = 0;
  unsigned count = 0;
  for (const char digit : digits) {
    const auto value = ReadSixBits(digit);
    if (!value) return std::nullopt;
    bits = bits << 6 | *value;
    count += 6;
    if (count < 8) continue;
    count -= 8;
    bytes.push_back(static_cast<char>(bits >> count));
  }
  return bytes;
}

}  // namespace

std::string HexOfRecord(const FSSpec& spec) {
  return Hex(EncodeFSSpec(spec));
}

std::optional<std::string> ReadRecordBytes(std::string_view text) {
  constexpr std::string_view kPadding = "==";  // behind the last of 70 bytes
  if (text.size() == 2 * protocol::kFileSpecSize) return ReadHex(text);
  const bool isBase64 =
      text.size() == (protocol::kFileSpecSize + 2) / 3 * 4 && text.ends_with(kPadding);
  if (!isBase64) return std::nullopt;
  text.remove_suffix(kPadding.size());
  return ReadBase64(text);
}

std::optional<FSSpec> ReadRecord(std::string_view text, std::endian order) {
  if (text.find(kSeparator) != text.npos) return FSSpecOfText(text);
  const auto bytes = ReadRecordBytes(text);
  return bytes ? DecodeFSSpec(*bytes, order) : std::nullopt;
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
