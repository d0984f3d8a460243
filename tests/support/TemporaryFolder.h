// A folder for one test, removed with all its contents.
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

  // The canonical path.
  const std::filesystem::path& Path() const { return mPath; }

  // Makes a folder in it and returns the path.
  std::filesystem::path MakeFolder(std::string_view name) const {
    std::filesystem::create_directories(mPath / name);
    return mPath / name;
  }

  // Makes a file in it and returns the path.
  std::filesystem::path MakeFile(std::string_view name, std::string_view content = "") const {
    std::ofstream(mPath / name, std::ios::binary) << content;
    return mPath / name;
  }

  // Makes a symbolic link in it and returns the path.
  std::filesystem::path MakeLink(std::string_view name, const std::string& target) const {
    std::filesystem::create_symlink(target, mPath / name);
    return mPath / name;
  }

 private:
  std::filesystem::path mPath;
};

}  // namespace tallowmere::test
