#include <sys/stat.h>

#include <cstdint>
#include <filesystem>
#include <iostream>
#include <optional>
#include <string>
#include <system_error>
#include <utility>

#include "cli/Commands.h"
#include "cli/Output.h"
#include "cli/ProgressBar.h"
#include "cli/SameItem.h"
#include "cli/Text.h"
#include "cli/TreeWalk.h"

namespace tallowmere::cli {
namespace {

// The parent id of an item on no volume; never an item's own id.
constexpr std::int32_t kParentOnNoVolume = 3;

constexpr const char* kAnyItem = "/any";

bool IsSame(const struct stat& first, const struct stat& second) {
  return first.st_dev == second.st_dev && first.st_ino == second.st_ino;
}

bool IsAt(const std::string& path, const struct stat& item) {
  struct stat found {};
  return lstat(path.c_str(), &found) == 0 && IsSame(found, item);
}

// Asks one service for the record of each item and another for the path of that record.
class Census {
 public:
  Census(const ClientOptions& options, const Format& format)
      : mRecords(options),
        mPaths(options),
        mIsJson(format.isJson),
        mBar(!format.isQuiet && !format.hasNoProgress) {}

  // Returns whether the services still answer.
  bool Count(const std::string& path, const struct stat& item, double done) {
    ++mItems;
    auto trouble = TroubleWith(path);
    // Asks again, as somebody may have moved the item, or a folder above it, between the two
    // questions.
    if (trouble && IsAt(path, item)) trouble = TroubleWith(path);
    if (mFailure) return false;
    if (!trouble) {
      ++mBack;
    } else if (!IsAt(path, item)) {
      ++mVanished;
    } else {
      Print(path, *trouble);
    }
    mBar.Show(done, std::to_string(mItems) + " items");
    return true;
  }

  // Whether a folder that was just seen is on a volume. If it is not, its items have no record, or
  // one that leads nowhere.
  bool IsOnVolume(const std::string& path, const struct stat& folder) {
    const auto record = mRecords.GetFSSpec((path == "/" ? "" : path) + kAnyItem);
    if (!record) Fail(record.Failure());
    const bool leadsBack = record && *record && (*record)->parID != kParentOnNoVolume;
    return !record || leadsBack || !IsAt(path, folder);
  }

  void LeaveOut(const std::string& path, const std::string& reason) {
    ++mLeftOut;
    Print(path, "left out, " + reason);
  }

  // Returns the program's exit status.
  int Finish() {
    mBar.Hide();
    if (mFailure) return Complain(mFailure->message);
    const std::uint64_t missing = mItems - mBack - mVanished;
    if (mIsJson) {
      PrintFiguresAsJson(missing);
    } else {
      std::cout << mItems << " items, " << mBack << " came back, " << missing << " did not, "
                << mVanished << " vanished meanwhile, " << mLeftOut << " left out\n";
    }
    return FinishOutput(missing == 0 ? 0 : kFailed);
  }

 private:
  // The reason why the item did not come back; nullopt when it did.
  std::optional<std::string> TroubleWith(const std::string& path) {
    const auto record = mRecords.GetFSSpec(path);
    if (!record) return Fail(record.Failure());
    if (!*record) return "has no record";
    const auto back = mPaths.SetFileRefFromFSSpec(**record, false);
    if (!back) return Fail(back.Failure());
    if (!*back) return "its record leads nowhere";
    if (!IsSameItem(**back, path)) return "came back as " + **back;
    return std::nullopt;
  }

  std::string Fail(const Error& error) {
    mFailure = error;
    return error.message;
  }

  void Print(const std::string& path, const std::string& remark) {
    mBar.Hide();
    if (!mIsJson) {
      std::cout << Printable(path) << ": " << Printable(remark) << '\n';
      return;
    }
    Json json;
    Put(json, "path", path);
    Put(json, "error", remark);
    std::cout << json.dump() << '\n';
  }

  void PrintFiguresAsJson(std::uint64_t missing) const {
    Json json;
    json["items"] = mItems;
    json["came_back"] = mBack;
    json["missing"] = missing;
    json["vanished"] = mVanished;
    json["left_out"] = mLeftOut;
    std::cout << json.dump() << '\n';
  }

  Client mRecords;
  Client mPaths;
  bool mIsJson;
  std::optional<Error> mFailure;
  ProgressBar mBar;
  std::uint64_t mItems = 0;
  std::uint64_t mBack = 0;
  std::uint64_t mVanished = 0;
  std::uint64_t mLeftOut = 0;
};

}  // namespace

int TakeCensus(const ClientOptions& options, const Format& format, const std::string& folder) {
  std::error_code error;
  const auto path = std::filesystem::canonical(folder, error);
  if (error) return Complain(folder + ": " + error.message());

  Census census(options, format);
  const TreeVisitor visitor{
      [&](const std::string& item, const struct stat& status, double done) {
        return census.Count(item, status, done);
      },
      [&](const std::string& item, const struct stat& status) {
        return census.IsOnVolume(item, status);
      },
      [&](const std::string& item, const std::string& reason) { census.LeaveOut(item, reason); }};
  WalkTree(path, visitor);
  return census.Finish();
}

}  // namespace tallowmere::cli
