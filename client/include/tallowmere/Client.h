// The parent's side of the service: starts it, asks it, ends it.
//
// The first request starts the service. When it has died, missed a deadline or violated the
// protocol, the current request gets the error and the next one starts the service again.
//
// **Threads.** A client may be used by several threads: each request and each conversion waits
// until it has the client to itself; a Batch or Converter has it from its first request on until it
// has finished or is destroyed. A thread that has it already, by a Batch or Converter of its own,
// gets an error at once. Move and destroy a client only while nobody uses it.
//
// **fork(2).** The child's copy of a client leaves the parent's service alone, and starts one of
// its own when it is asked. A batch that was under way is asked anew there.
#pragma once

#include <tallowmere/Conversion.h>
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

  // --- Conversions: see Conversion.h. To convert many items, use Converter. ---

  // The record of the item at a path. So a record of what exists leads back to it.
  Conversion<FSSpec> RecordOf(PathView path, ConvertOptions options = {});

  // The path of the item with a record. With `searchOtherVolumes`, an item that is not on the
  // record's volume is searched for on all others, in the folder with the same id: it can be
  // another item that happens to be called the same.
  Conversion<std::string> PathOf(const FSSpec& record, bool searchOtherVolumes = false);

  // The full HFS path, in Mac Roman, of the item at a path; that of a folder ends with a colon.
  Conversion<std::string> HFSPathOf(PathView path, ConvertOptions options = {});

  // The path of the item with a full HFS path in Mac Roman. It begins with the name of a volume; of
  // several volumes with one name, the first is meant.
  Conversion<std::string> PathOfHFSPath(std::string_view hfsPath);

  // The HFS name of the item at a path.
  Conversion<std::string> HFSNameOf(PathView path, ConvertOptions options = {});

  // The path of the item with an HFS name in a folder. A link to a folder is followed.
  Conversion<std::string> PathInFolder(PathView folder, std::string_view hfsName,
                                       ConvertOptions options = {});

  // --- Requests, the raw way: the service is sent what is given, and its answer is handed over as
  // it is, also where that leads elsewhere. Nothing is resolved or looked at. ---

  template <class T>
  Result<T> Ask(const Request<T>& request);

  // One method for each request; see the function of the same name in Request.h.
  Result<std::string> MakeFullPath(PathView path);
  Result<std::optional<std::string>> MakeFileRefFromPath(std::string_view hfsPath);
  Result<std::optional<std::int16_t>> GetVolRefnumByHFSName(std::string_view name);
  Result<std::optional<std::string>> GetHFSVolumeName(std::int16_t number);
  Result<std::optional<std::string>> GetHFSName(PathView path);
  Result<std::optional<std::string>> AddHFSName(PathView folder, std::string_view name);
  Result<std::optional<FSSpec>> GetFSSpec(PathView path);
  Result<std::optional<std::string>> SetFileRefFromFSSpecData(const FSSpec& spec);
  Result<std::optional<std::string>> SetFileRefFromFSSpec(const FSSpec& spec,
                                                          bool searchOtherVolumes);
  Result<ExportSettings> GetAIFFExportSettings(const SoundFormat& sound);

  // The full HFS path in a buffer of `size` bytes with the NUL, outer folders replaced by "...";
  // without `keepFolders`, the volume's name alone. Returns an error when no shortening makes it
  // fit; a buffer that is 6 bytes larger than the volume's name always suffices.
  Result<std::string> MakeFullPath(PathView path, std::uint16_t size, bool keepFolders = true);

 private:
  friend class Batch;

  std::unique_ptr<Conversation> mConversation;
};

}  // namespace tallowmere
