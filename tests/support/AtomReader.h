// Reading atom containers, independent of the platform's writing: every byte has to be accounted
// for.
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
  std::string data;  // empty where there are children

  bool operator==(const Atom&) const = default;
};

// The root atom. None when the container is not well formed: another beginning than 10 zero bytes
// and the lock count 0, a size that does not fit what it is in, a reserved field that is not zero,
// another number of children than the header says, a byte left over.
std::optional<Atom> ReadAtomContainer(std::string_view container);

// The tree that an exporter's settings for such a sound are. The format as it is read, "twos".
Atom SettingsOf(std::string_view format, std::uint32_t rate, unsigned sampleSize,
                unsigned channels);

}  // namespace tallowmere::test
