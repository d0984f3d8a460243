#include <tallowmere/Types.h>

#include <algorithm>
#include <cstring>

#include "service/Protocol.h"

namespace tallowmere {
namespace {

constexpr std::size_t kParentOffset = sizeof FSSpec::vRefNum;
constexpr std::size_t kLengthOffset = kParentOffset + sizeof FSSpec::parID;
constexpr std::size_t kNameOffset = kLengthOffset + 1;
static_assert(kNameOffset + protocol::kLongestSpecName == protocol::kFileSpecSize);

}  // namespace

std::string EncodeFSSpec(const FSSpec& spec) {
  std::string bytes(protocol::kFileSpecSize, '\0');
  std::memcpy(bytes.data(), &spec.vRefNum, sizeof spec.vRefNum);
  std::memcpy(bytes.data() + kParentOffset, &spec.parID, sizeof spec.parID);
  bytes[kLengthOffset] = static_cast<char>(spec.name.size());
  std::copy(spec.name.begin(), spec.name.end(), bytes.data() + kNameOffset);
  return bytes;
}

std::optional<FSSpec> DecodeFSSpec(std::string_view bytes) {
  if (bytes.size() != protocol::kFileSpecSize) return std::nullopt;
  const auto length = static_cast<std::uint8_t>(bytes[kLengthOffset]);
  if (length > protocol::kLongestSpecName) return std::nullopt;
  FSSpec spec{};
  std::memcpy(&spec.vRefNum, bytes.data(), sizeof spec.vRefNum);
  std::memcpy(&spec.parID, bytes.data() + kParentOffset, sizeof spec.parID);
  spec.name = bytes.substr(kNameOffset, length);
  return spec;
}

}  // namespace tallowmere
