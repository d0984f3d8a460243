// The parent's side of the service: starts it, asks it, ends it.
//
// The first request starts the service. When it has died, missed a deadline or violated the
// protocol, the current request gets the error and the next one starts the service again. A client
// belongs to one thread at a time, and to the process that made it. POSIX paths are absolute: see
// Request.h.
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
  // The service's program. Empty: "tallowmere" in the folder of this process's own program, else on
  // PATH.
  std::string service;
  // How long one request may take. Starts when its first byte is sent, or in a batch when the
  // answer before it arrives, if that is later; ends when its last byte is received. A service that
  // takes longer is killed.
  std::chrono::milliseconds deadline{10'000};
};

class Client {
 public:
  explicit Client(ClientOptions options = {});
  // REQUIRES: a moved-from client is only assigned to or destroyed.
  Client(Client&& other) noexcept;
  Client& operator=(Client&& other) noexcept;
  // Ends the service and waits for it; kills it when it has not ended within a second.
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
  // without `keepFolders`, the volume's name alone. Returns an error when no shortening makes it
  // fit; a buffer that is 6 bytes larger than the volume's name always suffices.
  Result<std::string> MakeFullPath(std::string_view path, std::uint16_t size,
                                   bool keepFolders = true);

 private:
  friend class Batch;

  std::unique_ptr<Conversation> mConversation;
};

}  // namespace tallowmere
