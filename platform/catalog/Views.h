// The places at which a volume shows one folder. Something can be mounted over an item in one of
// them, so that a name means different items in different places.
#pragma once

#include <vector>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"

namespace tallowmere::catalog {

// Whether the volume shows each of its folders at one place only, as far as the mount table tells.
bool HasOneView(const HeldFolder& folder);

// The folder at each of its places if something is mounted in one of them, otherwise the folder
// alone. Own names count at the first place, which is the same in every process; items hidden there
// have short forms.
std::vector<HeldFolder> ViewsOf(Moment& moment, const HeldFolder& folder);

}  // namespace tallowmere::catalog
