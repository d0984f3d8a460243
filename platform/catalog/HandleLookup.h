// Where is an item: asked of the file system itself, by handle, in constant time. For a process
// with the privilege (CAP_DAC_READ_SEARCH; on XFS CAP_SYS_ADMIN as well).
#pragma once

#include <cstdint>
#include <vector>

#include "catalog/Sighting.h"
#include "kernel/Item.h"
#include "volumes/Volume.h"

namespace tallowmere::catalog {

struct HandleAnswer {
  // The items that were opened, and as leads the paths at which the kernel shows them; a file that
  // nobody has looked up yet is shown at "/".
  std::vector<Sighting> opened;

  // Whether the file system was asked for everything that could be meant: what was not found does
  // not exist.
  bool isComplete;
};

// A process that has the privilege only in a user namespace is refused what is not below the mount
// that it asks through, so that nothing is complete on a volume with several mounts.
HandleAnswer AskForReference(const volumes::Volume& volume, const kernel::Item& reference);

// Every item that has the id.
HandleAnswer AskForID(const volumes::Volume& volume, std::uint32_t id);

}  // namespace tallowmere::catalog
