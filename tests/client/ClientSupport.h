// Clients of the real service and of programs that take its place.
#pragma once

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <tallowmere/Client.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <string>

#include "support/TemporaryFolder.h"

namespace tallowmere::test {

using std::chrono::milliseconds;

inline constexpr const char* kEnded = "the service ended before it answered";
inline constexpr const char* kNotInTime = "the service did not answer in time";
inline constexpr const char* kMalformed = "the service's answer is not what the protocol says";

inline Client StartClient() {
  return Client({.service = TALLOWMERE_SERVICE});
}

// The path of a shell script, run in its own folder, that takes the service's place.
inline std::string Impostor(const TemporaryFolder& folder, const std::string& script) {
  std::string path =
      folder
          .MakeFile("impostor", "#!/bin/sh\ncd '" + folder.Path().string() + "'\n" + script + "\n")
          .string();
  chmod(path.c_str(), 0755);
  return path;
}

// One that does this when it is first started, and then is the real service.
inline std::string ImpostorOnce(const TemporaryFolder& folder, const std::string& script) {
  return Impostor(folder, "test -e ran && exec " TALLOWMERE_SERVICE " $1\ntouch ran\n" + script);
}

inline std::string ContentOf(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

// The real service, which can be killed.
class MortalService {
 public:
  // The path of its program.
  const std::string& Path() const { return mPath; }
  // The process that was started last.
  pid_t Process() const { return std::stoi(ContentOf(mFolder.Path() / "process")); }
  void Kill() const { kill(Process(), SIGKILL); }

 private:
  TemporaryFolder mFolder;
  std::string mPath = Impostor(mFolder, "echo $$ >process; exec " TALLOWMERE_SERVICE " $1");
};

// The bytes that a client sends to the real service meanwhile.
inline std::string SentDuring(const std::function<void(Client&)>& conversation) {
  const TemporaryFolder folder;
  {
    Client client({.service = Impostor(folder, ": >sent; tee sent | " TALLOWMERE_SERVICE " $1")});
    conversation(client);
  }
  return ContentOf(folder.Path() / "sent");
}

inline std::ptrdiff_t OpenDescriptors() {
  const auto folder = std::filesystem::directory_iterator("/proc/self/fd");
  return std::distance(begin(folder), end(folder));
}

inline bool HasNoChild() {
  return waitpid(-1, nullptr, WNOHANG) == -1 && errno == ECHILD;
}

template <class T>
std::string MessageOf(const Result<T>& result) {
  return result ? "" : result.Failure().message;
}

}  // namespace tallowmere::test
