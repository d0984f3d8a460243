#include "foundation/CurrentDirectory.h"

#include <unistd.h>

#include <cerrno>

namespace tallowmere::foundation {

std::optional<std::string> CurrentDirectory() {
  std::string path(256, '\0');
  while (getcwd(path.data(), path.size()) == nullptr) {
    if (errno != ERANGE) return std::nullopt;
    path.resize(path.size() * 2);
  }
  path.resize(path.find('\0'));
  return path;
}

}  // namespace tallowmere::foundation
