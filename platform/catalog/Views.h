// A volume can show one folder at several places, and in one of them something can be mounted over
// one of its items, so that one name can be that of several items.
#pragma once

#include <vector>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"

namespace tallowmere::catalog {

// Whether the volume shows each of its folders at one place, known without a look there.
bool HasOneView(const HeldFolder& folder);

// The folder at all its places on the volume when in one of them something is mounted; else the
// folder alone. The names of their own count in the first place, where every process sees the
// folder alike; what cannot be seen there has short forms.
std::vector<HeldFolder> ViewsOf(Moment& moment, const HeldFolder& folder);

}  // namespace tallowmere::catalog
