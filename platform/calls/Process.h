// The state of a process: what it knows, the moment that is open, and what its callers own. It is
// never destroyed, so that calls from static destructors and exit handlers find it whole.
#pragma once

#include <CoreServices/CoreServices.h>

#include <cstddef>
#include <thread>

#include "catalog/Catalog.h"
#include "catalog/Moment.h"
#include "quicktime/Components.h"
#include "quicktime/Handles.h"

namespace tallowmere::calls {

// A walk over the volumes by index: it sees one state of the table from index 1 to its end,
// whatever else is asked meanwhile.
struct WalkByIndex {
  volumes::VolumesPointer volumes;
  std::size_t next = 0;  // the index, from 0, that goes on with the walk
};

struct Process {
  catalog::Catalog catalog;
  WalkByIndex walk;
  catalog::Moment moment{catalog};  // of a request; restarted with each
  std::thread::id momentOwner;      // whose moment is open; no thread's where none is
  quicktime::Handles handles;
  quicktime::Components components;
};

Process& ThisProcess();

// The moment that this thread has open; null when it has none.
catalog::Moment* OpenMoment();

// What `body` answers in the open moment, or in one of its own.
template <class Body>
auto InMoment(Body&& body) {
  if (catalog::Moment* const open = OpenMoment()) return body(*open);
  catalog::Moment own(ThisProcess().catalog);
  return body(own);
}

}  // namespace tallowmere::calls
