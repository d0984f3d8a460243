#include "client/Client.h"

#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <type_traits>
#include <utility>

#include "service/Protocol.h"

namespace tallowmere {
namespace {

// The longest text that a counted string can hold with its NUL, in bytes.
constexpr std::size_t kLongestText = 65534;

constexpr std::string_view kProgramName = "tallowmere";

bool IsProgram(const std::string& path) {
  struct stat about {};
  return stat(path.c_str(), &about) == 0 && S_ISREG(about.st_mode) &&
         access(path.c_str(), X_OK) == 0;
}

std::string BesideThisProgram() {
  std::array<char, PATH_MAX> own;
  const ssize_t length = readlink("/proc/self/exe", own.data(), own.size());
  if (length <= 0) return {};
  const std::string_view path(own.data(), static_cast<std::size_t>(length));
  return std::string(path.substr(0, path.rfind('/') + 1)).append(kProgramName);
}

std::string OnSearchPath() {
  const char* const variable = std::getenv("PATH");
  std::string_view folders = variable == nullptr ? "" : variable;
  while (!folders.empty()) {
    const std::size_t end = std::min(folders.find(':'), folders.size());
    std::string path(folders.substr(0, end));
    path.append("/").append(kProgramName);
    if (end > 0 && IsProgram(path)) return path;
    folders.remove_prefix(std::min(end + 1, folders.size()));
  }
  return {};
}

// Whether a C string can carry the text whole.
bool CanBeText(std::string_view text, std::size_t longest = kLongestText) {
  return text.size() <= longest && text.find('\0') == std::string_view::npos;
}

std::string FindService() {
  std::string beside = BesideThisProgram();
  return IsProgram(beside) ? beside : OnSearchPath();
}

}  // namespace

// One request and its response. An error stays: what follows it does nothing.
class Client::Exchange {
 public:
  Exchange(Client& client, protocol::RequestCode code)
      : mClient(client), mDeadline(std::chrono::steady_clock::now() + client.mDeadline) {
    Put<std::uint16_t>(code);
  }

  template <class Number>
  void Put(Number number) {
    mRequest.append(reinterpret_cast<const char*>(&number), sizeof number);
  }

  // A counted string with its NUL. REQUIRES: below 65535 bytes.
  void PutString(std::string_view text) {
    Put(static_cast<std::uint16_t>(text.size() + 1));
    mRequest.append(text).push_back('\0');
  }

  void PutFlag(bool flag) { Put<std::uint8_t>(flag ? 1 : 0); }

  void PutSpec(const FileSpec& spec) {
    Put(spec.volume);
    Put(spec.parentID);
    Put(static_cast<std::uint8_t>(spec.name.size()));
    mRequest.append(spec.name).append(protocol::kLongestSpecName - spec.name.size(), '\0');
  }

  void Send() {
    if (mClient.mFailure) return;
    if (const auto sent = mClient.mService.Send(mRequest, mDeadline); !sent) {
      mClient.mFailure = sent.Failure();
    }
  }

  template <class Number>
  Number Take() {
    Number number{};
    const std::string bytes = TakeBytes(sizeof number);
    if (bytes.size() == sizeof number) std::memcpy(&number, bytes.data(), sizeof number);
    return number;
  }

  std::string TakeBytes(std::size_t size) {
    if (mClient.mFailure) return {};
    auto bytes = mClient.mService.Receive(size, mDeadline);
    if (bytes) return *std::move(bytes);
    mClient.mFailure = bytes.Failure();
    return {};
  }

  // A counted string without its NUL.
  std::string TakeString() {
    std::string text = TakeBytes(Take<std::uint16_t>());
    if (!text.empty()) text.pop_back();
    return text;
  }

  // The rest of a response: a flag and a string, which counts for nothing when the flag is 0 or it
  // is empty.
  Result<std::optional<std::string>> TakeOptionalString() {
    return TakeOptionalString(Take<std::uint8_t>() != 0);
  }
  Result<std::optional<std::string>> TakeOptionalString(bool isThere) {
    std::string text = TakeString();
    return Finish(isThere && !text.empty() ? std::optional(std::move(text)) : std::nullopt);
  }

  FileSpec TakeSpec() {
    FileSpec spec{};
    spec.volume = Take<std::int16_t>();
    spec.parentID = Take<std::int32_t>();
    const auto length = Take<std::uint8_t>();
    spec.name = TakeBytes(protocol::kLongestSpecName).substr(0, length);
    return spec;
  }

  // The response is whole: `value`, or what went wrong before.
  template <class T>
  Result<T> Finish(T value) {
    const std::string trailer = TakeBytes(protocol::kTrailer.size());
    if (mClient.mFailure) return *mClient.mFailure;
    if (trailer != protocol::kTrailer) {
      mClient.mFailure = Error{"the service's answer does not end as the protocol says"};
      return *mClient.mFailure;
    }
    return value;
  }

 private:
  Client& mClient;
  Deadline mDeadline;
  std::string mRequest;
};

Result<Client> Client::Start(const ClientOptions& options) {
  const std::string path = options.service.empty() ? FindService() : options.service;
  if (path.empty()) {
    return Error{"the service \"tallowmere\" is neither beside this program nor on PATH"};
  }
  auto service = ServiceProcess::Start(path);
  if (!service) return service.Failure();
  return Client(*std::move(service), options.deadline);
}

Client::Client(ServiceProcess service, std::chrono::milliseconds deadline)
    : mService(std::move(service)), mDeadline(deadline) {}

Result<std::string> Client::MakeFullPath(std::string_view path) {
  if (!CanBeText(path)) return std::string(1, protocol::kSeparator);
  // The longest buffer: a shorter one could be too short for ever.
  constexpr std::uint16_t kSize = protocol::kLongestHFSName;
  Exchange exchange(*this, protocol::kRequestMakeFullPath);
  exchange.PutString(path);
  exchange.Put(kSize);
  exchange.PutFlag(true);
  exchange.Send();
  exchange.Take<std::uint16_t>();
  const std::string buffer = exchange.TakeBytes(kSize);
  return exchange.Finish(buffer.substr(0, buffer.find('\0')));
}

Result<std::optional<std::string>> Client::MakeFileRefFromPath(std::string_view hfsPath) {
  if (!CanBeText(hfsPath, protocol::kLongestHFSPath)) return std::optional<std::string>{};
  Exchange exchange(*this, protocol::kRequestMakeFileRefFromPath);
  exchange.PutString("");
  exchange.PutString(hfsPath);
  exchange.PutFlag(false);
  exchange.Send();
  return exchange.TakeOptionalString(exchange.Take<std::int16_t>() == 0);
}

Result<std::optional<std::int16_t>> Client::GetVolRefnumByHFSName(std::string_view name) {
  if (!CanBeText(name, protocol::kLongestVolumeName - 1)) return std::optional<std::int16_t>{};
  Exchange exchange(*this, protocol::kRequestGetVolRefnumByHFSName);
  exchange.PutString(name);
  exchange.Send();
  const auto number = exchange.Take<std::int16_t>();
  return exchange.Finish(number == protocol::kNoVolume ? std::nullopt : std::optional(number));
}

Result<std::optional<std::string>> Client::GetHFSVolumeName(std::int16_t number) {
  Exchange exchange(*this, protocol::kRequestGetHFSVolumeName);
  exchange.Put(number);
  exchange.Send();
  return exchange.TakeOptionalString();
}

Result<std::optional<std::string>> Client::GetHFSName(std::string_view path) {
  if (!CanBeText(path)) return std::optional<std::string>{};
  Exchange exchange(*this, protocol::kRequestGetHFSName);
  exchange.PutString(path);
  exchange.Put(static_cast<std::uint16_t>(protocol::kLongestHFSName));
  exchange.Send();
  return exchange.TakeOptionalString();
}

Result<std::optional<std::string>> Client::AddHFSName(std::string_view folder,
                                                      std::string_view name) {
  if (!CanBeText(folder) || !CanBeText(name, protocol::kLongestHFSName - 1)) {
    return std::optional<std::string>{};
  }
  Exchange exchange(*this, protocol::kRequestAddHFSName);
  exchange.PutString(folder);
  exchange.PutString(name);
  exchange.PutFlag(false);
  exchange.Send();
  return exchange.TakeOptionalString();
}

Result<std::optional<FileSpec>> Client::GetFSSpec(std::string_view path) {
  if (!CanBeText(path)) return std::optional<FileSpec>{};
  Exchange exchange(*this, protocol::kRequestGetFSSpec);
  exchange.PutString(path);
  exchange.Send();
  const bool usable = exchange.Take<std::uint8_t>() != 0;
  FileSpec spec = exchange.TakeSpec();
  return exchange.Finish(usable ? std::optional(std::move(spec)) : std::nullopt);
}

Result<std::optional<std::string>> Client::SetFileRefFromFSSpec(const FileSpec& spec,
                                                                bool searchOtherVolumes) {
  if (spec.name.size() > protocol::kLongestSpecName) return std::optional<std::string>{};
  Exchange exchange(*this, protocol::kRequestSetFileRefFromFSSpec);
  exchange.PutSpec(spec);
  exchange.PutFlag(searchOtherVolumes);
  exchange.PutFlag(false);  // changes nothing
  exchange.Send();
  return exchange.TakeOptionalString();
}

Result<ExportSettings> Client::GetAIFFExportSettings(const SoundFormat& sound) {
  Exchange exchange(*this, protocol::kRequestGetAIFFExportSettings);
  exchange.Put(sound.rate);
  exchange.Put<std::uint32_t>(sound.sampleSize);
  exchange.Put(sound.channels);
  exchange.Put(sound.format);
  exchange.Send();
  ExportSettings settings{};
  settings.result = exchange.Take<std::int16_t>();
  settings.bytes = exchange.TakeBytes(exchange.Take<std::uint32_t>());
  return exchange.Finish(std::move(settings));
}

}  // namespace tallowmere
