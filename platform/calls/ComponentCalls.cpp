// Components and movie export.

#include <QuickTime/QuickTime.h>

#include <cstring>

#include "calls/Process.h"
#include "foundation/NoThrow.h"

using namespace tallowmere;
using calls::ThisProcess;
using foundation::OrZero;
using quicktime::Components;

namespace {

quicktime::AIFFExporter* ExporterOf(ComponentInstance instance) {
  return OrZero([instance] { return ThisProcess().components.ExporterOf(instance); });
}

}  // namespace

Component FindNextComponent(Component previous, ComponentDescription* looking) {
  if (looking == nullptr) return nullptr;
  return Components::FindNext(previous, *looking);
}

OSErr GetComponentInfo(Component component, ComponentDescription* description, Handle name,
                       Handle info, Handle icon) {
  if (!Components::Has(component) || description == nullptr) return paramErr;
  if (name != nullptr || info != nullptr || icon != nullptr) return paramErr;
  *description = component->description;
  return noErr;
}

OSErr OpenAComponent(Component component, ComponentInstance* instance) {
  if (instance == nullptr) return paramErr;
  *instance = nullptr;
  if (!Components::Has(component)) return paramErr;
  *instance = OrZero([] { return ThisProcess().components.Open(); });
  return *instance == nullptr ? memFullErr : noErr;
}

OSErr CloseComponent(ComponentInstance instance) {
  const bool wasOpen = OrZero([instance] { return ThisProcess().components.Close(instance); });
  return wasOpen ? noErr : paramErr;
}

ComponentResult MovieExportSetSampleDescription(MovieExportComponent exporter,
                                                SampleDescriptionHandle description,
                                                OSType mediaType) {
  quicktime::AIFFExporter* const open = ExporterOf(exporter);
  const auto block = reinterpret_cast<Handle>(description);
  SoundDescription sound;
  if (open == nullptr || mediaType != SoundMediaType) return paramErr;
  if (GetHandleSize(block) < Size{sizeof sound} || *block == nullptr) return paramErr;
  std::memcpy(&sound, *block, sizeof sound);
  return open->SetSound(sound);
}

ComponentResult MovieExportGetSettingsAsAtomContainer(MovieExportComponent exporter,
                                                      QTAtomContainer* settings) {
  if (settings == nullptr) return paramErr;
  *settings = nullptr;
  const quicktime::AIFFExporter* const open = ExporterOf(exporter);
  if (open == nullptr || !open->HasSound()) return paramErr;
  *settings = OrZero([open] { return ThisProcess().handles.Make(open->Settings()); });
  return *settings == nullptr ? memFullErr : noErr;
}
