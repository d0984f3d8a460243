// One request of every code about one item, for counting their costs.
#pragma once

#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <string>
#include <vector>

#include "support/TemporaryFolder.h"
#include "support/Wire.h"

namespace tallowmere::test {

// An existing item as the service knows it.
struct Item {
  std::string path;
  std::string folder;  // its parent
  std::string name;    // also its HFS name
  std::string record;  // 70 bytes
  std::int16_t volume;
  std::int32_t folderID;
  std::string volumeName;
  std::string fullPath;  // of the folder, in HFS form
};

// The requests' parameters: bytes for a full path, bytes of a name, a rate in hertz × 65536.
inline constexpr unsigned kRoomForAFullPath = 1024;
inline constexpr unsigned kRoomForAName = 64;
inline constexpr std::uint32_t kRateOfACD = 44100u << 16;

// The request with a code from 1 on, made from the fields of the item; fields that it does not use
// need not be known.
inline std::string RequestAbout(const Item& item, unsigned code) {
  const std::vector<std::string> requests{
      FullPathRequest(item.path, kRoomForAFullPath, 1),
      PathOfHFSPathRequest(item.fullPath + '\0', item.name + '\0', 0),
      VolumeNumberRequest(item.volumeName),
      VolumeNameRequest(item.volume),
      HFSNameRequest(item.path, kRoomForAName),
      AddNameRequest(item.folder, item.name, 0),
      RecordRequest(item.path),
      PathOfPartsRequest(item.volume, item.folderID, item.name, 0),
      PathOfRecordRequest(item.record, 0, 0),
      ExportSettingsRequest(kRateOfACD, 16, 2, "twos"),
  };
  return requests.at(code - 1);
}

// The right answer to it. REQUIRES: the item is a file; the code is not 10, whose answer does not
// depend on the item.
inline std::string AnswerAbout(const Item& item, unsigned code) {
  const std::vector<std::string> answers{
      FullPathResponse(item.fullPath, kRoomForAFullPath),
      ResultResponse(0, item.path),
      VolumeNumberResponse(item.volume),
      VolumeNameResponse(item.volumeName),
      NameResponse(1, item.name),
      PathResponse(item.path),
      RecordResponse(1, item.record),
      PathResponse(item.path),
      PathResponse(item.path),
  };
  return answers.at(code - 1);
}

// Asks a service about the item at a path. The item's name is also its HFS name; the record is
// empty when it has none.
inline Item LearnItem(Service& service, const std::string& path) {
  Item item{};
  item.path = path;
  item.name = std::filesystem::path(path).filename();
  item.folder = std::filesystem::path(path).parent_path();
  const std::string answer = service.Ask(RequestAbout(item, 7), 75);
  if (answer.size() != 75 || answer[0] != 1) return item;
  item.record = answer.substr(1, 70);
  std::memcpy(&item.volume, item.record.data(), sizeof item.volume);
  std::memcpy(&item.folderID, item.record.data() + sizeof item.volume, sizeof item.folderID);
  item.volumeName = service.NameOf(item.volume);
  const std::string fullPath = service.Ask(RequestAbout(item, 1), 2 + kRoomForAFullPath + 4);
  if (fullPath.size() > 2) item.fullPath = fullPath.c_str() + 2;
  return item;
}

// The number of components of the item's path, which some requests' costs depend on.
inline constexpr int kComponents = 6;

class EveryRequest {
 public:
  EveryRequest() {
    mItem.path = MakeFile(mFolder.Path());
    if (!IsMade()) return;
    Service service;
    mItem = LearnItem(service, mItem.path);
  }

  // False where the folder for temporary files is too deep.
  bool IsMade() const { return !mItem.path.empty(); }

  const std::string& Path() const { return mItem.path; }
  const std::string& VolumeName() const { return mItem.volumeName; }

  std::string Of(unsigned code) const { return RequestAbout(mItem, code); }

 private:
  // "/" counts as an element of the path here, so the folder has as many elements as the file is to
  // have components.
  static std::string MakeFile(std::filesystem::path folder) {
    while (std::distance(folder.begin(), folder.end()) < kComponents) folder /= "folder";
    if (std::distance(folder.begin(), folder.end()) > kComponents) return {};
    std::filesystem::create_directories(folder);
    std::ofstream{folder / "a track.aif"};
    return folder / "a track.aif";
  }

  TemporaryFolder mFolder;
  Item mItem{};
};

}  // namespace tallowmere::test
