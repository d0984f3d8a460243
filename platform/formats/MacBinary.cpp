#include "formats/MacBinary.h"

#include "formats/Bytes.h"

namespace tallowmere::formats {
namespace {

constexpr std::uint64_t kBlock = 128;
constexpr std::size_t kChecksumAt = 124;
constexpr std::size_t kLongestName = 63;
constexpr std::uint8_t kVersion2 = 129;
constexpr std::uint8_t kVersion3 = 130;

std::uint64_t Padded(std::uint64_t length) {
  return (length + kBlock - 1) / kBlock * kBlock;
}

// CRC-16 with the polynomial 0x1021, from 0, as XMODEM uses it.
std::uint16_t ChecksumOf(std::string_view bytes) {
  constexpr unsigned kPolynomial = 0x1021;
  constexpr unsigned kHighestBit = 0x8000;
  unsigned sum = 0;
  for (const char byte : bytes) {
    sum ^= static_cast<unsigned>(static_cast<unsigned char>(byte)) << 8;
    for (int bit = 0; bit < 8; ++bit) {
      sum = (sum & kHighestBit) != 0 ? sum << 1 ^ kPolynomial : sum << 1;
    }
  }
  return static_cast<std::uint16_t>(sum);
}

bool IsHeader(std::string_view header) {
  for (const std::size_t zeroAt : {0U, 74U, 82U}) {
    if (header[zeroAt] != 0) return false;
  }
  const auto nameLength = BigEndianIn<std::uint8_t>(header, 1);
  if (nameLength == 0 || nameLength > kLongestName) return false;
  const auto version = BigEndianIn<std::uint8_t>(header, 122);
  const auto versionNeeded = BigEndianIn<std::uint8_t>(header, 123);
  if (version < kVersion2 || versionNeeded > kVersion3) return false;
  return BigEndianIn<std::uint16_t>(header, kChecksumAt) ==
         ChecksumOf(header.substr(0, kChecksumAt));
}

}  // namespace

std::optional<MacBinary> ReadMacBinary(std::string_view bytes) {
  const auto header = Piece(bytes, 0, kBlock);
  if (!header || !IsHeader(*header)) return std::nullopt;
  const auto dataLength = BigEndianIn<std::uint32_t>(*header, 83);
  const auto resourceLength = BigEndianIn<std::uint32_t>(*header, 87);
  const std::uint64_t dataAt = kBlock + Padded(BigEndianIn<std::uint16_t>(*header, 120));
  const auto data = Piece(bytes, dataAt, dataLength);
  const auto resources = Piece(bytes, dataAt + Padded(dataLength), resourceLength);
  // An empty fork has no padding in front either.
  if (!data || (!resources && resourceLength != 0)) return std::nullopt;
  MacBinary file;
  file.name = header->substr(2, BigEndianIn<std::uint8_t>(*header, 1));
  file.type = BigEndianIn<std::uint32_t>(*header, 65);
  file.creator = BigEndianIn<std::uint32_t>(*header, 69);
  file.finderFlags = static_cast<std::uint16_t>(BigEndianIn<std::uint8_t>(*header, 73) << 8 |
                                                BigEndianIn<std::uint8_t>(*header, 101));
  file.dataFork = *data;
  file.resourceFork = resources.value_or(std::string_view());
  return file;
}

}  // namespace tallowmere::formats
