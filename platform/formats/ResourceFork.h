// The resources of a resource fork: Inside Macintosh: More Macintosh Toolbox, "Resource Manager",
// "Resource File Format". Big-endian.
//
// Offset and length of data and map; the map with a list of types, each with references to its
// resources: id, attributes and where the resource is within the data, there with its length in
// front.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace tallowmere::formats {

struct Resource {
  std::int16_t id;
  std::optional<std::string_view> data;  // nullopt when it is outside the fork's data
};

// The resources of a type in the map's order; none where the fork has none. Nullopt for a map that
// does not fit. The data stay valid as long as the fork's bytes.
std::optional<std::vector<Resource>> ResourcesOfType(std::string_view bytes, std::uint32_t type);

// The one with id 0, else with the lowest id. REQUIRES: there is one.
const Resource& FirstByID(const std::vector<Resource>& resources);

}  // namespace tallowmere::formats
