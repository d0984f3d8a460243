// The conversions whose answer is a path.
#include <utility>

#include "client/Conversions.h"
#include "client/FullPathRequest.h"
#include "client/NewNames.h"
#include "client/ParentIDs.h"
#include "client/Quoted.h"
#include "service/Protocol.h"

namespace tallowmere::conversion {
namespace {

using Path = Converted<std::string>;

Error Invalid(std::string message) {
  return {Outcome::kInvalid, std::move(message)};
}

// Right below "/", the service writes two slashes.
std::string Plain(std::string path) {
  if (path.starts_with("//")) path.erase(0, 1);
  return path;
}

class PathQuestion : public Inquiry {
 public:
  explicit PathQuestion(Handler<std::string> handler) : mHandler(std::move(handler)) {}

  void Tell(Exchange& exchange) final { mHandler(mError ? *std::move(mError) : Answer(exchange)); }

 protected:
  // REQUIRES: it has not been refused.
  virtual Conversion<std::string> Answer(Exchange& exchange) = 0;

  void Refuse(Error error) { mError = std::move(error); }

 private:
  Handler<std::string> mHandler;
  std::optional<Error> mError;
};

// --- by a record ---

class PathOfRecord final : public PathQuestion {
 public:
  PathOfRecord(Exchange& exchange, const FSSpec& record, bool searchOtherVolumes,
               Handler<std::string> handler)
      : PathQuestion(std::move(handler)),
        mRecord(record),
        mSearchesOtherVolumes(searchOtherVolumes) {
    Put(exchange);
  }

 private:
  void Put(Exchange& exchange) {
    if (auto reason = WhyNoHFSName(mRecord.name)) return Refuse(Invalid(*std::move(reason)));
    if (mRecord.name.size() > protocol::kLongestSpecName) {
      return Refuse(Invalid("the name in the record " + Text() + " has more than 63 bytes"));
    }
    exchange.Put(request::SetFileRefFromFSSpec(mRecord, mSearchesOtherVolumes), *this, mPath);
  }

  Conversion<std::string> Answer(Exchange& exchange) override {
    if (!*mPath) return mPath->Failure();
    if (!**mPath) return WhyNone(exchange);
    std::string path = Plain(**std::move(*mPath));
    // Where the volume or the folder is missing, the service takes such a name for a home folder.
    if (mRecord.name.front() == '~') {
      const auto record = exchange.AskNow(request::GetFSSpec(path));
      if (!record) return record.Failure();
      if (!*record || !IsMeant(**record)) return WhyNone(exchange);
    }
    const auto looked = LookAt(path);
    if (!looked) return looked.Failure();
    if (looked->exists) return Path{std::move(path), Outcome::kFound};
    if (LastNameOf(path) != LinuxNameOfHFSName(mRecord.name)) return WhyNone(exchange);
    return Path{std::move(path), Outcome::kNew};
  }

  // Whether the record of the answer is that of the item that was asked for.
  bool IsMeant(const FSSpec& record) const {
    return record.parID == mRecord.parID && record.name == mRecord.name &&
           (mSearchesOtherVolumes || mRecord.vRefNum == 0 || mRecord.vRefNum == record.vRefNum);
  }

  Error WhyNone(Exchange& exchange) const {
    const auto isVolume = exchange.IsVolume(mRecord.vRefNum);
    if (!isVolume) return isVolume.Failure();
    if (!*isVolume) {
      return {Outcome::kNotAVolume, "no volume has the number " + std::to_string(mRecord.vRefNum)};
    }
    return {Outcome::kNothing, "there is neither the item " + Text() + " nor a folder for it"};
  }

  std::string Text() const { return Quoted(TextOfFSSpec(mRecord)); }

  FSSpec mRecord;
  bool mSearchesOtherVolumes;
  std::optional<Result<std::optional<std::string>>> mPath;
};

// --- by an HFS name in a folder ---

class PathOfName final : public PathQuestion {
 public:
  PathOfName(Exchange& exchange, std::string_view folder, std::string_view name,
             Handler<std::string> handler)
      : PathQuestion(std::move(handler)), mName(name) {
    Put(exchange, folder);
  }

 private:
  void Put(Exchange& exchange, std::string_view folder) {
    if (auto reason = WhyNoHFSName(mName)) return Refuse(Invalid(*std::move(reason)));
    if (mName.size() > protocol::kLongestHFSPath) {
      return Refuse(
          Invalid("an HFS name has at most 63 bytes, this one " + std::to_string(mName.size())));
    }
    auto found = exchange.places.FindFolder(folder);
    if (!found) return Refuse(found.Failure());
    mFolder = *std::move(found);
    mLikely = mFolder->PathOf(LinuxNameOfHFSName(mName));
    exchange.Put(request::AddHFSName(mFolder->PathOrRoot(), mName), *this, mPath);
    exchange.Put(request::GetFSSpec(mLikely), *this, mRecord);
  }

  Conversion<std::string> Answer(Exchange& exchange) override {
    if (!*mPath) return mPath->Failure();
    if (!**mPath) return None();
    std::string path = Plain(**std::move(*mPath));
    if (path != mLikely && !IsInFolder(path)) return None();
    const auto looked = LookAt(path);
    if (!looked) return looked.Failure();
    if (path != mLikely) mRecord = exchange.AskNow(request::GetFSSpec(path));
    if (!*mRecord) return mRecord->Failure();
    const auto& record = **mRecord;
    if (!record || record->parID == kParentOnNoVolume) {
      return Error{Outcome::kNotAVolume, Quoted(path) + " is on no volume"};
    }
    if (looked->exists) return Path{std::move(path), Outcome::kFound};
    if (record->name != mName) {
      return Invalid("no new item can keep the HFS name " + Quoted(Utf8OfHFSName(mName)));
    }
    return Path{std::move(path), Outcome::kNew};
  }

  bool IsInFolder(const std::string& path) const {
    const std::string folder(FolderOf(path));
    return folder == mFolder->Path() || mFolder->IsAt(folder);
  }

  Error None() const {
    return {Outcome::kNothing, "nothing can have the HFS name " + Quoted(Utf8OfHFSName(mName)) +
                                   " in " + Quoted(mFolder->PathOrRoot())};
  }

  std::string mName;
  std::shared_ptr<Folder> mFolder;
  std::string mLikely;  // the path that it has unless it has but a short form, or other accents
  std::optional<Result<std::optional<std::string>>> mPath;
  std::optional<Result<std::optional<FSSpec>>> mRecord;  // of that path
};

// --- by a full HFS path ---

constexpr std::int16_t kNoSuchItem = -43;  // its folder is there
constexpr std::int16_t kNoSuchVolume = -35;
constexpr std::int16_t kImpossibleName = -37;
constexpr std::int16_t kNoSuchFolder = -120;
constexpr std::int16_t kNotPermitted = -5000;

class PathOfFullPath final : public PathQuestion {
 public:
  PathOfFullPath(Exchange& exchange, std::string_view hfsPath, Handler<std::string> handler)
      : PathQuestion(std::move(handler)), mHFSPath(hfsPath) {
    if (auto reason = WhyNone(hfsPath)) {
      Refuse(Invalid(*std::move(reason)));
    } else {
      exchange.Put(request::PathAndResult(hfsPath), *this, mPath);
    }
  }

 private:
  static std::optional<std::string> WhyNone(std::string_view hfsPath) {
    if (hfsPath.empty()) return "an empty HFS path names nothing";
    if (hfsPath.size() > protocol::kLongestHFSPath) return "an HFS path has at most 255 bytes";
    if (hfsPath.find('\0') != hfsPath.npos) return "an HFS path with a NUL names nothing";
    const std::size_t volume = hfsPath.find(protocol::kSeparator);
    if (volume != 0 && volume != hfsPath.npos) return std::nullopt;
    return "the HFS path " + Quoted(Utf8OfHFSName(hfsPath)) + " begins with no volume's name";
  }

  Conversion<std::string> Answer(Exchange& exchange) override {
    if (!*mPath) return mPath->Failure();
    auto& [code, path] = **mPath;
    if (code != 0) return WithoutItem(exchange, code);
    path = Plain(std::move(path));
    const auto looked = LookAt(path);
    if (!looked) return looked.Failure();
    if (!looked->exists) return Failed(kNoSuchItem);
    return Path{std::move(path), Outcome::kFound};
  }

  Conversion<std::string> WithoutItem(Exchange& exchange, std::int16_t code) {
    std::string_view hfsPath = mHFSPath;
    if (hfsPath.ends_with(protocol::kSeparator)) hfsPath.remove_suffix(1);
    const std::size_t end = hfsPath.rfind(protocol::kSeparator);
    if (code == kNoSuchVolume) return InterfaceOrNone(exchange);
    if (code != kNoSuchItem || end == hfsPath.npos) return Failed(code);
    const std::string_view name = hfsPath.substr(end + 1);
    if (WhyNoHFSName(name)) return Failed(code);
    auto folder = exchange.AskNow(request::PathAndResult(hfsPath.substr(0, end + 1)));
    if (!folder) return folder.Failure();
    if (folder->code != 0) return Failed(code);
    return New(exchange, Plain(std::move(folder->path)), name);
  }

  // The folder of a kernel interface is found without the colon at its end.
  Conversion<std::string> InterfaceOrNone(Exchange& exchange) const {
    std::string_view hfsPath = mHFSPath;
    if (!hfsPath.ends_with(protocol::kSeparator)) return WithoutVolume(exchange);
    hfsPath.remove_suffix(1);
    // A path without a colon begins in the current folder; one that still ends with a colon climbs.
    if (WhyNone(hfsPath) || hfsPath.ends_with(protocol::kSeparator)) return WithoutVolume(exchange);
    auto answer = exchange.AskNow(request::PathAndResult(hfsPath));
    if (!answer) return answer.Failure();
    if (answer->code != 0) return WithoutVolume(exchange);
    std::string path = Plain(std::move(answer->path));
    const auto looked = LookAt(path);
    if (!looked) return looked.Failure();
    if (!looked->isFolder) return WithoutVolume(exchange);
    return Path{std::move(path), Outcome::kFound};
  }

  // The service says "no such volume" of what is in a kernel interface, too.
  Error WithoutVolume(Exchange& exchange) const {
    const std::string name = mHFSPath.substr(0, mHFSPath.find(protocol::kSeparator));
    const auto number = exchange.AskNow(request::GetVolRefnumByHFSName(name));
    if (!number) return number.Failure();
    if (*number) return {Outcome::kNotAVolume, Text() + " is on no volume"};
    return {Outcome::kNotAVolume, "no volume is called " + Quoted(Utf8OfHFSName(name))};
  }

  // The path that a new item would have; right when its record has the item's name.
  Conversion<std::string> New(Exchange& exchange, const std::string& folder,
                              std::string_view name) {
    std::string path = (folder == "/" ? "" : folder) + '/' + LinuxNameOfHFSName(name);
    const auto looked = LookAt(path);
    if (!looked) return looked.Failure();
    if (looked->exists) {
      return Error{Outcome::kAmbiguous, "not only " + Quoted(path) + " could be meant"};
    }
    const auto record = exchange.AskNow(request::GetFSSpec(path));
    if (!record) return record.Failure();
    if (!*record || (*record)->parID == kParentOnNoVolume) {
      return Error{Outcome::kNotAVolume, Quoted(path) + " is on no volume"};
    }
    if ((*record)->name != name) {
      return Invalid("no new item can keep the HFS name " + Quoted(Utf8OfHFSName(name)));
    }
    return Path{std::move(path), Outcome::kNew};
  }

  Error Failed(std::int16_t code) const {
    switch (code) {
      case kNoSuchItem:
      case kNoSuchFolder:
        return {Outcome::kNothing, "there is neither the item " + Text() + " nor a folder for it"};
      case kImpossibleName:
        return Invalid("no item can have the HFS path " + Text());
      case kNotPermitted:
        return {Outcome::kRefused, "the way to " + Text() + " is not permitted"};
      default:
        return {Outcome::kRefused, "the system fails on the way to " + Text()};
    }
  }

  std::string Text() const { return Quoted(Utf8OfHFSName(mHFSPath)); }

  std::string mHFSPath;
  std::optional<Result<answer::PathByResult>> mPath;
};

}  // namespace

std::unique_ptr<Inquiry> PathOf(Exchange& exchange, const FSSpec& record, bool searchOtherVolumes,
                                Handler<std::string> handler) {
  return std::make_unique<PathOfRecord>(exchange, record, searchOtherVolumes, std::move(handler));
}

std::unique_ptr<Inquiry> PathInFolder(Exchange& exchange, std::string_view folder,
                                      std::string_view hfsName, Handler<std::string> handler) {
  return std::make_unique<PathOfName>(exchange, folder, hfsName, std::move(handler));
}

std::unique_ptr<Inquiry> PathOfHFSPath(Exchange& exchange, std::string_view hfsPath,
                                       Handler<std::string> handler) {
  return std::make_unique<PathOfFullPath>(exchange, hfsPath, std::move(handler));
}

}  // namespace tallowmere::conversion
