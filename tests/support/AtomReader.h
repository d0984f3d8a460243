// Reads atom containers, independently of the platform's writer: every byte must be accounted for.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::test {

struct Atom {
  std::string type;
  std::uint32_t id;
  std::vector<Atom> children;
  std::string data;  // empty when there are children

  bool operator==(const Atom&) const = default;
};

// The root atom. Nullopt when the container is malformed: it does not begin with 10 zero bytes and
// the lock count 0, a size does not fit its surroundings, a reserved field is not zero, the number
// of children differs from the header's, or a byte is left over.
std::optional<Atom> ReadAtomContainer(std::string_view container);

// The tree of an exporter's settings for a sound. The format is given as it is read, "twos".
Atom SettingsOf(std::string_view format, std::uint32_t rate, unsigned sampleSize,
                unsigned channels);

}  // namespace tallowmere::test
