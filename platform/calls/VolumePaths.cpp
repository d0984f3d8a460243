#include "foundation/VolumePaths.h"

#include "files/MountTable.h"
#include "foundation/MacRoman.h"

namespace tallowmere::foundation {

using files::MountTable;

std::optional<std::string> MountPointOfVolume(std::u16string_view name) {
  const auto bytes = EncodeMacRoman(name);
  if (!bytes) return std::nullopt;
  const auto volume = MountTable::OfThisProcess().WithName(*bytes);
  // Names are compared as text: one that only encodes like a volume's name is not it.
  if (!volume || DecodeMacRoman(*bytes) != name) return std::nullopt;
  return volume->MountPoint();
}

std::optional<VolumeOfPath> FindVolumeOfPath(std::string_view path) {
  MountTable& table = MountTable::OfThisProcess();
  const auto volume = table.OfPath(path);
  if (!volume || table.WithName(volume->Name()) != volume) return std::nullopt;
  return VolumeOfPath{DecodeMacRoman(volume->Name()), volume->MountPoint().size()};
}

}  // namespace tallowmere::foundation
