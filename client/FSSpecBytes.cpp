#include <tallowmere/Types.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cstdint>

#include "service/Protocol.h"

namespace tallowmere {
namespace {

constexpr std::size_t kParentOffset = sizeof FSSpec::vRefNum;
constexpr std::size_t kLengthOffset = kParentOffset + sizeof FSSpec::parID;
constexpr std::size_t kNameOffset = kLengthOffset + 1;
static_assert(kNameOffset + protocol::kLongestSpecName == protocol::kFileSpecSize);

// Copies a number whose bytes are in an order, or from this machine's order into it.
template <class Number>
void CopyNumber(const char* from, char* to, std::endian order) {
  if (order == std::endian::native) {
    std::copy_n(from, sizeof(Number), to);
  } else {
    std::reverse_copy(from, from + sizeof(Number), to);
  }
}

template <class Number>
void Put(Number number, std::endian order, char* to) {
  const auto bytes = std::bit_cast<std::array<char, sizeof number>>(number);
  CopyNumber<Number>(bytes.data(), to, order);
}

template <class Number>
Number Get(const char* from, std::endian order) {
  std::array<char, sizeof(Number)> bytes{};
  CopyNumber<Number>(from, bytes.data(), order);
  return std::bit_cast<Number>(bytes);
}

}  // namespace

std::string EncodeFSSpec(const FSSpec& spec, std::endian order) {
  std::string bytes(protocol::kFileSpecSize, '\0');
  Put(spec.vRefNum, order, bytes.data());
  Put(spec.parID, order, bytes.data() + kParentOffset);
  bytes[kLengthOffset] = static_cast<char>(spec.name.size());
  std::copy(spec.name.begin(), spec.name.end(), bytes.data() + kNameOffset);
  return bytes;
}

std::optional<FSSpec> DecodeFSSpec(std::string_view bytes, std::endian order) {
  if (bytes.size() != protocol::kFileSpecSize) return std::nullopt;
  const auto length = static_cast<std::uint8_t>(bytes[kLengthOffset]);
  if (length > protocol::kLongestSpecName) return std::nullopt;
  return FSSpec{Get<std::int16_t>(bytes.data(), order),
                Get<std::int32_t>(bytes.data() + kParentOffset, order),
                std::string(bytes.substr(kNameOffset, length))};
}

}  // namespace tallowmere
