// A parent's side of the service: starts it, asks it, ends it.
//
// Names are bytes in the legacy single-byte encoding, as the service has them. A client belongs to
// one thread at a time. After an error the conversation is over: every further request gives an
// error too.
#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "client/Result.h"
#include "client/ServiceProcess.h"

namespace tallowmere {

struct ClientOptions {
  // The service's program. Empty: "tallowmere" beside this process's own program, else on PATH.
  std::string service;
  // How long one request may take, from its first byte sent to its last byte received.
  std::chrono::milliseconds deadline{10'000};
};

// What an FSSpec record says: an item by its volume, the id of the folder that holds it and its HFS
// name in that folder, at most 63 bytes. The id has 32 bits; from 0x80000000 on it is negative
// here.
struct FileSpec {
  std::int16_t volume;
  std::int32_t parentID;
  std::string name;
};

// How sound is stored.
struct SoundFormat {
  std::uint32_t rate;        // in hertz × 65536
  std::uint16_t sampleSize;  // in bits
  std::uint8_t channels;
  std::uint32_t format;  // a four-character code, the first character in the highest byte
};

// What the exporter of AIFF files has to say to a format.
struct ExportSettings {
  std::int16_t result;  // the platform's result code, 0 for success; -2005: there is no exporter
  std::string bytes;    // an atom container; empty when there are no settings
};

class Client {
 public:
  static Result<Client> Start(const ClientOptions& options = {});

  // The full HFS path of the folder at a POSIX path, or of the folder that holds the file there,
  // with a colon behind it; outer folders are "..." where it is longer than 1023 bytes. A colon
  // for what is on no volume. A path above 65534 bytes or with a NUL is none's.
  Result<std::string> MakeFullPath(std::string_view path);

  // The POSIX path of the item with that HFS path, or none. More than 255 bytes are no HFS path.
  Result<std::optional<std::string>> MakeFileRefFromPath(std::string_view hfsPath);

  // The volume reference number of the first mounted volume with that HFS name, or none.
  // A name above 255 bytes or with a NUL is no volume's.
  Result<std::optional<std::int16_t>> GetVolRefnumByHFSName(std::string_view name);

  // The HFS name of the volume with that number, or none. 0 asks for the volume of "/".
  Result<std::optional<std::string>> GetHFSVolumeName(std::int16_t number);

  // The HFS name of the item at a POSIX path, or none for an item that does not exist.
  Result<std::optional<std::string>> GetHFSName(std::string_view path);

  // The POSIX path of the item with that HFS name in the folder at a POSIX path, or the path that
  // it would have; none without a folder. A name above 1023 bytes or with a NUL is no item's.
  Result<std::optional<std::string>> AddHFSName(std::string_view folder, std::string_view name);

  // The record of the item at a POSIX path, or none. An item that does not exist has one where its
  // folder does. A path above 65534 bytes or with a NUL has none.
  Result<std::optional<FileSpec>> GetFSSpec(std::string_view path);

  // The POSIX path of the item with that record, or none. Where there is no such item, it is first
  // looked for on the other volumes if so wished, and is then the path that it would have. A name
  // above 63 bytes is no record's.
  Result<std::optional<std::string>> SetFileRefFromFSSpec(const FileSpec& spec,
                                                          bool searchOtherVolumes);

  // The settings for the export of such sound to AIFF files, to be stored or passed on as they are.
  // The service keeps something of each success in memory until it ends.
  Result<ExportSettings> GetAIFFExportSettings(const SoundFormat& sound);

 private:
  Client(ServiceProcess service, std::chrono::milliseconds deadline);

  ServiceProcess mService;
  std::chrono::milliseconds mDeadline;
  std::optional<Error> mFailure;  // of an earlier request

  class Exchange;
};

}  // namespace tallowmere
