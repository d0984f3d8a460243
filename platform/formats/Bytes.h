// Numbers and pieces of bytes that somebody else wrote, each checked against the bytes there are.
#pragma once

#include <climits>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>
#include <type_traits>

namespace tallowmere::formats {

// The piece of so many bytes from `offset` on. Nullopt unless all of it is there.
constexpr std::optional<std::string_view> Piece(std::string_view bytes, std::uint64_t offset,
                                                std::uint64_t length) {
  if (offset > bytes.size() || length > bytes.size() - offset) return std::nullopt;
  return bytes.substr(static_cast<std::size_t>(offset), static_cast<std::size_t>(length));
}

// All from `offset` on. Nullopt when that is past the end.
constexpr std::optional<std::string_view> From(std::string_view bytes, std::uint64_t offset) {
  if (offset > bytes.size()) return std::nullopt;
  return bytes.substr(static_cast<std::size_t>(offset));
}

enum class ByteOrder : std::uint8_t { kBig, kLittle };

// The integer at an offset. Nullopt unless all of its bytes are there.
template <class Number, ByteOrder order>
constexpr std::optional<Number> NumberAt(std::string_view bytes, std::uint64_t offset) {
  const auto piece = Piece(bytes, offset, sizeof(Number));
  if (!piece) return std::nullopt;
  std::uint64_t number = 0;
  for (std::size_t i = 0; i < sizeof(Number); ++i) {
    const std::size_t at = order == ByteOrder::kBig ? i : sizeof(Number) - 1 - i;
    number = number << CHAR_BIT | static_cast<unsigned char>((*piece)[at]);
  }
  return static_cast<Number>(number);
}
template <class Number>
constexpr std::optional<Number> BigEndianAt(std::string_view bytes, std::uint64_t offset) {
  return NumberAt<Number, ByteOrder::kBig>(bytes, offset);
}
template <class Number>
constexpr std::optional<Number> LittleEndianAt(std::string_view bytes, std::uint64_t offset) {
  return NumberAt<Number, ByteOrder::kLittle>(bytes, offset);
}

// The same of bytes that are known to be there, as those of a head whose size was checked. 0 where
// they are not.
template <class Number>
constexpr Number BigEndianIn(std::string_view head, std::size_t offset) {
  return BigEndianAt<Number>(head, offset).value_or(Number{});
}

// A 32-bit code of four characters.
constexpr std::uint32_t Code(const char (&letters)[5]) {
  return BigEndianIn<std::uint32_t>(std::string_view(letters, 4), 0);
}

}  // namespace tallowmere::formats
