// Preloaded into tallowmere-cli, makes its first $TALLOWMERE_UNREADY_READS reads of standard input
// fail as those of a descriptor that has nothing yet, and its $TALLOWMERE_FAILING_ENTRY-th reading
// of a folder's entry as a broken disk does. Leaves other programs alone.
#include <dirent.h>
#include <dlfcn.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

namespace {

int Number(const char* variable) {
  const char* const text = std::getenv(variable);
  const bool isMeant = std::strcmp(program_invocation_short_name, "tallowmere-cli") == 0;
  return text == nullptr || !isMeant ? 0 : std::atoi(text);
}

}  // namespace

// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name): theirs are reserved.

extern "C" ssize_t read(int descriptor, void* buffer, size_t size) {
  static int unready = Number("TALLOWMERE_UNREADY_READS");
  if (descriptor == STDIN_FILENO && unready > 0) {
    --unready;
    errno = EAGAIN;
    return -1;
  }
  using Call = ssize_t (*)(int, void*, size_t);
  static const auto real = reinterpret_cast<Call>(dlsym(RTLD_NEXT, "read"));
  return real(descriptor, buffer, size);
}

extern "C" dirent* readdir(DIR* folder) {
  static int left = Number("TALLOWMERE_FAILING_ENTRY");
  if (left > 0 && --left == 0) {
    errno = EIO;
    return nullptr;
  }
  using Call = dirent* (*)(DIR*);
  static const auto real = reinterpret_cast<Call>(dlsym(RTLD_NEXT, "readdir"));
  return real(folder);
}

// NOLINTEND(readability-inconsistent-declaration-parameter-name)
