// The conversions of an item's path. Each begins with the item's record, which has its HFS name and
// tells whether it is on a volume.
#include <climits>
#include <utility>

#include "client/Conversions.h"
#include "client/NewNames.h"
#include "client/ParentIDs.h"
#include "client/Quoted.h"
#include "service/Protocol.h"

namespace tallowmere::conversion {
namespace {

// The service leaves the outermost folders that do not fit into this out of a full path.
constexpr std::size_t kMostBytesOfFolders = 511;
// A folder in it: a name of Linux, and a colon.
constexpr std::size_t kLongestFolder = NAME_MAX + 1;

Error OnNoVolume(const std::string& path) {
  return {Outcome::kNotAVolume, Quoted(path) + " is on no volume"};
}

Error CannotComeBack(const std::string& path, const std::string& reason) {
  return {Outcome::kInvalid, "the name of the new item " + Quoted(path) + ' ' + reason};
}

Error IsAnothers(const std::string& path) {
  return {Outcome::kAmbiguous,
          "the new item " + Quoted(path) + " would have the HFS name of another item"};
}

// Why a new item would not be found again under its HFS name, as far as its name tells.
std::optional<Error> WhyNotNew(const Place& place) {
  const auto name = HFSNameOfLinuxName(place.Name());
  if (!name) return CannotComeBack(place.path, "has a character that HFS names cannot have");
  if (name->size() > protocol::kLongestSpecName) {
    return CannotComeBack(place.path, "is longer than the 63 characters of HFS names");
  }
  const std::string back = LinuxNameOfHFSName(*name);
  if (back == place.Name()) return std::nullopt;
  const auto other = LookAt(*place.folder, back);
  if (other && other->exists) return IsAnothers(place.path);
  return CannotComeBack(place.path, "comes back with its accents written otherwise");
}

template <class T>
class ItemQuestion : public Inquiry {
 public:
  ItemQuestion(Exchange& exchange, std::string_view path, Handler<T> handler)
      : mPlace(exchange.places.Find(path)), mHandler(std::move(handler)) {
    if (mPlace && !mPlace->exists) {
      if (auto error = WhyNotNew(*mPlace)) mPlace = *std::move(error);
    }
    if (mPlace) exchange.Put(request::GetFSSpec(mPlace->path), *this, mRecord);
  }

  void Tell(Exchange& exchange) override {
    auto record = Record(exchange);
    if (!record) return mHandler(record.Failure());
    const Outcome outcome = mPlace->exists ? Outcome::kFound : Outcome::kNew;
    auto value = ValueOf(exchange, *std::move(record));
    if (!value) return mHandler(value.Failure());
    mHandler(Converted<T>{*std::move(value), outcome});
  }

 protected:
  // REQUIRES: it has been found.
  const Place& GetPlace() const { return *mPlace; }
  bool HasPlace() const { return mPlace.HasValue(); }
  // Whether it has turned out to be the root folder of a volume.
  bool IsRootOfVolume() const {
    return HasPlace() && mPlace->isFolder && mRecord && *mRecord && **mRecord &&
           (**mRecord)->parID == kParentOfRoots;
  }

  virtual Result<T> ValueOf(Exchange& exchange, FSSpec record) = 0;

 private:
  Result<FSSpec> Record(Exchange& exchange) {
    if (!mPlace) return mPlace.Failure();
    if (!*mRecord) return mRecord->Failure();
    auto& record = **mRecord;
    if (!record || record->parID == kParentOnNoVolume) return OnNoVolume(mPlace->path);
    if (!mPlace->exists && MayBeAnothersName(mPlace->Name())) {
      const auto wayBack = exchange.AskNow(request::SetFileRefFromFSSpec(*record, false));
      if (!wayBack) return wayBack.Failure();
      if (!*wayBack) return OnNoVolume(mPlace->path);
      if (LastNameOf(**wayBack) != mPlace->Name()) return IsAnothers(mPlace->path);
    }
    return *std::move(record);
  }

  Result<Place> mPlace;
  std::optional<Result<std::optional<FSSpec>>> mRecord;
  Handler<T> mHandler;
};

class RecordQuestion final : public ItemQuestion<FSSpec> {
 public:
  using ItemQuestion::ItemQuestion;

 private:
  Result<FSSpec> ValueOf(Exchange& /*exchange*/, FSSpec record) override { return record; }
};

class NameQuestion final : public ItemQuestion<std::string> {
 public:
  using ItemQuestion::ItemQuestion;

 private:
  Result<std::string> ValueOf(Exchange& /*exchange*/, FSSpec record) override {
    return std::move(record.name);
  }
};

class HFSPathQuestion final : public ItemQuestion<std::string> {
 public:
  HFSPathQuestion(Exchange& exchange, std::string_view path, Handler<std::string> handler)
      : ItemQuestion(exchange, path, std::move(handler)) {
    if (!HasPlace()) return;
    exchange.PutFullPathOf(GetPlace().folder);
    if (GetPlace().isFolder) exchange.Put(request::MakeFullPath(GetPlace().path), *this, mOwn);
  }

  // A root folder's HFS path does not depend on the folder above, which may be in a kernel
  // interface.
  bool IsAnswered() const override {
    return ItemQuestion::IsAnswered() &&
           (!HasPlace() || IsRootOfVolume() || GetPlace().folder->fullPath);
  }

 private:
  Result<std::string> ValueOf(Exchange& exchange, FSSpec record) override {
    if (record.parID == kParentOfRoots && mOwn) return OfRoot(exchange);
    if (mOwn && !*mOwn) return mOwn->Failure();
    const auto& holder = *GetPlace().folder->fullPath;
    if (!mOwn) {
      if (!holder) return holder.Failure();
      return Whole(exchange, *holder + record.name, *holder, FolderOf(GetPlace().path));
    }
    std::string path = holder ? *holder + record.name + protocol::kSeparator : "";
    if (**mOwn == path || (holder && IsLongAndNamedAsHere(record.name))) {
      return Whole(exchange, **mOwn, **mOwn, GetPlace().path);
    }
    return OfMountPoint(exchange, holder, std::move(path));
  }

  // Whether the folder's own path is too long to ask about and ends with the folder's name, which
  // the record may have in its short form.
  bool IsLongAndNamedAsHere(const std::string& recordName) const {
    std::string_view own = **mOwn;
    if (own.size() <= protocol::kLongestHFSPath) return false;
    own.remove_suffix(1);
    const std::string_view name = own.substr(own.rfind(protocol::kSeparator) + 1);
    return name == recordName || name == HFSNameOfLinuxName(GetPlace().Name());
  }

  // Something is mounted on the folder that is no volume of its own. The service gives the path
  // where it is mounted first, and for a kernel interface the path of the folder that holds that
  // one. Where this leads elsewhere, the folder has its path as an item of its holder.
  Result<std::string> OfMountPoint(Exchange& exchange, const Result<std::string>& holder,
                                   std::string path) {
    const std::string& place = GetPlace().path;
    const std::string& first = **mOwn;
    const bool isKnown = first.size() <= protocol::kLongestHFSPath;
    if (isKnown && !exchange.WhyNotBack(first, place)) return first;
    if (!holder) return holder.Failure();
    // The folder of a kernel interface is found without the colon at its end.
    const std::string_view withoutColon = std::string_view(path).substr(0, path.size() - 1);
    if (auto error = exchange.WhyNotBack(std::string(withoutColon), place)) {
      return *std::move(error);
    }
    return Whole(exchange, std::move(path), *holder, FolderOf(place));
  }

  Result<std::string> OfRoot(Exchange& exchange) {
    if (!*mOwn) return mOwn->Failure();
    if (auto error = exchange.WhyNotBack(**mOwn, GetPlace().path)) return *std::move(error);
    return **mOwn;
  }

  // The path, unless the service has left something out of the full path of `folder`, with which it
  // begins.
  Result<std::string> Whole(Exchange& exchange, std::string path, std::string fullPath,
                            std::string_view folder) {
    const Error tooLong{Outcome::kInvalid,
                        "the HFS path of " + Quoted(GetPlace().path) + " is longer than 511 bytes"};
    if (path.size() > kMostBytesOfFolders) return tooLong;
    while (LengthOfFolders(fullPath) > kMostBytesOfFolders - kLongestFolder) {
      folder = FolderOf(folder);
      auto outer = exchange.AskNow(request::MakeFullPath(folder.empty() ? "/" : folder));
      if (!outer) return outer.Failure();
      if (!fullPath.starts_with(*outer)) return tooLong;
      fullPath = *std::move(outer);
    }
    return path;
  }

  static std::size_t LengthOfFolders(std::string_view fullPath) {
    return fullPath.size() - fullPath.find(protocol::kSeparator) - 1;
  }

  std::optional<Result<std::string>> mOwn;  // of a folder: its own full path
};

}  // namespace

std::unique_ptr<Inquiry> RecordOf(Exchange& exchange, std::string_view path,
                                  Handler<FSSpec> handler) {
  return std::make_unique<RecordQuestion>(exchange, path, std::move(handler));
}

std::unique_ptr<Inquiry> HFSNameOf(Exchange& exchange, std::string_view path,
                                   Handler<std::string> handler) {
  return std::make_unique<NameQuestion>(exchange, path, std::move(handler));
}

std::unique_ptr<Inquiry> HFSPathOf(Exchange& exchange, std::string_view path,
                                   Handler<std::string> handler) {
  return std::make_unique<HFSPathQuestion>(exchange, path, std::move(handler));
}

}  // namespace tallowmere::conversion
