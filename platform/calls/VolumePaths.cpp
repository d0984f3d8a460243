#include "foundation/VolumePaths.h"

#include "calls/Process.h"
#include "text/MacRoman.h"

namespace tallowmere::foundation {

std::optional<std::string> MountPointOfVolume(std::u16string_view name) {
  const auto bytes = text::EncodeMacRoman(name);
  if (!bytes) return std::nullopt;
  const auto& volumes = calls::ThisProcess().catalog.Table().Now();
  const auto volume = volumes->WithName(*bytes);
  // Compares text: a name that merely has the same bytes in HFS form is not the volume's.
  if (!volume || text::DecodeMacRoman(*bytes) != name) return std::nullopt;
  return (*volume)->MountPoint();
}

std::optional<VolumeOfPath> FindVolumeOfPath(std::string_view path) {
  const auto& volumes = calls::ThisProcess().catalog.Table().Now();
  const auto volume = volumes->OfPath(path);
  const auto name = volume ? volume->Name() : kernel::Result<std::string_view>(kernel::kNoVolume);
  if (!name) return std::nullopt;
  const auto first = volumes->WithName(*name);
  if (!first || *first != volume) return std::nullopt;
  return VolumeOfPath{text::DecodeMacRoman(*name), volume->MountPoint().size()};
}

}  // namespace tallowmere::foundation
