// One question to the service, ready to be sent, and how its answer reads. A value: it can be made
// anywhere, kept, and asked more than once, by Client::Ask or in a Batch.
//
// POSIX paths are absolute: what is answered to others is not to be relied on. "~" or "~user" at
// the beginning of one stands for the home folder of the service's user, or of that user.
//
// What the service cannot be asked (a NUL within a text, but for the name in SetFileRefFromFSSpec;
// a name or path longer than the protocol or an HFS name can be) is not sent: such a request is
// answered at once, with what each function says.
#pragma once

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

// The full HFS path of the folder at a POSIX path, or of the folder that holds the file there, with
// a colon behind it: never above 767 bytes, as folders beyond 511 bytes are left out, the outermost
// first. The volume's name and a colon where the path of a file has a link in the place of its
// folder. A colon for what is on no volume, and for what cannot be asked.
Request<std::string> MakeFullPath(std::string_view path);

// The POSIX path of the item with that HFS path, or none. More than 255 bytes are no HFS path.
Request<std::optional<std::string>> MakeFileRefFromPath(std::string_view hfsPath);

// The volume reference number of the first mounted volume with that HFS name, or none.
// A name above 255 bytes is no volume's.
Request<std::optional<std::int16_t>> GetVolRefnumByHFSName(std::string_view name);

// The HFS name of the volume with that number, or none. 0 asks for the volume of "/".
Request<std::optional<std::string>> GetHFSVolumeName(std::int16_t number);

// The HFS name of the item at a POSIX path, or none for an item that does not exist.
Request<std::optional<std::string>> GetHFSName(std::string_view path);

// The POSIX path of the item with that HFS name (or HFS path) in the folder at a POSIX path, or the
// path that it would have. Behind a path that is no folder the name's bytes are added as they are.
// A name above 255 bytes has none.
Request<std::optional<std::string>> AddHFSName(std::string_view folder, std::string_view name);

// The record of the item at a POSIX path, or none. A new item in an existing folder has one too. So
// has one whose path has a file or a link, also one to a folder, in the place of its folder; that
// record leads nowhere.
Request<std::optional<FSSpec>> GetFSSpec(std::string_view path);

// The POSIX path of the item with that HFS name (or HFS path) in the folder with the id parID, or
// the path that it would have, or none. Looks on the other volumes too. `spec.name` may have 255
// bytes here.
Request<std::optional<std::string>> SetFileRefFromFSSpecData(const FSSpec& spec);

// The POSIX path of the item with that record, or none. Where there is no such item, it is first
// looked for on the other volumes if so wished, and is then the path that it would have. Where
// there is no such folder either, it is none. A name above 63 bytes is no record's.
Request<std::optional<std::string>> SetFileRefFromFSSpec(const FSSpec& spec,
                                                         bool searchOtherVolumes);

// The settings for the export of such sound to AIFF files, to be stored or passed on as they are.
// The service keeps some 300 bytes of each success in memory until it ends.
Request<ExportSettings> GetAIFFExportSettings(const SoundFormat& sound);

}  // namespace request
}  // namespace tallowmere
