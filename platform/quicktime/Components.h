// The components that exist and their open instances. There is one component, the exporter of AIFF
// files.
#pragma once

#include <QuickTime/QuickTime.h>

#include <cstddef>

#include "quicktime/AIFFExporter.h"
#include "quicktime/Slots.h"

struct ComponentRecord {
  ComponentDescription description;
};

struct ComponentInstanceRecord {
  tallowmere::quicktime::AIFFExporter exporter;
};

namespace tallowmere::quicktime {

class Components {
 public:
  // The first component after `previous` (null: the first of all) that matches. Null when there is
  // none and when `previous` is not a component. Needs no memory.
  static Component FindNext(Component previous, const ComponentDescription& looking) noexcept;

  static bool Has(Component component) noexcept;

  // A new instance, open until it is closed.
  ComponentInstance Open() { return &mInstances.Add(); }

  // Returns whether it was open.
  bool Close(ComponentInstance instance) noexcept { return mInstances.Remove(instance); }

  // The exporter behind an instance. Null when the instance is not open.
  AIFFExporter* ExporterOf(ComponentInstance instance);

  std::size_t OpenInstances() const { return mInstances.Count(); }

 private:
  Slots<ComponentInstanceRecord> mInstances;
};

}  // namespace tallowmere::quicktime
