// The answers about real files of this machine agree with each other and lead back to the files.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstring>
#include <filesystem>
#include <set>
#include <string>
#include <vector>

#include "support/Wire.h"

namespace tallowmere::test {
namespace {

namespace fs = std::filesystem;

constexpr std::size_t kFiles = 10'000;

// Returns up to `kFiles` items of system folders, links included, taken from all of them.
std::vector<std::string> RealFiles() {
  std::vector<std::string> files;
  for (const char* const top : {"/etc", "/usr", "/var"}) {
    const auto options = fs::directory_options::skip_permission_denied;
    std::error_code error;
    for (auto item = fs::recursive_directory_iterator(top, options, error);
         item != fs::recursive_directory_iterator() && files.size() < kFiles;
         item.increment(error)) {
      if (error) break;
      files.push_back(item->path());
    }
  }
  return files;
}

struct Spec {
  std::int16_t volume;
  std::int32_t parent;
  std::string name;
};

Spec ReadRecord(const std::string& record) {
  Spec spec;
  std::memcpy(&spec.volume, record.data(), sizeof spec.volume);
  std::memcpy(&spec.parent, record.data() + 2, sizeof spec.parent);
  spec.name = record.substr(7, static_cast<unsigned char>(record[6]));
  return spec;
}

class RoundTrip : public testing::Test {
 protected:
  // Returns the record from code 7, or an empty string when it is not usable.
  std::string RecordOf(const std::string& path) {
    const std::string response = mService.Ask(RecordRequest(path), 75);
    if (response.size() != 75 || response[0] != 1 || !response.ends_with(kTrailer)) return {};
    return response.substr(1, 70);
  }

  Service mService;
};

// Failures about a file that another process moves or removes meanwhile do not count.
bool IsStillThere(const std::string& path) {
  struct stat about {};
  return lstat(path.c_str(), &about) == 0;
}

TEST_F(RoundTrip, LeadsBackToTenThousandFiles) {
  const std::vector<std::string> files = RealFiles();
  ASSERT_GT(files.size(), 1000u);
  for (const std::string& path : files) {
    // Code 7 resolves the links in front of the name.
    const std::string record = RecordOf(path);
    if (!IsStillThere(path)) continue;
    ASSERT_FALSE(record.empty()) << path;
    const Spec spec = ReadRecord(record);
    const std::string real =
        fs::canonical(fs::path(path).parent_path()) / fs::path(path).filename();
    EXPECT_TRUE(mService.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(real))) << path;
    EXPECT_TRUE(mService.Answers(PathOfPartsRequest(spec.volume, spec.parent, spec.name, 0),
                                 PathResponse(real)))
        << path;
    // For code 5, a dangling link does not exist.
    const std::string named = fs::exists(path) ? NameResponse(1, spec.name) : NameResponse(0, "");
    EXPECT_TRUE(mService.Answers(HFSNameRequest(path, 64), named)) << path;
    if (HasFailure() && !IsStillThere(path)) GTEST_SKIP() << path << " vanished meanwhile";
    ASSERT_FALSE(HasFailure()) << path;
  }
  RecordProperty("files", static_cast<int>(files.size()));
}

// Only paths that fit one length byte.
TEST_F(RoundTrip, LeadsFullPathsBackToTheirFolders) {
  std::set<std::string> folders;
  for (const std::string& path : RealFiles()) {
    folders.insert(fs::canonical(fs::path(path).parent_path()));
  }
  std::size_t told = 0;
  for (const std::string& folder : folders) {
    const std::string response = mService.Ask(FullPathRequest(folder, 1024, 1), 2 + 1024 + 4);
    ASSERT_TRUE(response.ends_with(kTrailer)) << folder;
    const std::string path = response.substr(2, 1024).c_str();
    EXPECT_EQ(response.substr(0, 2), U16(static_cast<unsigned>(path.size()))) << folder;
    if (path.size() > 255) continue;
    ++told;
    EXPECT_TRUE(
        mService.Answers(PathOfHFSPathRequest(path + '\0', "", 0), ResultResponse(0, folder)))
        << folder << " is " << path;
  }
  EXPECT_GT(told, folders.size() / 2);
}

}  // namespace
}  // namespace tallowmere::test
