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
  Answers honest;  // what may be answered beside the right answer
};

class Subject {
 public:
  // `created` is what an item is called that is made by the HFS name of this one, `lossy` the HFS
  // name that is told of something that is not there. Where they are empty, both are the HFS name.
  explicit Subject(std::filesystem::path path, std::string created = "", std::string lossy = "");

  // The request with a code from 1 to 10.
  Question Ask(unsigned code) const;

 private:
  std::string Folder() const { return mPath.parent_path().string(); }
  std::string NewItem() const;
  Answers FullPaths() const;
  Answers PathsOfHFSPath() const;
  Answers PathsOfFolderAndName() const;
  Answers Paths() const;
  Answers Records() const;

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
};

// Whether a response is the beginning of one of the answers, without its end.
bool BeginsOneOf(const Answers& answers, const std::string& response);

}  // namespace tallowmere::test
