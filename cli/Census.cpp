#include <sys/stat.h>
#include <tallowmere/Batch.h>

#include <cstdint>
#include <filesystem>
#include <iostream>
#include <memory>
#include <optional>
#include <string>
#include <system_error>
#include <utility>
#include <vector>

#include "cli/Commands.h"
#include "cli/Conversion.h"
#include "cli/Crew.h"
#include "cli/Finding.h"
#include "cli/Output.h"
#include "cli/ProgressBar.h"
#include "cli/SameItem.h"
#include "cli/Services.h"
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

// An item of the folder, and what became of it.
struct Entry {
  enum class State { kBack, kVanished, kInTrouble };

  std::string path;
  struct stat status {};
  State state = State::kBack;
  std::string trouble;  // why it did not come back
};

// What one checker gets at a time.
struct Piece {
  std::vector<Entry> entries;
  std::optional<Error> failure;  // of a service; the states of the entries then mean nothing
};

constexpr std::size_t kMostEntries = 1024;

// Asks one service for the record of each item and another for the path of that record.
class Checker {
 public:
  explicit Checker(const ClientOptions& options) : mRecords(options), mPaths(options) {}

  // Whether both services can be asked.
  bool Answers() { return !WhyItDoesNotAnswer(mRecords) && !WhyItDoesNotAnswer(mPaths); }

  void Check(Piece& piece) {
    mFailure.reset();
    const std::vector<Answer<FSSpec>> records = AskForRecords(piece.entries);
    const std::vector<Answer<std::string>> paths = AskForPaths(records);
    for (std::size_t i = 0; i < piece.entries.size() && !mFailure; ++i) {
      Judge(piece.entries[i], records[i], paths[i]);
    }
    piece.failure = mFailure;
  }

 private:
  template <class Value>
  using Answer = std::optional<Value>;

  template <class Value>
  auto Keep(Answer<Value>& place) {
    return [this, &place](Result<Answer<Value>> answer) {
      if (answer) {
        place = *std::move(answer);
      } else if (!mFailure) {
        mFailure = answer.Failure();
      }
    };
  }

  std::vector<Answer<FSSpec>> AskForRecords(const std::vector<Entry>& entries) {
    std::vector<Answer<FSSpec>> records(entries.size());
    Batch batch(mRecords);
    for (std::size_t i = 0; i < entries.size(); ++i) {
      batch.Add(request::GetFSSpec(entries[i].path), Keep(records[i]));
    }
    batch.Finish();
    return records;
  }

  std::vector<Answer<std::string>> AskForPaths(const std::vector<Answer<FSSpec>>& records) {
    std::vector<Answer<std::string>> paths(records.size());
    Batch batch(mPaths);
    for (std::size_t i = 0; i < records.size(); ++i) {
      if (records[i]) batch.Add(request::SetFileRefFromFSSpec(*records[i], false), Keep(paths[i]));
    }
    batch.Finish();
    return paths;
  }

  // Asks again about what did not come back: the item, or a folder above it, may have been moved
  // between the two questions.
  void Judge(Entry& entry, const Answer<FSSpec>& record, const Answer<std::string>& back) {
    auto trouble = Trouble(entry.path, record, back);
    if (trouble && IsAt(entry.path, entry.status)) {
      const auto records = AskForRecords({entry});
      trouble = Trouble(entry.path, records[0], AskForPaths(records)[0]);
    }
    if (!trouble) return;
    entry.state =
        IsAt(entry.path, entry.status) ? Entry::State::kInTrouble : Entry::State::kVanished;
    entry.trouble = *std::move(trouble);
  }

  // The reason why an item did not come back; nullopt when it did.
  static std::optional<std::string> Trouble(const std::string& path, const Answer<FSSpec>& record,
                                            const Answer<std::string>& back) {
    if (!record) return "has no record";
    if (!back) return "its record leads nowhere";
    if (!IsSameItem(*back, path)) return "came back as " + *back;
    return std::nullopt;
  }

  Client mRecords;
  Client mPaths;
  std::optional<Error> mFailure;  // the first of a piece
};

// Counts the items of a folder, checks them by several services at a time, and prints those that
// did not come back.
class Census {
 public:
  Census(const ClientOptions& options, const Format& format)
      : mFolders(options),
        mIsJson(format.isJson),
        mBar(format.HasProgress()),
        mCrew(
            MostServices,
            [this, options]() -> Crew<Piece>::Work {
              const auto checker = std::make_shared<Checker>(options);
              if (std::exchange(mHasOne, true) && !checker->Answers()) return nullptr;
              return [checker](Piece& piece) { checker->Check(piece); };
            },
            [this](const Piece& piece) { Count(piece); }) {}

  // Returns whether the services still answer.
  bool Take(const std::string& path, const struct stat& status, double done) {
    mPiece.entries.push_back({path, status, {}, {}});
    if (mPiece.entries.size() == kMostEntries) mCrew.Give(std::exchange(mPiece, {}));
    mBar.Show(done, ++mTaken);
    return !mFailure;
  }

  // Whether a folder that was just seen is on a volume. If it is not, its items have no record, or
  // one that leads nowhere.
  bool IsOnVolume(const std::string& path, const struct stat& folder) {
    const auto record = mFolders.GetFSSpec((path == "/" ? "" : path) + kAnyItem);
    if (!record) mFailure = record.Failure();
    const bool leadsBack = record && *record && (*record)->parID != kParentOnNoVolume;
    return !record || leadsBack || !IsAt(path, folder);
  }

  void LeaveOut(const std::string& path, const std::string& reason) {
    ++mLeftOut;
    Print(path, "left out, " + reason);
  }

  // Returns the program's exit status.
  int Finish() {
    if (!mFailure && !mPiece.entries.empty()) mCrew.Give(std::move(mPiece));
    if (!mFailure) mCrew.Finish();
    mBar.Hide();
    if (mFailure) return Complain(mFailure->message);
    if (mIsJson) {
      PrintFiguresAsJson();
    } else {
      std::cout << mItems << " items, " << mItems - mMissing - mVanished << " came back, "
                << mMissing << " did not, " << mVanished << " vanished meanwhile, " << mLeftOut
                << " left out\n";
    }
    return FinishOutput(mMissing == 0 ? 0 : kFailed);
  }

 private:
  void Count(const Piece& piece) {
    if (piece.failure && !mFailure) mFailure = piece.failure;
    if (mFailure) return;
    for (const Entry& entry : piece.entries) {
      ++mItems;
      if (entry.state == Entry::State::kVanished) ++mVanished;
      if (entry.state != Entry::State::kInTrouble) continue;
      ++mMissing;
      Print(entry.path, entry.trouble);
    }
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

  void PrintFiguresAsJson() const {
    Json json;
    json["items"] = mItems;
    json["came_back"] = mItems - mMissing - mVanished;
    json["missing"] = mMissing;
    json["vanished"] = mVanished;
    json["left_out"] = mLeftOut;
    std::cout << json.dump() << '\n';
  }

  Client mFolders;  // asked which folders are on a volume
  bool mIsJson;
  std::optional<Error> mFailure;
  ProgressBar mBar;
  std::uint64_t mTaken = 0;
  std::uint64_t mItems = 0;
  std::uint64_t mMissing = 0;   // of those
  std::uint64_t mVanished = 0;  // of those
  std::uint64_t mLeftOut = 0;
  bool mHasOne = false;  // checker
  Piece mPiece;
  Crew<Piece> mCrew;  // the last, as its work ends first
};

}  // namespace

int TakeCensus(const ClientOptions& options, const Format& format, const std::string& folder) {
  std::error_code error;
  const auto path = std::filesystem::canonical(folder, error);
  if (error) return Complain(folder + ": " + error.message());

  Census census(options, format);
  const TreeVisitor visitor{
      [&](const std::string& item, const struct stat& status, double done) {
        return census.Take(item, status, done);
      },
      [&](const std::string& item, const struct stat& status) {
        return census.IsOnVolume(item, status);
      },
      [&](const std::string& item, const std::string& reason) { census.LeaveOut(item, reason); }};
  WalkTree(path, visitor);
  return census.Finish();
}

}  // namespace tallowmere::cli
