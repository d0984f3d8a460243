#include "TestVolumes.h"

#include <string>
#include <string_view>

#include "foundation/VolumePaths.h"

namespace tallowmere::foundation {
namespace {

struct TestVolume {
  std::u16string_view name;
  std::string_view mountPoint;
};

constexpr TestVolume kVolumes[] = {
    {u"Data", "/mnt/data"}, {u"Data/2", "/mnt/Data:2"}, {u"Root", "/"}};  // "/" matches last

bool gVolumesAreMounted = true;

}  // namespace

void test::SetVolumesAreMounted(bool mounted) {
  gVolumesAreMounted = mounted;
}

std::optional<std::string> MountPointOfVolume(std::u16string_view name) {
  for (const TestVolume& volume : kVolumes) {
    if (gVolumesAreMounted && volume.name == name) return std::string(volume.mountPoint);
  }
  return std::nullopt;
}

std::optional<VolumeOfPath> FindVolumeOfPath(std::string_view path) {
  for (const TestVolume& volume : kVolumes) {
    const std::string_view place = volume.mountPoint;
    const bool below = path.starts_with(place) &&
                       (path.size() == place.size() || place == "/" || path[place.size()] == '/');
    if (gVolumesAreMounted && below) return VolumeOfPath{std::u16string(volume.name), place.size()};
  }
  return std::nullopt;
}

}  // namespace tallowmere::foundation
