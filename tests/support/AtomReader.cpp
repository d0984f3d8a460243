#include "support/AtomReader.h"

namespace tallowmere::test {
namespace {

constexpr std::size_t kHeader = 20;

// The big-endian number in `bytes`.
std::uint32_t Number(std::string_view bytes) {
  std::uint32_t number = 0;
  for (const char byte : bytes) number = number * 256 + static_cast<unsigned char>(byte);
  return number;
}

std::string TwoBytes(unsigned number) {
  return {static_cast<char>(number / 256), static_cast<char>(number % 256)};
}

std::string FourBytes(std::uint32_t number) {
  return TwoBytes(number / 65536) + TwoBytes(number % 65536);
}

// Removes the first atom from the front of `bytes` and returns it.
std::optional<Atom> ReadAtom(std::string_view& bytes) {
  if (bytes.size() < kHeader) return std::nullopt;
  const std::size_t size = Number(bytes.substr(0, 4));
  if (size < kHeader || size > bytes.size()) return std::nullopt;
  if (Number(bytes.substr(12, 2)) != 0 || Number(bytes.substr(16, 4)) != 0) return std::nullopt;

  Atom atom{std::string(bytes.substr(4, 4)), Number(bytes.substr(8, 4)), {}, {}};
  std::string_view content = bytes.substr(kHeader, size - kHeader);
  const std::uint32_t children = Number(bytes.substr(14, 2));
  for (std::uint32_t i = 0; i < children; ++i) {
    auto child = ReadAtom(content);
    if (!child) return std::nullopt;
    atom.children.push_back(*std::move(child));
  }
  if (children > 0 && !content.empty()) return std::nullopt;
  atom.data = content;
  bytes.remove_prefix(size);
  return atom;
}

}  // namespace

std::optional<Atom> ReadAtomContainer(std::string_view container) {
  const std::string beginning(12, '\0');
  if (!container.starts_with(beginning)) return std::nullopt;
  container.remove_prefix(beginning.size());
  auto root = ReadAtom(container);
  return container.empty() ? root : std::nullopt;
}

Atom SettingsOf(std::string_view format, std::uint32_t rate, unsigned sampleSize,
                unsigned channels) {
  const std::vector<Atom> leaves = {{"ssct", 1, {}, std::string(format)},
                                    {"ssrt", 1, {}, FourBytes(rate)},
                                    {"ssss", 1, {}, TwoBytes(sampleSize)},
                                    {"sscc", 1, {}, TwoBytes(channels)}};
  return {"sean", 1, {{"soun", 1, leaves, ""}}, ""};
}

}  // namespace tallowmere::test
