// One question to the service, ready to be sent, and how to read its answer. A value: it can be
// made anywhere, kept, and asked more than once, by Client::Ask or in a Batch.
//
// The service is sent what is given here, and its answer is handed over as it is. The conversions
// of Client and Converter are made of these and refuse what would lead elsewhere; prefer them.
//
// POSIX paths are absolute; do not rely on the answers to others. A leading "~" or "~user" stands
// for the home folder of the service's user, or of the named user.
//
// A question that cannot be put to the service is answered at once, without being sent, as each
// function states: one with a NUL within a text (except the name in SetFileRefFromFSSpec), or with
// a name or path longer than the protocol allows or an HFS name can be.
#pragma once

#include <tallowmere/PathView.h>
#include <tallowmere/Types.h>

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

namespace tallowmere {

class AnswerReader;

template <class T>
class Request {
 public:
  // Reads the fields of an answer, up to the trailer.
  using Reader = std::function<T(AnswerReader&)>;

  Request(std::string bytes, Reader reader)
      : mBytes(std::move(bytes)), mReader(std::move(reader)) {}
  // Answered without being sent.
  explicit Request(T answer) : mAnswer(std::move(answer)) {}

 private:
  friend class Batch;

  std::string mBytes;
  Reader mReader;
  std::optional<T> mAnswer;  // has a value when there is nothing to send
};

namespace request {

// The full HFS path of the folder at a POSIX path, or of the folder that holds the file there,
// followed by a colon. At most 767 bytes: of more than 511 bytes of folders, the outermost are left
// out. Just the volume's name and a colon when a link stands in the place of the file's folder.
// Just a colon for an item that is on no volume, and for a question that cannot be put.
Request<std::string> MakeFullPath(PathView path);

// The POSIX path of the item with an HFS path, or nullopt. No HFS path has more than 255 bytes.
Request<std::optional<std::string>> MakeFileRefFromPath(std::string_view hfsPath);

// The volume reference number of the first mounted volume with an HFS name, or nullopt. No volume's
// name has more than 255 bytes.
Request<std::optional<std::int16_t>> GetVolRefnumByHFSName(std::string_view name);

// The HFS name of the volume with a number, or nullopt. 0 is the volume of "/".
Request<std::optional<std::string>> GetHFSVolumeName(std::int16_t number);

// The HFS name of the item at a POSIX path. Nullopt for an item that does not exist.
Request<std::optional<std::string>> GetHFSName(PathView path);

// The POSIX path that the item with an HFS name (or HFS path) in the folder at a POSIX path has, or
// would have. After a path that is not a folder's, the name's bytes are added as they are. Nullopt
// for a name above 255 bytes.
Request<std::optional<std::string>> AddHFSName(PathView folder, std::string_view name);

// The record of the item at a POSIX path, or nullopt. A new item in an existing folder has one too.
// So has an item whose path has a file, or a link (even one to a folder), in the place of its
// folder; that record leads nowhere.
Request<std::optional<FSSpec>> GetFSSpec(PathView path);

// The POSIX path that the item with an HFS name (or HFS path) in the folder with the id parID has,
// or would have; or nullopt. Searches the other volumes too. Here `spec.name` may have up to 255
// bytes.
Request<std::optional<std::string>> SetFileRefFromFSSpecData(const FSSpec& spec);

// The POSIX path of the item with a record. When there is no such item, it is searched for on the
// other volumes if `searchOtherVolumes` is set; failing that, the result is the path that it would
// have. Nullopt when there is no such folder either. No record's name has more than 63 bytes.
Request<std::optional<std::string>> SetFileRefFromFSSpec(const FSSpec& spec,
                                                         bool searchOtherVolumes);

// The settings for exporting such a sound to AIFF files, to be stored or passed on unchanged. For
// each success, the service keeps some 300 bytes in memory until it ends.
Request<ExportSettings> GetAIFFExportSettings(const SoundFormat& sound);

}  // namespace request
}  // namespace tallowmere
