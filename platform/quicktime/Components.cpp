#include "quicktime/Components.h"

#include <algorithm>
#include <array>

namespace tallowmere::quicktime {
namespace {

constexpr std::array<ComponentRecord, 1> kComponents{{
    {{MovieExportType, kQTFileTypeAIFF, SoundMediaType, 0, 0}},
}};

bool IsLike(const ComponentDescription& component, const ComponentDescription& looking) {
  const auto fits = [](OSType code, OSType wanted) { return wanted == 0 || code == wanted; };
  return fits(component.componentType, looking.componentType) &&
         fits(component.componentSubType, looking.componentSubType) &&
         fits(component.componentManufacturer, looking.componentManufacturer) &&
         ((component.componentFlags ^ looking.componentFlags) & looking.componentFlagsMask) == 0;
}

}  // namespace

Component Components::FindNext(Component previous, const ComponentDescription& looking) noexcept {
  if (previous != nullptr && !Has(previous)) return nullptr;
  const ComponentRecord* const first = previous == nullptr ? kComponents.begin() : previous + 1;
  const ComponentRecord* const found =
      std::find_if(first, kComponents.end(), [&looking](const ComponentRecord& component) {
        return IsLike(component.description, looking);
      });
  // The host's type is not const; nothing writes through it.
  return found == kComponents.end() ? nullptr : const_cast<Component>(found);
}

bool Components::Has(Component component) noexcept {
  return std::any_of(kComponents.begin(), kComponents.end(),
                     [component](const ComponentRecord& row) { return &row == component; });
}

AIFFExporter* Components::ExporterOf(ComponentInstance instance) {
  ComponentInstanceRecord* const open = mInstances.Find(instance);
  return open == nullptr ? nullptr : &open->exporter;
}

}  // namespace tallowmere::quicktime
