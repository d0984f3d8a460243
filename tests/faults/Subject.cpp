#include "faults/Subject.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <utility>

#include "faults/TwoVolumeRoot.h"
#include "support/AtomReader.h"
#include "support/EveryRequest.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

constexpr int kNoVolume = 32767;
constexpr int kNoFolder = -1;
constexpr int kParentOfRoots = 1;
constexpr int kRootFolder = 2;
// The name of the volume of "/" without a label, and for a process that may not read that folder.
const std::string kUnknownLabel = "Root";

// Converts an HFS name whose only letters are those of ASCII and this one.
std::string InUtf8(std::string name) {
  for (std::size_t at = 0; (at = name.find('\x8E', at)) != std::string::npos;) {
    name.replace(at, 1, "\u00E9");
  }
  return name;
}

std::string WithTrailer(std::string fields) {
  return fields.append(kTrailer);
}

// An error on the way up leaves out the folders further up, and the volume's name may be missing.
void AddShortened(const std::string& fullPath, Answers& answers) {
  const std::size_t end = fullPath.find(':') + 1;
  for (std::size_t from = end; from != 0; from = fullPath.find(':', from) + 1) {
    const std::string folders = fullPath.substr(from);
    answers.insert(FullPathResponse(fullPath.substr(0, end) + folders, kRoomForAFullPath));
    answers.insert(FullPathResponse(":" + folders, kRoomForAFullPath));
  }
}

// The exporter's settings for a sound, which do not depend on the item. Empty when they are not
// those of the sound.
std::string Settings(const std::string& request, const Atom& settings) {
  Service service;
  std::string head = service.Ask(request, sizeof(std::int16_t) + sizeof(std::uint32_t));
  head.resize(sizeof(std::int16_t) + sizeof(std::uint32_t));
  std::uint32_t size = 0;
  std::memcpy(&size, head.data() + sizeof(std::int16_t), sizeof size);
  const std::string container = service.Read(size);
  return ReadAtomContainer(container) == settings ? WithTrailer(head + container) : "";
}

// A path with the home folder in place of "~".
std::filesystem::path SpelledOut(const std::string& path) {
  return path.starts_with('~') ? TwoVolumeRoot::kHome + path.substr(path.find('/')) : path;
}

}  // namespace

Subject::Subject(std::string path, std::string created, std::string lossy)
    : mSpelling(std::move(path)),
      mPath(SpelledOut(mSpelling)),
      mCreated(std::move(created)),
      mLossy(std::move(lossy)) {
  Learn();
  LearnFullPaths();
  if (mCreated.empty()) mCreated = InUtf8(mName);
  if (mLossy.empty()) mLossy = mName;
}

void Subject::Learn() {
  Service service;
  mRecord = service.Ask(RecordRequest(mPath.string()), 1 + 70 + kTrailer.size()).substr(1, 70);
  std::memcpy(&mVolume, mRecord.data(), sizeof mVolume);
  std::memcpy(&mParent, mRecord.data() + sizeof mVolume, sizeof mParent);
  const std::string above = service.Ask(RecordRequest("/"), 1 + 70 + kTrailer.size());
  std::memcpy(&mVolumeAbove, above.data() + 1, sizeof mVolumeAbove);
  mName = mRecord.substr(7, static_cast<unsigned char>(mRecord[6]));
  mVolumeName = service.NameOf(mVolume);
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(mRecord, 0, 0), PathResponse(mPath.string())))
      << "the record leads elsewhere than to " << mPath;
}

// From the path alone: the names of the folders in the requested full paths are also HFS names.
void Subject::LearnFullPaths() {
  const std::string top = IsOnDisk() ? TwoVolumeRoot::kDisk : "/";
  const std::string label = IsOnDisk() ? top.substr(1) : TwoVolumeRoot::kLabel;
  EXPECT_TRUE(mVolumeName == label || (!IsOnDisk() && mVolumeName == kUnknownLabel));
  const auto inHFSForm = [&](const std::filesystem::path& folder) {
    std::string names = folder.lexically_relative(top).string() + "/";
    std::replace(names.begin(), names.end(), '/', ':');
    return mVolumeName + ":" + (folder == top ? "" : names);
  };
  mFullPathOfFolder = mPath == top ? "" : inHFSForm(mPath.parent_path());
  mFullPath = std::filesystem::is_directory(mPath) ? inHFSForm(mPath) : mFullPathOfFolder;
}

bool Subject::IsOnDisk() const {
  return mPath.string().starts_with(TwoVolumeRoot::kDisk);
}

Question Subject::Ask(unsigned code) const {
  const bool isThere = std::filesystem::exists(mPath);
  const std::string answer = PathResponse(mPath.string());
  switch (code) {
    case 1:
      return {FullPathRequest(mSpelling, kRoomForAFullPath, 1),
              FullPathResponse(mFullPath, kRoomForAFullPath), FullPaths()};
    case 2:
      return AskForPathOfHFSPath();
    case 3:
      return {VolumeNumberRequest(mVolumeName),
              VolumeNumberResponse(mVolume),
              {VolumeNumberResponse(kNoVolume)}};
    case 4:
      return {VolumeNameRequest(mVolume),
              VolumeNameResponse(mVolumeName),
              {kNoVolumeNameResponse, VolumeNameResponse(kUnknownLabel)}};
    case 5:
      return {HFSNameRequest(mSpelling, kRoomForAName),
              isThere ? NameResponse(1, mName) : NameResponse(0, ""),
              {NameResponse(0, "")}};
    case 6:
      return {AddNameRequest(Folder(), mName, 0), answer, PathsOfFolderAndName()};
    case 7:
      return {RecordRequest(mSpelling), RecordResponse(1, mRecord), Records()};
    case 8:
      return {PathOfPartsRequest(mVolume, mParent, mName, 0), answer, Paths()};
    case 9:
      return {PathOfRecordRequest(mRecord, 0, 0), answer, Paths()};
    default:
      const std::string request = ExportSettingsRequest(kRateOfACD, 16, 2, "twos");
      return {request,
              Settings(request, SettingsOf("twos", kRateOfACD, 16, 2)),
              {WithTrailer(I16(kResultNoMemory) + U32(0))}};
  }
}

// A volume has no parent folder, and is requested without a name.
Question Subject::AskForPathOfHFSPath() const {
  const bool isRoot = mFullPathOfFolder.empty();
  const std::string folder = isRoot ? mFullPath : mFullPathOfFolder;
  const std::string name = isRoot ? "" : mName + '\0';
  return {PathOfHFSPathRequest(folder + '\0', name, 0), ResultResponse(0, mPath.string()),
          PathsOfHFSPath()};
}

// The path of a new item with the same HFS name.
std::string Subject::NewItem() const {
  return Folder() + "/" + mCreated;
}

// A folder that is not recognised as one has the full path of its parent.
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
  for (const int result :
       {kResultNoItem, kResultNoFolder, kResultNoVolume, kResultNotPermitted, kResultSystemError}) {
    answers.insert(ResultResponse(result));
  }
  return answers;
}

Answers Subject::PathsOfFolderAndName() const {
  Answers answers = Paths();
  answers.insert(WithTrailer(Flag(0) + CString(Folder())));
  return answers;
}

Answers Subject::Paths() const {
  return {kNoPathResponse, kNoItemResponse, PathResponse(NewItem())};
}

// The root of a volume that is not recognised as one counts as an item in its parent.
Answers Subject::Records() const {
  Answers answers{RecordResponse(0, kEmptyRecord), RecordResponse(0, Record(mVolume, mParent, "")),
                  RecordResponse(0, Record(kNoVolume, kNoFolder, mLossy)),
                  RecordResponse(1, Record(mVolume, mParent, mLossy))};
  const bool isRoot = mParent == kParentOfRoots;
  if (isRoot) answers.insert(RecordResponse(1, Record(mVolumeAbove, kRootFolder, mName)));
  return answers;
}

}  // namespace tallowmere::test
