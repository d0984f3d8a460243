#include "faults/Subject.h"

#include <algorithm>
#include <cstring>
#include <string_view>
#include <utility>

#include "support/Wire.h"

namespace tallowmere::test {
namespace {

constexpr unsigned kPathRoom = 1024;
constexpr unsigned kNameRoom = 64;
constexpr int kNoVolume = 32767;
constexpr int kNoFolder = -1;
constexpr int kParentOfRoots = 1;
constexpr int kRootFolder = 2;
// The name of the volume of "/" for whoever may not read that folder.
const std::string kUnknownLabel = "Root";

constexpr int kNoMemory = -108;

// An HFS name without other letters than those of ASCII and this one.
std::string InUtf8(std::string name) {
  for (std::size_t at = 0; (at = name.find('\x8E', at)) != std::string::npos;) {
    name.replace(at, 1, "\u00E9");
  }
  return name;
}

std::string WithTrailer(std::string fields) {
  return fields.append(kTrailer);
}

std::string FullPathResponse(std::string path) {
  const auto length = static_cast<unsigned>(path.size());
  path.resize(kPathRoom);
  return WithTrailer(U16(length) + path);
}

// An error on the way up leaves out the folders further up, and a volume can be without its name.
void AddShortened(const std::string& fullPath, Answers& answers) {
  const std::size_t end = fullPath.find(':') + 1;
  for (std::size_t from = end; from != 0; from = fullPath.find(':', from) + 1) {
    const std::string folders = fullPath.substr(from);
    answers.insert(FullPathResponse(fullPath.substr(0, end) + folders));
    answers.insert(FullPathResponse(":" + folders));
  }
}

}  // namespace

Subject::Subject(std::filesystem::path path, std::string created, std::string lossy)
    : mPath(std::move(path)), mCreated(std::move(created)), mLossy(std::move(lossy)) {
  Service service;
  mRecord = service.Ask(RecordRequest(mPath.string()), 1 + 70 + kTrailer.size()).substr(1, 70);
  std::memcpy(&mVolume, mRecord.data(), sizeof mVolume);
  std::memcpy(&mParent, mRecord.data() + sizeof mVolume, sizeof mParent);
  const std::string above = service.Ask(RecordRequest("/"), 1 + 70 + kTrailer.size());
  std::memcpy(&mVolumeAbove, above.data() + 1, sizeof mVolumeAbove);
  mName = mRecord.substr(7, static_cast<unsigned char>(mRecord[6]));
  mVolumeName = service.NameOf(mVolume);
  const std::string answer =
      service.Ask(FullPathRequest(mPath.string(), kPathRoom, 1), 2 + kPathRoom + kTrailer.size());
  mFullPath = answer.c_str() + 2;
  if (mCreated.empty()) mCreated = InUtf8(mName);
  if (mLossy.empty()) mLossy = mName;
}

Question Subject::Ask(unsigned code) const {
  const std::string path = mPath.string();
  switch (code) {
    case 1:
      return {FullPathRequest(path, kPathRoom, 1), FullPaths()};
    case 2:
      return {PathOfHFSPathRequest(mFullPath + '\0', mName + '\0', 0), PathsOfHFSPath()};
    case 3:
      return {VolumeNumberRequest(mVolumeName), {VolumeNumberResponse(kNoVolume)}};
    case 4:
      return {VolumeNameRequest(mVolume),
              {kNoVolumeNameResponse, VolumeNameResponse(kUnknownLabel)}};
    case 5:
      return {HFSNameRequest(path, kNameRoom), {NameResponse(0, "")}};
    case 6:
      return {AddNameRequest(Folder(), mName, 0), PathsOfFolderAndName()};
    case 7:
      return {RecordRequest(path), Records()};
    case 8:
      return {PathOfPartsRequest(mVolume, mParent, mName, 0), Paths()};
    case 9:
      return {PathOfRecordRequest(mRecord, 0, 0), Paths()};
    default:
      return {ExportSettingsRequest(44100U << 16, 16, 2, "twos"),
              {WithTrailer(I16(kNoMemory) + U32(0))}};
  }
}

// Where a new item with the same HFS name would be.
std::string Subject::NewItem() const {
  return Folder() + "/" + mCreated;
}

// A folder that is not seen to be one has the full path of the folder that holds it.
Answers Subject::FullPaths() const {
  Answers answers;
  AddShortened(mFullPath, answers);
  const bool isOnTop = mVolume == mVolumeAbove;
  if (isOnTop) AddShortened(kUnknownLabel + mFullPath.substr(mFullPath.find(':')), answers);
  const std::size_t colon = mFullPath.rfind(':', mFullPath.size() - 2);
  const bool isBelow = colon != std::string::npos && std::filesystem::is_directory(mPath);
  if (isBelow) AddShortened(mFullPath.substr(0, colon + 1), answers);
  return answers;
}

Answers Subject::PathsOfHFSPath() const {
  Answers answers{ResultResponse(0), ResultResponse(0, NewItem())};
  for (const int error : {-43, -120, -35, -5000, -36}) answers.insert(ResultResponse(error));
  return answers;
}

Answers Subject::PathsOfFolderAndName() const {
  Answers answers = Paths();
  answers.insert(WithTrailer(Flag(0) + CString(Folder())));
  return answers;
}

Answers Subject::Paths() const {
  return {kNoPathResponse, WithTrailer(Flag(1) + U16(0)), PathResponse(NewItem())};
}

// The root of a volume that is not known to be one is an item of the folder that holds it.
Answers Subject::Records() const {
  Answers answers{RecordResponse(0, kEmptyRecord), RecordResponse(0, Record(mVolume, mParent, "")),
                  RecordResponse(0, Record(kNoVolume, kNoFolder, mLossy)),
                  RecordResponse(1, Record(mVolume, mParent, mLossy))};
  const bool isRoot = mParent == kParentOfRoots;
  if (isRoot) answers.insert(RecordResponse(1, Record(mVolumeAbove, kRootFolder, mName)));
  return answers;
}

bool BeginsOneOf(const Answers& answers, const std::string& response) {
  return std::any_of(answers.begin(), answers.end(), [&](const std::string& answer) {
    return response.size() < answer.size() && answer.starts_with(response);
  });
}

}  // namespace tallowmere::test
