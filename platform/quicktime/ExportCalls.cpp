#include <cstring>

#include "foundation/NoThrow.h"
#include "quicktime/Components.h"
#include "quicktime/Handles.h"

using namespace tallowmere::quicktime;

ComponentResult MovieExportSetSampleDescription(MovieExportComponent exporter,
                                                SampleDescriptionHandle description,
                                                OSType mediaType) {
  AIFFExporter* const open = ExporterOf(exporter);
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
  const AIFFExporter* const open = ExporterOf(exporter);
  if (open == nullptr || !open->HasSound()) return paramErr;
  *settings = tallowmere::foundation::OrZero([open] { return NewHandleWith(open->Settings()); });
  return *settings == nullptr ? memFullErr : noErr;
}
