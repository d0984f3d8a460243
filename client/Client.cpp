#include <tallowmere/Client.h>

#include <algorithm>
#include <cstddef>
#include <utility>

#include "client/Conversation.h"
#include "client/FullPathRequest.h"
#include "service/Protocol.h"

namespace tallowmere {
namespace {

// The length of folders that have been shortened as far as they can be: "...:", or a first folder
// no longer than that.
constexpr std::size_t kShortestFolders = 4;

std::string_view VolumeNameOf(std::string_view fullPath) {
  return fullPath.substr(0, fullPath.find(protocol::kSeparator));
}

// Whether shortening the full path for a buffer of `size` bytes ever ends.
bool CanBeShortened(const answer::FullPath& whole, std::size_t size) {
  const std::size_t volume = VolumeNameOf(whole.text).size() + 1;
  return volume + std::min<std::size_t>(whole.wholeLength - volume, kShortestFolders) < size;
}

}  // namespace

Client::Client(ClientOptions options)
    : mConversation(std::make_unique<Conversation>(std::move(options))) {}
Client::Client(Client&& other) noexcept = default;
Client& Client::operator=(Client&& other) noexcept = default;
Client::~Client() = default;

Result<std::string> Client::MakeFullPath(PathView path) {
  return Ask(request::MakeFullPath(path));
}

Result<std::string> Client::MakeFullPath(PathView path, std::uint16_t size, bool keepFolders) {
  if (size == 0 || size > request::kLongestFullPathBuffer) {
    return Error{Outcome::kInvalid,
                 "a full path is asked for in 1 to 1024 bytes, not in " + std::to_string(size)};
  }
  auto whole = Ask(request::FullPathInBuffer(path.Text(), request::kLongestFullPathBuffer, true));
  if (!whole) return whole.Failure();
  if (!CanBeShortened(*whole, size)) {
    return Error{Outcome::kInvalid,
                 "the full path cannot be shortened to " + std::to_string(size) + " bytes"};
  }
  if (!keepFolders) return std::string(VolumeNameOf(whole->text));
  if (whole->wholeLength < size) return std::move(whole->text);
  auto shortened = Ask(request::FullPathInBuffer(path.Text(), size, true));
  if (!shortened) return shortened.Failure();
  return std::move(shortened->text);
}

Result<std::optional<std::string>> Client::MakeFileRefFromPath(std::string_view hfsPath) {
  return Ask(request::MakeFileRefFromPath(hfsPath));
}

Result<std::optional<std::int16_t>> Client::GetVolRefnumByHFSName(std::string_view name) {
  return Ask(request::GetVolRefnumByHFSName(name));
}

Result<std::optional<std::string>> Client::GetHFSVolumeName(std::int16_t number) {
  return Ask(request::GetHFSVolumeName(number));
}

Result<std::optional<std::string>> Client::GetHFSName(PathView path) {
  return Ask(request::GetHFSName(path));
}

Result<std::optional<std::string>> Client::AddHFSName(PathView folder, std::string_view name) {
  return Ask(request::AddHFSName(folder, name));
}

Result<std::optional<FSSpec>> Client::GetFSSpec(PathView path) {
  return Ask(request::GetFSSpec(path));
}

Result<std::optional<std::string>> Client::SetFileRefFromFSSpecData(const FSSpec& spec) {
  return Ask(request::SetFileRefFromFSSpecData(spec));
}

Result<std::optional<std::string>> Client::SetFileRefFromFSSpec(const FSSpec& spec,
                                                                bool searchOtherVolumes) {
  return Ask(request::SetFileRefFromFSSpec(spec, searchOtherVolumes));
}

Result<ExportSettings> Client::GetAIFFExportSettings(const SoundFormat& sound) {
  return Ask(request::GetAIFFExportSettings(sound));
}

}  // namespace tallowmere
