#include <tallowmere/Request.h>

#include <cstddef>
#include <limits>

#include "client/AnswerReader.h"
#include "client/Answers.h"
#include "client/FullPathRequest.h"
#include "service/Protocol.h"

namespace tallowmere::request {
namespace {

// The longest text that a counted string can hold with its NUL, in bytes.
constexpr std::size_t kLongestText = std::numeric_limits<std::uint16_t>::max() - 1;

// Whether a C string can carry the whole text.
bool CanBeText(std::string_view text, std::size_t longest = kLongestText) {
  return text.size() <= longest && text.find('\0') == std::string_view::npos;
}

constexpr std::size_t kUsualSize = 128;  // of a request, so that its memory is allocated once

// The full path of an item that is on no volume.
std::string NoFullPath() {
  return {protocol::kSeparator};
}

template <class T>
Request<std::optional<T>> None() {
  return Request(std::optional<T>());
}

class RequestWriter {
 public:
  explicit RequestWriter(protocol::RequestCode code) {
    mBytes.reserve(kUsualSize);
    Put<std::uint16_t>(code);
  }

  template <class Number>
  RequestWriter& Put(Number number) {
    mBytes.append(reinterpret_cast<const char*>(&number), sizeof number);
    return *this;
  }

  RequestWriter& PutFlag(bool flag) { return Put<std::uint8_t>(flag ? 1 : 0); }

  // A counted string with its NUL. REQUIRES: CanBeText(text).
  RequestWriter& PutString(std::string_view text) {
    Put(static_cast<std::uint16_t>(text.size() + 1));
    mBytes.append(text).push_back('\0');
    return *this;
  }

  // REQUIRES: the name is within its bounds.
  RequestWriter& PutSpec(const FSSpec& spec) {
    mBytes.append(EncodeFSSpec(spec));
    return *this;
  }

  std::string Bytes() { return std::move(mBytes); }

 private:
  std::string mBytes;
};

std::string FullPathBytes(std::string_view path, std::uint16_t size, bool keepFolders) {
  return RequestWriter(protocol::kRequestMakeFullPath)
      .PutString(path)
      .Put(size)
      .PutFlag(keepFolders)
      .Bytes();
}

std::string FileRefBytes(std::string_view hfsPath) {
  return RequestWriter(protocol::kRequestMakeFileRefFromPath)
      .PutString("")
      .PutString(hfsPath)
      .PutFlag(false)
      .Bytes();
}

}  // namespace

Request<answer::FullPath> FullPathInBuffer(std::string_view path, std::uint16_t size,
                                           bool keepFolders) {
  if (!CanBeText(path)) return Request(answer::FullPath{1, NoFullPath()});
  return {FullPathBytes(path, size, keepFolders),
          [size](AnswerReader& answer) { return answer::ReadFullPath(answer, size); }};
}

Request<std::string> MakeFullPath(PathView path) {
  if (!CanBeText(path.Text())) return Request(NoFullPath());
  return {FullPathBytes(path.Text(), kLongestFullPathBuffer, true), [](AnswerReader& answer) {
            return answer::ReadFullPath(answer, kLongestFullPathBuffer).text;
          }};
}

Request<std::optional<std::string>> MakeFileRefFromPath(std::string_view hfsPath) {
  if (!CanBeText(hfsPath, protocol::kLongestHFSPath)) {
    return None<std::string>();
  }
  return {FileRefBytes(hfsPath), answer::ReadPathByResult};
}

Request<answer::PathByResult> PathAndResult(std::string_view hfsPath) {
  return {FileRefBytes(hfsPath), answer::ReadPathAndResult};
}

Request<std::optional<std::int16_t>> GetVolRefnumByHFSName(std::string_view name) {
  if (!CanBeText(name, protocol::kLongestVolumeName - 1)) {
    return None<std::int16_t>();
  }
  return {RequestWriter(protocol::kRequestGetVolRefnumByHFSName).PutString(name).Bytes(),
          answer::ReadVolumeNumber};
}

Request<std::optional<std::string>> GetHFSVolumeName(std::int16_t number) {
  return {RequestWriter(protocol::kRequestGetHFSVolumeName).Put(number).Bytes(),
          answer::ReadStringByFlag};
}

Request<std::optional<std::string>> GetHFSName(PathView path) {
  if (!CanBeText(path.Text())) return None<std::string>();
  return {RequestWriter(protocol::kRequestGetHFSName)
              .PutString(path.Text())
              .Put<std::uint16_t>(protocol::kLongestHFSName)
              .Bytes(),
          answer::ReadStringByFlag};
}

Request<std::optional<std::string>> AddHFSName(PathView folder, std::string_view name) {
  if (!CanBeText(folder.Text()) || !CanBeText(name, protocol::kLongestHFSPath)) {
    return None<std::string>();
  }
  return {RequestWriter(protocol::kRequestAddHFSName)
              .PutString(folder.Text())
              .PutString(name)
              .PutFlag(false)
              .Bytes(),
          answer::ReadStringByFlag};
}

Request<std::optional<FSSpec>> GetFSSpec(PathView path) {
  if (!CanBeText(path.Text())) return None<FSSpec>();
  return {RequestWriter(protocol::kRequestGetFSSpec).PutString(path.Text()).Bytes(),
          answer::ReadSpec};
}

Request<std::optional<std::string>> SetFileRefFromFSSpecData(const FSSpec& spec) {
  if (!CanBeText(spec.name, protocol::kLongestHFSPath)) {
    return None<std::string>();
  }
  return {RequestWriter(protocol::kRequestSetFileRefFromFSSpecData)
              .Put(spec.vRefNum)
              .Put(spec.parID)
              .PutString(spec.name)
              .PutFlag(false)  // has no effect
              .Bytes(),
          answer::ReadStringByFlag};
}

Request<std::optional<std::string>> SetFileRefFromFSSpec(const FSSpec& spec,
                                                         bool searchOtherVolumes) {
  if (spec.name.size() > protocol::kLongestSpecName) {
    return None<std::string>();
  }
  return {RequestWriter(protocol::kRequestSetFileRefFromFSSpec)
              .PutSpec(spec)
              .PutFlag(searchOtherVolumes)
              .PutFlag(false)  // has no effect
              .Bytes(),
          answer::ReadStringByFlag};
}

Request<ExportSettings> GetAIFFExportSettings(const SoundFormat& sound) {
  return {RequestWriter(protocol::kRequestGetAIFFExportSettings)
              .Put(sound.rate)
              .Put<std::uint32_t>(sound.sampleSize)
              .Put(sound.channels)
              .Put(sound.format)
              .Bytes(),
          answer::ReadExportSettings};
}

}  // namespace tallowmere::request
