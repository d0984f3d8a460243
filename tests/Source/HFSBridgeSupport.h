// Shared by the tests of the HFS bridge: names and records as values, and volumes for tests.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <CoreServices/CoreServices.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <optional>
#include <ostream>
#include <string>
#include <string_view>

#include "Source/LegacyHFSBridge.h"
#include "TestReferences.h"
#include "support/OwnMountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

// --- Names ------------------------------------------------------------------------------------

// Owns a Pascal string of at most 255 bytes.
class Pascal {
 public:
  explicit Pascal(std::string_view text) : mBytes(1, static_cast<char>(text.size())) {
    mBytes += text;
  }
  ConstStr255Param Get() const { return reinterpret_cast<ConstStr255Param>(mBytes.data()); }

 private:
  std::string mBytes;
};

inline std::string TextOfPascal(ConstStr255Param name) {
  return {reinterpret_cast<const char*>(name + 1), name[0]};
}

// --- Records ----------------------------------------------------------------------------------

// Returns a record whose bytes after the name are filler that no result may depend on. The length
// byte is that of `name`, even where the record has no room for the whole name.
inline FSSpec Spec(short volume, long folder, std::string_view name) {
  FSSpec spec;
  spec.vRefNum = volume;
  spec.parID = static_cast<SInt32>(folder);
  std::fill(std::begin(spec.name), std::end(spec.name), '!');
  spec.name[0] = static_cast<unsigned char>(name.size());
  name.copy(reinterpret_cast<char*>(spec.name + 1), sizeof spec.name - 1);
  return spec;
}

// A record whose values show whether it was written to.
inline FSSpec Untouched() {
  return Spec(1234, 5678, "untouched");
}

// A record's fields without the bytes after the name, for comparing and printing.
struct Fields {
  int volume;
  long folder;
  std::string name;

  bool operator==(const Fields&) const = default;
  friend std::ostream& operator<<(std::ostream& out, const Fields& fields) {
    return out << fields.volume << " " << fields.folder << " \"" << fields.name << '"';
  }
};
inline Fields FieldsOf(const FSSpec& spec) {
  return {spec.vRefNum, spec.parID, TextOfPascal(spec.name)};
}
inline const Fields kEmptyFields = {kNoVolume, kNoFolder, ""};

// --- Volumes ----------------------------------------------------------------------------------

// A number that no volume has.
inline constexpr short kUnknownVolume = 77;

// A folder id that no item has: smaller than every id given to an item.
inline constexpr long kUnknownFolder = 15;

// A new, empty file system mounted at a folder that has the volume's name.
class Volume {
 public:
  explicit Volume(std::string_view name)
      : mRoot(mFolder.MakeFolder(name)), mMount("none", mRoot.string(), "tmpfs") {}

  bool IsMounted() const { return mMount.IsMounted(); }
  void Unmount() { mMount.Unmount(); }

  std::string Path(std::string_view item = "") const {
    return item.empty() ? mRoot.string() : (mRoot / item).string();
  }
  CFileRef Ref(std::string_view item = "") const { return CFileRef(Path(item).c_str(), false); }

  // Makes a folder and those above it, and returns its path.
  std::string MakeFolder(std::string_view item) const {
    std::filesystem::create_directories(mRoot / item);
    return Path(item);
  }
  std::string MakeFile(std::string_view item) const {
    const std::ofstream file(mRoot / item);
    return Path(item);
  }

  short Number() const { return Ref().GetVolumeRefNumber(); }

 private:
  TemporaryFolder mFolder;
  std::filesystem::path mRoot;
  ScopedMount mMount;
};

// A test with a volume named "Data".
class DataVolumeTest : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mData.emplace("Data");
    ASSERT_TRUE(mData->IsMounted());
  }

  std::optional<Volume> mData;
};

}  // namespace tallowmere::test
