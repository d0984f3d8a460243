#include "support/FileSystemImage.h"

#include <fcntl.h>
#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>

#include <fstream>
#include <utility>

#include "support/ArgumentVector.h"

namespace tallowmere::test {

bool RunTool(const std::vector<std::string>& command) {
  const pid_t child = fork();
  if (child == 0) {
    const int nothing = open("/dev/null", O_RDWR);
    for (const int standard : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
      dup2(nothing, standard);
    }
    const auto arguments = ArgumentVector(command);
    // Tools for file systems are not on every user's path.
    setenv("PATH", "/usr/sbin:/sbin:/usr/bin:/bin", 1);
    execvp(arguments[0], arguments.data());
    _exit(127);
  }
  int status = 0;
  return waitpid(child, &status, 0) == child && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

bool KernelHas(const std::string& fileSystem) {
  RunTool({"modprobe", fileSystem});
  std::ifstream list("/proc/filesystems");
  for (std::string word; list >> word;) {
    if (word == fileSystem) return true;
  }
  return false;
}

FileSystemImage::FileSystemImage(std::string type, std::vector<std::string> makeCommand,
                                 std::uintmax_t bytes)
    : mType(std::move(type)) {
  const auto image = mFolder.MakeFile("image");
  std::filesystem::resize_file(image, bytes);
  mFolder.MakeFolder("mounted");
  makeCommand.push_back(image.string());
  mIsMade = RunTool(makeCommand);
}

bool FileSystemImage::Mount(const std::string& options) {
  const std::string all = options.empty() ? "loop" : "loop," + options;
  mIsMounted = RunTool({"mount", "-n", "-t", mType, "-o", all, (mFolder.Path() / "image").string(),
                        Path().string()});
  return mIsMounted;
}

// Waits for the last users to finish, so that the image can be mounted again.
void FileSystemImage::Unmount() {
  if (mIsMounted && !RunTool({"umount", "-n", Path().string()})) {
    umount2(Path().c_str(), MNT_DETACH);
  }
  mIsMounted = false;
}

}  // namespace tallowmere::test
