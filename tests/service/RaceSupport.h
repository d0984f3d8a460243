// Requests, answers and the checks of answers that the race tests share.
#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstring>
#include <filesystem>
#include <optional>
#include <set>
#include <string>
#include <utility>

#include "support/Copies.h"
#include "support/EveryRequest.h"
#include "support/SmallRoot.h"
#include "support/StoppedService.h"
#include "support/Wire.h"

namespace tallowmere::test {

inline constexpr std::size_t kRecordResponseSize = 75;

inline constexpr const char* kName = "item.aif";

using Identity = std::pair<dev_t, ino_t>;

inline std::optional<Identity> IdentityOf(const std::string& path) {
  struct stat about {};
  if (path.empty() || lstat(path.c_str(), &about) != 0) return std::nullopt;
  return Identity{about.st_dev, about.st_ino};
}

// --- Answers ----------------------------------------------------------------------------------

inline std::string ReadCounted(ChildProgram& service, std::string head) {
  std::uint16_t count = 0;
  std::memcpy(&count, head.data() + head.size() - sizeof count, sizeof count);
  return head + service.Read(count + kTrailer.size());
}

// Sends the request and reads the whole response.
inline std::string Answer(ChildProgram& service, unsigned code, const std::string& request) {
  service.Write(request);
  switch (code) {
    case 1:
      return service.Read(2 + kRoomForAFullPath + kTrailer.size());
    case 2:
      return ReadCounted(service, service.Read(4));
    case 7:
      return service.Read(kRecordResponseSize);
    default:
      return ReadCounted(service, service.Read(3));
  }
}

// Services that can be stopped.
inline const Copies& StoppedServices() {
  static const Copies services(ServiceToTest(), TALLOWMERE_STOP_AT_CALLS);
  return services;
}

// A service that runs freely: it gives the reference answers while nothing changes.
class Bystander : public ChildProgram {
 public:
  Bystander() : ChildProgram(Copy) {}

 private:
  static pid_t Copy(const Streams& streams) {
    static const Copies services(ServiceToTest(), TALLOWMERE_COPIES_LIBRARY);
    return services.Make(streams);
  }
};

// Returns the path in a response to code 2, 6, 8 or 9, or an empty string when it has none.
inline std::string PathIn(unsigned code, const std::string& response) {
  const std::size_t head = code == 2 ? 4 : 3;
  return response.size() > head + kTrailer.size() ? response.c_str() + head : "";
}

// Returns the HFS path in a response to code 1.
inline std::string FullPathIn(const std::string& response) {
  return response.c_str() + 2;
}

// Returns what the service says about the item at the path. The item may be a new one.
inline Item ItemAt(ChildProgram& service, const std::filesystem::path& path) {
  Item item{};
  item.path = path;
  item.folder = path.parent_path();
  item.record = Answer(service, 7, RecordRequest(item.path))
                    .substr(1, kRecordResponseSize - 1 - kTrailer.size());
  item.name = std::string(item.record.data() + 7, static_cast<unsigned char>(item.record[6]));
  std::memcpy(&item.volume, item.record.data(), sizeof item.volume);
  std::memcpy(&item.folderID, item.record.data() + sizeof item.volume, sizeof item.folderID);
  item.fullPath = FullPathIn(Answer(service, 1, FullPathRequest(item.path, kRoomForAFullPath, 1)));
  return item;
}

inline void Exchange(const std::filesystem::path& first, const std::filesystem::path& second) {
  ASSERT_EQ(renameat2(AT_FDCWD, first.c_str(), AT_FDCWD, second.c_str(), RENAME_EXCHANGE), 0);
}

enum class Knowledge { kNone, kOfTheItem, kOfAPass };

inline const char* NameOf(Knowledge knowledge) {
  switch (knowledge) {
    case Knowledge::kNone:
      return "AtFirst";
    case Knowledge::kOfTheItem:
      return "Remembered";
    default:
      return "KnownByAPass";
  }
}

// The acceptable answers to one request: collected from services that see the tree only before or
// only after a change.
class Truth {
 public:
  // `asked` is the path of the item in the request.
  Truth(std::filesystem::path asked, unsigned code) : mCode(code), mAsked(std::move(asked)) {}

  void Note(const std::string& response) {
    mAnswers.insert(response);
    const bool isOfPath = mCode == 1 || mCode == 7;
    const auto item = IdentityOf(isOfPath ? ItemAsked() : PathIn(mCode, response));
    if (item) mItems.insert(*item);
  }

  testing::AssertionResult Admits(const std::string& response, ChildProgram& after) const {
    if (response.size() < kTrailer.size() || !response.ends_with(kTrailer)) {
      return testing::AssertionFailure() << "incomplete response";
    }
    if (mAnswers.contains(response)) return testing::AssertionSuccess();
    const auto item = ItemAnswered(response, after);
    if (!item || mItems.contains(*item)) return testing::AssertionSuccess();
    return testing::AssertionFailure() << "leads to another item";
  }

  // Returns the item that the answer leads to, resolved by the service `after`.
  std::optional<Identity> ItemAnswered(const std::string& response, ChildProgram& after) const {
    return IdentityOf(PathAnswered(response, after));
  }

 private:
  // Code 1 answers with the path of the item's folder.
  std::string ItemAsked() const { return mCode == 1 ? mAsked.parent_path() : mAsked; }

  // Returns the path that the answer leads to, or an empty string. `after` is asked afterwards.
  std::string PathAnswered(const std::string& response, ChildProgram& after) const {
    switch (mCode) {
      case 1: {
        const std::string path = FullPathIn(response);
        // The volume's name alone means that the folder could not be named.
        if (path.find(':') == path.size() - 1) return {};
        return PathIn(2, Answer(after, 2, PathOfHFSPathRequest(path + '\0', "", 0)));
      }
      case 5:
        return response == kNoVolumeNameResponse ? "" : "/";
      case 7:
        if (response[0] == 0) return {};
        return PathIn(9, Answer(after, 9, PathOfRecordRequest(response.substr(1, 70), 0, 0)));
      default:
        return PathIn(mCode, response);
    }
  }

  unsigned mCode;
  std::filesystem::path mAsked;
  std::set<std::string> mAnswers;
  std::set<Identity> mItems;
};

class InSmallRoot : public testing::Test {
 protected:
  void SetUp() override {
    static const bool isThere =
        EnterSmallRoot({ServiceToTest(), TALLOWMERE_STOP_AT_CALLS, TALLOWMERE_COPIES_LIBRARY});
    if (!isThere) GTEST_SKIP() << "mounting is not permitted here";
  }
};

}  // namespace tallowmere::test
