#include "SmallRoot.h"

#include <sys/mount.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <memory>
#include <sstream>
#include <string>

namespace tallowmere::soak {
namespace {

namespace fs = std::filesystem;

std::string OutputOf(const std::string& command) {
  const std::unique_ptr<FILE, int (*)(FILE*)> output(popen(command.c_str(), "r"), pclose);
  std::string text;
  for (int byte = 0; output && (byte = std::fgetc(output.get())) != EOF;) {
    text += static_cast<char>(byte);
  }
  return text;
}

}  // namespace

bool MakeSmallRoot(const std::string& place, const std::string& program) {
  if (mount("none", place.c_str(), "tmpfs", 0, "") != 0) return false;
  fs::copy_file(program, place + kProgramInSmallRoot);
  std::istringstream words(OutputOf("ldd '" + program + "'"));
  for (std::string word; words >> word;) {
    if (!word.starts_with('/') || !fs::exists(word)) continue;
    const fs::path copy = place + word;
    fs::create_directories(copy.parent_path());
    fs::copy_file(word, copy, fs::copy_options::skip_existing);
  }
  fs::create_directory(place + "/proc");
  return mount("none", (place + "/proc").c_str(), "proc", 0, "") == 0;
}

bool EnterSmallRoot(const std::string& place) {
  return chdir(place.c_str()) == 0 && syscall(SYS_pivot_root, ".", ".") == 0 &&
         umount2(".", MNT_DETACH) == 0 && chdir("/") == 0;
}

}  // namespace tallowmere::soak
