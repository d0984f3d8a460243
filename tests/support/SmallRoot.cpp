#include "support/SmallRoot.h"

#include <sys/mount.h>

#include <cstdio>
#include <filesystem>
#include <memory>
#include <set>
#include <sstream>

#include "support/MountNamespace.h"

namespace tallowmere::test {
namespace {

namespace fs = std::filesystem;

// A folder that every machine has and that contains no programs.
const std::string kPlace = "/sys";

std::string OutputOf(const std::string& command) {
  const std::unique_ptr<FILE, int (*)(FILE*)> output(popen(command.c_str(), "r"), pclose);
  std::string text;
  for (int byte = 0; output && (byte = std::fgetc(output.get())) != EOF;) {
    text += static_cast<char>(byte);
  }
  return text;
}

// The programs and all their libraries.
std::set<std::string> FilesOf(const std::vector<std::string>& programs) {
  std::set<std::string> files;
  for (const std::string& program : programs) {
    files.insert(fs::absolute(program));
    std::istringstream words(OutputOf("ldd '" + program + "' 2>/dev/null"));
    for (std::string word; words >> word;) {
      if (word.starts_with('/') && fs::exists(word)) files.insert(word);
    }
  }
  return files;
}

bool IsMounted(const char* type, const std::string& place) {
  return mount("none", place.c_str(), type, 0, "") == 0;
}

}  // namespace

void CopyPrograms(const std::vector<std::string>& programs, const fs::path& root) {
  for (const std::string& file : FilesOf(programs)) {
    const fs::path copy = root.string() + file;
    fs::create_directories(copy.parent_path());
    fs::copy_file(file, copy);
  }
}

bool EnterSmallRoot(const std::vector<std::string>& programs) {
  if (!EnterOwnMountNamespace()) return false;
  const fs::path temporary = fs::temp_directory_path();
  if (!IsMounted("tmpfs", kPlace)) return false;
  CopyPrograms(programs, kPlace);
  fs::create_directories(kPlace + temporary.string());
  fs::create_directory(kPlace + "/proc");
  return IsMounted("proc", kPlace + "/proc") && MakeRootOfMounts(kPlace);
}

}  // namespace tallowmere::test
