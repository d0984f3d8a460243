// A folder of its own for one test, removed with all that is in it.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>

namespace tallowmere::test {

class TemporaryFolder {
 public:
  TemporaryFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "tallowmere.XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) std::abort();
    mPath = std::filesystem::canonical(pattern);
  }
  TemporaryFolder(const TemporaryFolder&) = delete;
  TemporaryFolder& operator=(const TemporaryFolder&) = delete;
  ~TemporaryFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(mPath, ignored);
  }

  // Canonical.
  const std::filesystem::path& Path() const { return mPath; }

  // The path of a new folder in it.
  std::filesystem::path MakeFolder(std::string_view name) const {
    std::filesystem::create_directories(mPath / name);
    return mPath / name;
  }

  // The path of a new file in it.
  std::filesystem::path MakeFile(std::string_view name, std::string_view content = "") const {
    std::ofstream(mPath / name, std::ios::binary) << content;
    return mPath / name;
  }

  // The path of a new symbolic link in it.
  std::filesystem::path MakeLink(std::string_view name, const std::string& target) const {
    std::filesystem::create_symlink(target, mPath / name);
    return mPath / name;
  }

 private:
  std::filesystem::path mPath;
};

}  // namespace tallowmere::test
