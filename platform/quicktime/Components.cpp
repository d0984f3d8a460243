#include "quicktime/Components.h"

#include <algorithm>
#include <array>
#include <memory>
#include <unordered_map>

#include "foundation/NoThrow.h"

struct ComponentRecord {
  ComponentDescription description;
};

struct ComponentInstanceRecord {
  tallowmere::quicktime::AIFFExporter exporter;
};

namespace tallowmere::quicktime {
namespace {

auto gComponents = std::to_array<ComponentRecord>({
    {{MovieExportType, kQTFileTypeAIFF, SoundMediaType, 0, 0}},
});

using Instances = std::unordered_map<ComponentInstance, std::unique_ptr<ComponentInstanceRecord>>;

Instances& LiveInstances() {
  // Never destroyed: exit handlers may still ask.
  static Instances& instances = *new Instances;
  return instances;
}

bool IsComponent(Component component) {
  return std::any_of(gComponents.begin(), gComponents.end(),
                     [component](ComponentRecord& row) { return &row == component; });
}

bool IsLike(const ComponentDescription& component, const ComponentDescription& looking) {
  const auto fits = [](OSType code, OSType wanted) { return wanted == 0 || code == wanted; };
  return fits(component.componentType, looking.componentType) &&
         fits(component.componentSubType, looking.componentSubType) &&
         fits(component.componentManufacturer, looking.componentManufacturer) &&
         ((component.componentFlags ^ looking.componentFlags) & looking.componentFlagsMask) == 0;
}

ComponentInstance NewInstance() {
  auto record = std::make_unique<ComponentInstanceRecord>();
  const ComponentInstance instance = record.get();
  LiveInstances().emplace(instance, std::move(record));
  return instance;
}

}  // namespace

std::size_t OpenInstances() {
  return LiveInstances().size();
}

AIFFExporter* ExporterOf(ComponentInstance instance) {
  const auto found = LiveInstances().find(instance);
  return found == LiveInstances().end() ? nullptr : &found->second->exporter;
}

}  // namespace tallowmere::quicktime

using namespace tallowmere::quicktime;

Component FindNextComponent(Component previous, ComponentDescription* looking) {
  if (looking == nullptr || (previous != nullptr && !IsComponent(previous))) return nullptr;
  auto* const first = previous == nullptr ? gComponents.begin() : previous + 1;
  auto* const found =
      std::find_if(first, gComponents.end(), [looking](const ComponentRecord& component) {
        return IsLike(component.description, *looking);
      });
  return found == gComponents.end() ? nullptr : found;
}

OSErr GetComponentInfo(Component component, ComponentDescription* description, Handle name,
                       Handle info, Handle icon) {
  if (!IsComponent(component) || description == nullptr) return paramErr;
  if (name != nullptr || info != nullptr || icon != nullptr) return paramErr;
  *description = component->description;
  return noErr;
}

OSErr OpenAComponent(Component component, ComponentInstance* instance) {
  if (instance == nullptr) return paramErr;
  *instance = nullptr;
  if (!IsComponent(component)) return paramErr;
  *instance = tallowmere::foundation::OrZero(NewInstance);
  return *instance == nullptr ? memFullErr : noErr;
}

OSErr CloseComponent(ComponentInstance instance) {
  return LiveInstances().erase(instance) == 1 ? noErr : paramErr;
}
