// The platform's state in this process: the catalog, the open moment, and what callers own. It is
// never destroyed, so that calls from static destructors and exit handlers still work.
#pragma once

#include <CoreServices/CoreServices.h>

#include <cstddef>
#include <thread>

#include "catalog/Catalog.h"
#include "catalog/Moment.h"
#include "quicktime/Components.h"
#include "quicktime/Handles.h"

namespace tallowmere::calls {

// A walk over the volumes by index. It sees one state of the mount table from index 1 to its end,
// whatever else is called meanwhile.
struct WalkByIndex {
  volumes::VolumesPointer volumes;
  std::size_t next = 0;  // the index, from 0, that continues the walk
};

struct Process {
  catalog::Catalog catalog;
  WalkByIndex walk;
  catalog::Moment moment{catalog};  // of the current request
  std::thread::id momentOwner;      // whose moment is open; no thread's if none is
  quicktime::Handles handles;
  quicktime::Components components;
};

Process& ThisProcess();

// This thread's open moment, or null.
catalog::Moment* OpenMoment();

// Calls `body` with this thread's open moment, or with one of its own.
template <class Body>
auto InMoment(Body&& body) {
  if (catalog::Moment* const open = OpenMoment()) return body(*open);
  catalog::Moment own(ThisProcess().catalog);
  return body(own);
}

}  // namespace tallowmere::calls
