// A file server to compare with: Debian's SFTP server on its own two pipes.
//
// The protocol is that of the IETF's draft-ietf-secsh-filexfer-02, version 3: packets of a 32-bit
// length, a type byte and fields, all integers big-endian.
#pragma once

#include <memory>
#include <string>

#include "Questions.h"
#include "Server.h"

namespace tallowmere::benchmark {

class FileServer {
 public:
  static bool IsInstalled();

  // Starts and initialises the server. REQUIRES: it is installed.
  FileServer();

  // The attributes of an item, or of a link itself (LSTAT). REQUIRES: it exists.
  static Question Attributes(const std::string& path);

  // The canonical path of a canonical path (REALPATH).
  static Question CanonicalPath(const std::string& path);

  Server& Process() { return *mProcess; }

 private:
  std::unique_ptr<Server> mProcess;
};

}  // namespace tallowmere::benchmark
