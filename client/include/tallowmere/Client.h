// A parent's side of the service: starts it, asks it, ends it.
//
// The service is started with the first request. When it has died, missed a deadline or answered
// what the protocol does not know, the request in hand gives the error and the next one starts it
// again. A client belongs to one thread at a time, and to the process that made it. POSIX paths are
// absolute, as Request.h says.
#pragma once

#include <tallowmere/Request.h>
#include <tallowmere/Result.h>
#include <tallowmere/Types.h>

#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere {

class Conversation;

struct ClientOptions {
  // The service's program. Empty: "tallowmere" beside this process's own program, else on PATH.
  std::string service;
  // How long one request may take, from its first byte sent, or in a batch from the answer before
  // it if that is later, to its last byte received. A service that takes longer is killed.
  std::chrono::milliseconds deadline{10'000};
};

class Client {
 public:
  explicit Client(ClientOptions options = {});
  // REQUIRES: a client that was moved from is only assigned to or destroyed.
  Client(Client&& other) noexcept;
  Client& operator=(Client&& other) noexcept;
  // Ends the service and waits for it; one that does not end within a second is killed.
  ~Client();

  template <class T>
  Result<T> Ask(const Request<T>& request);

  // One method for each request; see the function of the same name in Request.h.
  Result<std::string> MakeFullPath(std::string_view path);
  Result<std::optional<std::string>> MakeFileRefFromPath(std::string_view hfsPath);
  Result<std::optional<std::int16_t>> GetVolRefnumByHFSName(std::string_view name);
  Result<std::optional<std::string>> GetHFSVolumeName(std::int16_t number);
  Result<std::optional<std::string>> GetHFSName(std::string_view path);
  Result<std::optional<std::string>> AddHFSName(std::string_view folder, std::string_view name);
  Result<std::optional<FSSpec>> GetFSSpec(std::string_view path);
  Result<std::optional<std::string>> SetFileRefFromFSSpecData(const FSSpec& spec);
  Result<std::optional<std::string>> SetFileRefFromFSSpec(const FSSpec& spec,
                                                          bool searchOtherVolumes);
  Result<ExportSettings> GetAIFFExportSettings(const SoundFormat& sound);

  // The full HFS path in a buffer of `size` bytes with the NUL, outer folders replaced by "...";
  // without `keepFolders` the volume's name alone. The error says so when no shortening makes it
  // fit: the volume's name needs 5 bytes more than it has.
  Result<std::string> MakeFullPath(std::string_view path, std::uint16_t size,
                                   bool keepFolders = true);

 private:
  friend class Batch;

  std::unique_ptr<Conversation> mConversation;
};

}  // namespace tallowmere
