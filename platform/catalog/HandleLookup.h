// Opens items by file handle, in constant time: open_by_handle_at(2). Needs CAP_DAC_READ_SEARCH,
// and on xfs CAP_SYS_ADMIN as well.
#pragma once

#include <cstdint>
#include <vector>

#include "catalog/Sighting.h"
#include "kernel/Item.h"
#include "volumes/Volume.h"

namespace tallowmere::catalog {

struct HandleAnswer {
  // The items that were opened. Their paths are leads, as the kernel shows them; a file that nobody
  // has looked up yet is shown at "/".
  std::vector<Sighting> opened;

  // Whether every candidate was asked for, so that what was not found does not exist.
  bool isComplete;
};

// A process privileged only in a user namespace is refused items that are not below the mount it
// asks through, so no answer is complete on a volume with several mounts.
HandleAnswer AskForReference(const volumes::Volume& volume, const kernel::Item& reference);

// Every item that has the id.
HandleAnswer AskForID(const volumes::Volume& volume, std::uint32_t id);

}  // namespace tallowmere::catalog
