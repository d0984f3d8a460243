#include "Requests.h"

#include "support/EveryRequest.h"
#include "support/Wire.h"

namespace tallowmere::soak {

using namespace tallowmere::test;

Path Path::Parent() const {
  Path parent = *this;
  parent.names[--parent.count] = 0;
  return parent;
}

std::string VolumeName(const Volume& volume, const Place& place) {
  return volume.root == kMainRoot ? place.name : NameAt(kVolumePlace).hfsName;
}

std::string TextOf(const Path& path, const Place& place) {
  std::string text = place.path;
  for (std::size_t i = 0; i < path.count; ++i) {
    text.append("/").append(NameAt(path.names[i]).linuxName);
  }
  return text;
}

std::string BytesOf(const Request& request, const Place& place) {
  const std::string path = TextOf(request.path, place);
  switch (request.code) {
    case 1:
      return FullPathRequest(path, request.room, request.flag);
    case 2: {
      std::string folder = request.byOther ? "" : place.name + ":";
      std::size_t i = 0;
      for (; i + 1 < request.path.count; ++i)
        folder += std::string(NameAt(request.path.names[i]).hfsName) + ":";
      if (request.flag) folder[folder.find(':')] = '\0';
      return PathOfHFSPathRequest(
          folder + '\0', std::string(NameAt(request.path.names[i]).hfsName) + '\0', request.flag);
    }
    case 3:
      return VolumeNumberRequest(NameAt(kVolumePlace).hfsName);
    case 4:
      return VolumeNameRequest(request.volume);
    case 5:
      return HFSNameRequest(path, kRoomForAName);
    case 6:
      return AddNameRequest(path, request.hfsName, request.flag);
    case 7:
      return RecordRequest(path);
    case 8:
      return PathOfPartsRequest(request.volume, static_cast<std::int32_t>(request.folder),
                                request.hfsName, request.flag);
    case 9:
      return PathOfRecordRequest(
          Record(request.volume, static_cast<std::int32_t>(request.folder), request.hfsName),
          request.search, request.flag);
    default:
      return ExportSettingsRequest(kRateOfACD, 16, 2, "twos");
  }
}

std::string TextOf(const Request& request) {
  std::string text = "code " + std::to_string(request.code) + " path";
  for (std::size_t i = 0; i < request.path.count; ++i)
    text += "/" + std::string(NameAt(request.path.names[i]).linuxName);
  text += " volume " + std::to_string(request.volume) + " folder " +
          std::to_string(request.folder) + " name '" + request.hfsName + "'" +
          (request.search ? " search" : "") +
          (request.byOther ? " by the other volume's name" : "") + " room " +
          std::to_string(request.room) + (request.flag ? " flag" : "");
  return text;
}

}  // namespace tallowmere::soak
