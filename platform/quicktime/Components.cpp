#include "quicktime/Components.h"

#include <algorithm>

namespace tallowmere::quicktime {
namespace {

bool IsLike(const ComponentDescription& component, const ComponentDescription& looking) {
  const auto fits = [](OSType code, OSType wanted) { return wanted == 0 || code == wanted; };
  return fits(component.componentType, looking.componentType) &&
         fits(component.componentSubType, looking.componentSubType) &&
         fits(component.componentManufacturer, looking.componentManufacturer) &&
         ((component.componentFlags ^ looking.componentFlags) & looking.componentFlagsMask) == 0;
}

}  // namespace

Component Components::FindNext(Component previous, const ComponentDescription& looking) {
  if (previous != nullptr && !Has(previous)) return nullptr;
  auto* const first = previous == nullptr ? mComponents.begin() : previous + 1;
  auto* const found =
      std::find_if(first, mComponents.end(), [&looking](const ComponentRecord& component) {
        return IsLike(component.description, looking);
      });
  return found == mComponents.end() ? nullptr : found;
}

bool Components::Has(Component component) const {
  return std::any_of(mComponents.begin(), mComponents.end(),
                     [component](const ComponentRecord& row) { return &row == component; });
}

AIFFExporter* Components::ExporterOf(ComponentInstance instance) {
  ComponentInstanceRecord* const open = mInstances.Find(instance);
  return open == nullptr ? nullptr : &open->exporter;
}

}  // namespace tallowmere::quicktime
