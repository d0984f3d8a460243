// An item for requests to be about, and what may be answered to them while something fails.
#pragma once

#include <cstdint>
#include <filesystem>
#include <set>
#include <string>

namespace tallowmere::test {

using Answers = std::set<std::string>;

struct Question {
  std::string request;
  std::string right;  // the answer when nothing fails: a success, and about that very item
  Answers honest;     // what may be answered else
};

class Subject {
 public:
  // The path may begin with "~/". What a service says of the item that all requests are made of,
  // its record and its volume, is checked against the path. `created` is what an item is called
  // that is made by the HFS name of this one, `lossy` the HFS name that is told of something that
  // is not there. Where they are empty, both are the HFS name.
  explicit Subject(std::string path, std::string created = "", std::string lossy = "");

  // The request with a code from 1 to 10.
  Question Ask(unsigned code) const;

 private:
  void Learn();
  void LearnFullPaths();
  bool IsOnDisk() const;
  Question AskForPathOfHFSPath() const;
  std::string Folder() const { return mPath.parent_path().string(); }
  std::string NewItem() const;
  Answers FullPaths() const;
  Answers PathsOfHFSPath() const;
  Answers PathsOfFolderAndName() const;
  Answers Paths() const;
  Answers Records() const;

  std::string mSpelling;  // of the path, in requests
  std::filesystem::path mPath;
  std::string mCreated;
  std::string mLossy;
  std::string mRecord;
  std::string mName;
  std::int16_t mVolume = 0;
  std::int32_t mParent = 0;
  std::int16_t mVolumeAbove = 0;  // that of "/"
  std::string mVolumeName;
  std::string mFullPath;
  std::string mFullPathOfFolder;  // that holds it
};

}  // namespace tallowmere::test
