// An item for requests to be about, and the answers that are allowed while something fails.
#pragma once

#include <cstdint>
#include <filesystem>
#include <set>
#include <string>

namespace tallowmere::test {

using Answers = std::set<std::string>;

struct Question {
  std::string request;
  std::string right;  // the answer when nothing fails: a success, about exactly this item
  Answers honest;     // the other answers that are allowed
};

class Subject {
 public:
  // The path may begin with "~/". What a service reports about the item for use in all requests,
  // its record and its volume, is checked against the path. `created` is the Linux name of an item
  // made by this one's HFS name, `lossy` the HFS name reported for an item that does not exist.
  // Where empty, both are the HFS name.
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

  std::string mSpelling;  // the path as requests spell it
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
  std::string mFullPathOfFolder;  // of its parent
};

}  // namespace tallowmere::test
