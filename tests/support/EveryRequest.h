// One request of every code about one item, for counting what each of them takes.
#pragma once

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

// The number of components of the item's path: some requests cost by it.
inline constexpr int kComponents = 6;

class EveryRequest {
 public:
  EveryRequest() : mFile(MakeFile(mFolder.Path())) {
    if (mFile.empty()) return;
    Service service;
    mRecord = service.Ask(RecordRequest(mFile), 75).substr(1, 70);
    std::memcpy(&mVolume, mRecord.data(), sizeof mVolume);
    std::memcpy(&mParent, mRecord.data() + sizeof mVolume, sizeof mParent);
    mVolumeName = service.NameOf(mVolume);
    const std::string answer = service.Ask(FullPathRequest(mFile, 1024, 1), 2 + 1024 + 4);
    mFullPath = answer.c_str() + 2;
  }

  // Not where the folder for temporary files is too deep.
  bool IsMade() const { return !mFile.empty(); }

  const std::string& Path() const { return mFile; }
  const std::string& VolumeName() const { return mVolumeName; }

  // The request with a code from 1.
  std::string Of(unsigned code) const {
    const std::string name = mFile.substr(mFile.rfind('/') + 1);
    const std::string folder = mFile.substr(0, mFile.rfind('/'));
    const std::vector<std::string> requests{
        FullPathRequest(mFile, 1024, 1),
        PathOfHFSPathRequest(mFullPath + '\0', name + '\0', 0),
        VolumeNumberRequest(mVolumeName),
        VolumeNameRequest(mVolume),
        HFSNameRequest(mFile, 64),
        AddNameRequest(folder, name, 0),
        RecordRequest(mFile),
        PathOfPartsRequest(mVolume, mParent, name, 0),
        PathOfRecordRequest(mRecord, 0, 0),
        ExportSettingsRequest(44100u << 16, 16, 2, "twos"),
    };
    return requests.at(code - 1);
  }

 private:
  // "/" counts as one element of a path here, so that the folder has as many as the file is to
  // have.
  static std::string MakeFile(std::filesystem::path folder) {
    while (std::distance(folder.begin(), folder.end()) < kComponents) folder /= "folder";
    if (std::distance(folder.begin(), folder.end()) > kComponents) return {};
    std::filesystem::create_directories(folder);
    std::ofstream{folder / "a track.aif"};
    return folder / "a track.aif";
  }

  TemporaryFolder mFolder;
  std::string mFile;
  std::string mRecord;
  std::int16_t mVolume = 0;
  std::int32_t mParent = 0;
  std::string mVolumeName;
  std::string mFullPath;
};

}  // namespace tallowmere::test
