// The whole request step: arbitrary bytes as a parent's input, over a small tree.
//
// Excluded are the codes that end the process (0 and those above 10) and the buffer sizes for which
// shortening a path never ends.
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <filesystem>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "client/AnswerReader.h"
#include "fuzz/Check.h"
#include "fuzz/SmallTree.h"
#include "service/Protocol.h"
#include "service/Request.h"

namespace tallowmere::fuzz {
namespace {

// --- Requests ---------------------------------------------------------------------------------

constexpr std::size_t kCodeSize = sizeof(std::uint16_t);

// Has room for a shortened path after the longest volume's name of 63 bytes.
constexpr std::uint16_t kSmallestBuffer = 69;

template <class Number>
Number NumberAt(std::string_view bytes, std::size_t at) {
  Number number{};
  std::memcpy(&number, bytes.data() + at, sizeof number);
  return number;
}

template <class Number>
void PutNumberAt(std::string& bytes, std::size_t at, Number number) {
  std::memcpy(bytes.data() + at, &number, sizeof number);
}

// How far a request extends, field by field, up to the first field that is cut off or announces
// more than is allowed.
class Extent {
 public:
  explicit Extent(std::string_view bytes) : mBytes(bytes) { Pass(kCodeSize); }

  Extent& Pass(std::size_t size) {
    mIsWhole = mIsWhole && mBytes.size() - mSize >= size;
    if (mIsWhole) mSize += size;
    return *this;
  }
  Extent& PassCounted(std::size_t longest = 65535) {
    const std::size_t at = mSize;
    Pass(sizeof(std::uint16_t));
    const std::size_t count = mIsWhole ? NumberAt<std::uint16_t>(mBytes, at) : 0;
    mIsWhole = mIsWhole && count <= longest;
    return Pass(count);
  }

  std::optional<std::size_t> Size() const { return mIsWhole ? std::optional(mSize) : std::nullopt; }

 private:
  std::string_view mBytes;
  std::size_t mSize = 0;
  bool mIsWhole = true;
};

// The size of the request at the beginning of the bytes. Nullopt when the service does not answer.
// REQUIRES: the bytes begin with a code from 1 to 10.
std::optional<std::size_t> RequestSize(std::string_view bytes) {
  Extent extent(bytes);
  switch (NumberAt<std::uint16_t>(bytes, 0)) {
    case protocol::kRequestMakeFullPath: {
      const auto size = extent.PassCounted().Size();
      extent.Pass(sizeof(std::uint16_t));
      if (extent.Size() && NumberAt<std::uint16_t>(bytes, *size) > protocol::kLongestHFSName) {
        return std::nullopt;
      }
      return extent.Pass(1).Size();
    }
    case protocol::kRequestMakeFileRefFromPath:
      return extent.PassCounted().PassCounted().Pass(1).Size();
    case protocol::kRequestGetVolRefnumByHFSName:
      return extent.PassCounted(protocol::kLongestVolumeName).Size();
    case protocol::kRequestGetHFSVolumeName:
      return extent.Pass(sizeof(std::int16_t)).Size();
    case protocol::kRequestGetHFSName:
      return extent.PassCounted().Pass(sizeof(std::uint16_t)).Size();
    case protocol::kRequestAddHFSName:
      return extent.PassCounted().PassCounted(protocol::kLongestHFSName).Pass(1).Size();
    case protocol::kRequestGetFSSpec:
      return extent.PassCounted().Size();
    case protocol::kRequestSetFileRefFromFSSpecData:
      return extent.Pass(sizeof(std::int16_t) + sizeof(std::int32_t))
          .PassCounted(protocol::kLongestHFSName)
          .Pass(1)
          .Size();
    case protocol::kRequestSetFileRefFromFSSpec:
      return extent.Pass(protocol::kFileSpecSize + 2).Size();
    default:
      return extent.Pass(13).Size();
  }
}

// The offset of a full path's buffer size in its request. REQUIRES: the request is whole.
std::size_t BufferSizeOffset(std::string_view request) {
  return 2 * kCodeSize + NumberAt<std::uint16_t>(request, kCodeSize);
}

// Puts this machine's volume number, and a large enough buffer size, into a request.
void MakeServable(std::string& request) {
  switch (NumberAt<std::uint16_t>(request, 0)) {
    case protocol::kRequestMakeFullPath: {
      const std::size_t at = BufferSizeOffset(request);
      const auto size = NumberAt<std::uint16_t>(request, at);
      if (size != 0) PutNumberAt(request, at, std::max(size, kSmallestBuffer));
      break;
    }
    case protocol::kRequestGetHFSVolumeName:
    case protocol::kRequestSetFileRefFromFSSpecData:
    case protocol::kRequestSetFileRefFromFSSpec:
      PutNumberAt(request, kCodeSize, VolumeNumberHere(NumberAt<std::int16_t>(request, kCodeSize)));
      break;
    default:
      break;
  }
}

// --- The service ------------------------------------------------------------------------------

constexpr std::size_t kLongestAnswer = 1 << 17;

// Replaces a descriptor by a file in memory, which stands for a pipe.
void PutFileInPlaceOf(int descriptor) {
  const int file = memfd_create("pipe", MFD_CLOEXEC);
  Check(file >= 0 && dup2(file, descriptor) == descriptor);
  close(file);
}

// Serves the first request in the bytes and returns its answer, which is valid until the next call.
// The service must read exactly `size` bytes, and must answer if and only if `size` has a value.
std::string_view Serve(std::string_view bytes, std::optional<std::size_t> size) {
  static const auto answer = std::make_unique<char[]>(kLongestAnswer);
  Check(ftruncate(STDIN_FILENO, 0) == 0 && ftruncate(STDOUT_FILENO, 0) == 0);
  Check(pwrite(STDIN_FILENO, bytes.data(), bytes.size(), 0) == static_cast<ssize_t>(bytes.size()));
  Check(lseek(STDIN_FILENO, 0, SEEK_SET) == 0 && lseek(STDOUT_FILENO, 0, SEEK_SET) == 0);
  const OSErr result = service::ServeOneRequest();
  const ssize_t count = pread(STDOUT_FILENO, answer.get(), kLongestAnswer, 0);
  Check(count >= 0 && static_cast<std::size_t>(count) < kLongestAnswer);
  Check(result == (size ? noErr : ioErr));
  if (!size) Check(count == 0);
  if (size) Check(lseek(STDIN_FILENO, 0, SEEK_CUR) == static_cast<off_t>(*size));
  return {answer.get(), static_cast<std::size_t>(count)};
}

std::string Ask(const std::string& request) {
  return std::string(Serve(request, request.size()));
}

// --- Answers ----------------------------------------------------------------------------------

// A string of an answer; nullopt for the count 0.
std::optional<std::string> TakeText(AnswerReader& answer, std::string_view bytes, std::size_t at) {
  const bool isThere = NumberAt<std::uint16_t>(bytes, at) != 0;
  auto text = answer.TakeString();
  return isThere ? std::optional(std::move(text)) : std::nullopt;
}

bool IsAbsoluteOrNone(const std::optional<std::string>& path) {
  return !path || path->starts_with('/');
}

// Checks what the protocol promises of an answer beyond its framing. `bytes` is the answer.
void CheckFields(AnswerReader& answer, std::string_view request, std::string_view bytes) {
  constexpr unsigned kLongestFullPath = 767;
  constexpr unsigned kSettingsSize = 144;
  constexpr std::array<int, 7> kPathResults{0, -43, -120, -35, -37, -5000, -36};
  constexpr std::array<int, 3> kExportResults{0, -206, -50};
  switch (NumberAt<std::uint16_t>(request, 0)) {
    case protocol::kRequestMakeFullPath: {
      const auto size = NumberAt<std::uint16_t>(request, BufferSizeOffset(request));
      const auto whole = answer.Take<std::uint16_t>();
      Check(whole >= 1 && whole <= kLongestFullPath);
      if (size == 0) break;
      const std::string path = answer.TakeBuffer(size);
      const bool keepsFolders = request.back() != 0;
      if (keepsFolders) Check(whole < size ? path.size() == whole : path.size() < whole);
      if (!keepsFolders) Check(path.find(protocol::kSeparator) == std::string::npos);
      break;
    }
    case protocol::kRequestMakeFileRefFromPath: {
      const int result = answer.Take<std::int16_t>();
      const auto path = TakeText(answer, bytes, sizeof(std::int16_t));
      Check(std::find(kPathResults.begin(), kPathResults.end(), result) != kPathResults.end());
      Check((result == 0) == path.has_value() && IsAbsoluteOrNone(path));
      break;
    }
    case protocol::kRequestGetVolRefnumByHFSName: {
      const auto number = answer.Take<std::int16_t>();
      Check(number < 0 || number == protocol::kNoVolume);
      break;
    }
    case protocol::kRequestGetHFSVolumeName:
    case protocol::kRequestGetHFSName: {
      const bool isThere = answer.TakeFlag();
      const auto name = TakeText(answer, bytes, 1);
      Check(name && isThere == !name->empty() && name->size() <= protocol::kLongestSpecName);
      break;
    }
    case protocol::kRequestGetFSSpec: {
      const bool isUsable = answer.TakeFlag();
      const FSSpec spec = answer.TakeSpec();
      Check(isUsable ==
            (spec.vRefNum != protocol::kNoVolume && spec.parID != -1 && !spec.name.empty()));
      Check(EncodeFSSpec(spec) == bytes.substr(1, protocol::kFileSpecSize));
      break;
    }
    case protocol::kRequestGetAIFFExportSettings: {
      const int result = answer.Take<std::int16_t>();
      const auto size = answer.Take<std::uint32_t>();
      Check(std::find(kExportResults.begin(), kExportResults.end(), result) !=
            kExportResults.end());
      Check(size == (result == 0 ? kSettingsSize : 0));
      answer.TakeBytes(size);
      break;
    }
    default: {
      const bool isThere = answer.TakeFlag();
      const auto path = TakeText(answer, bytes, 1);
      Check(IsAbsoluteOrNone(path));
      if (NumberAt<std::uint16_t>(request, 0) != protocol::kRequestAddHFSName) {
        Check(isThere || !path);
      }
    }
  }
}

void CheckAnswer(std::string_view request, std::string_view bytes) {
  AnswerReader answer(bytes);
  CheckFields(answer, request, bytes);
  answer.TakeTrailer();
  Check(answer.IsWhole() && answer.Size() == bytes.size());
}

// Nothing changes in the tree, so the same request always has the same answer.
void CheckAgainstEarlierAnswer(std::string_view request, std::string_view answer) {
  struct Known {
    std::size_t request;
    std::size_t answer;
  };
  static const auto known = std::make_unique<std::array<Known, 1 << 16>>();
  const std::hash<std::string_view> hash;
  const Known now{hash(request), hash(answer)};
  Known& before = (*known)[now.request % known->size()];
  Check(before.request != now.request || before.answer == now.answer);
  before = now;
}

// --- Round trips ------------------------------------------------------------------------------

// Returns whether the path names an item folder by folder, without links on the way.
bool IsPlain(const std::string& path) {
  if (!path.starts_with('/') || path.size() > 4000 || path.ends_with('/')) return false;
  const std::filesystem::path whole(path);
  std::filesystem::path folder;
  std::error_code error;
  for (const auto& name : whole.parent_path()) {
    folder /= name;
    if (name == "." || name == ".." || std::filesystem::is_symlink(folder, error)) return false;
  }
  return whole.filename() != "." && whole.filename() != "..";
}

// An item's record leads back to exactly that item.
void CheckRoundTrip(const std::string& path) {
  struct stat item;
  if (!IsPlain(path) || lstat(path.c_str(), &item) != 0) return;
  std::string question("\7\0", kCodeSize);
  question.append(kCodeSize, '\0').append(path).push_back('\0');
  PutNumberAt(question, kCodeSize, static_cast<std::uint16_t>(path.size() + 1));
  const std::string record = Ask(question);
  Check(record[0] == 1);
  question.assign("\11\0", kCodeSize).append(record, 1, protocol::kFileSpecSize).append(2, '\0');
  const std::string back = Ask(question);
  Check(back[0] == 1);
  struct stat found;
  Check(lstat(back.c_str() + 1 + sizeof(std::uint16_t), &found) == 0);
  Check(found.st_dev == item.st_dev && found.st_ino == item.st_ino);
}

// Returns the path that a request or its answer is about, or nullopt.
std::optional<std::string> PathIn(std::string_view request, std::string_view answer) {
  const auto text = [](std::string_view bytes, std::size_t at) {
    const std::string_view counted =
        bytes.substr(at + sizeof(std::uint16_t), NumberAt<std::uint16_t>(bytes, at));
    return std::string(counted.substr(0, counted.find('\0')));
  };
  switch (NumberAt<std::uint16_t>(request, 0)) {
    case protocol::kRequestMakeFullPath:
    case protocol::kRequestGetHFSName:
    case protocol::kRequestGetFSSpec:
      return text(request, kCodeSize);
    case protocol::kRequestMakeFileRefFromPath:
      return text(answer, sizeof(std::int16_t));
    case protocol::kRequestAddHFSName:
    case protocol::kRequestSetFileRefFromFSSpecData:
    case protocol::kRequestSetFileRefFromFSSpec:
      return text(answer, 1);
    default:
      return std::nullopt;
  }
}

// --- The process ------------------------------------------------------------------------------

// The result changes when a descriptor stays open or is closed by mistake.
int LowestFreeDescriptor() {
  const int descriptor = dup(STDIN_FILENO);
  Check(descriptor >= 0 && close(descriptor) == 0);
  return descriptor;
}

// Serves the first request in the bytes and returns its size, or nullopt when it was the last one
// to be served.
std::optional<std::size_t> ServeOne(const std::string& bytes) {
  if (bytes.size() >= kCodeSize) {
    const auto code = NumberAt<std::uint16_t>(bytes, 0);
    if (code == protocol::kRequestQuit || code > protocol::kLastRequestCode) return std::nullopt;
  }
  const auto size = bytes.size() < kCodeSize ? std::nullopt : RequestSize(bytes);
  std::string servable = bytes;
  if (size) MakeServable(servable);
  const std::string answer(Serve(servable, size));
  if (!size) return std::nullopt;
  const std::string_view request = std::string_view(servable).substr(0, *size);
  CheckAnswer(request, answer);
  CheckAgainstEarlierAnswer(request, answer);
  if (const auto path = PathIn(request, answer)) CheckRoundTrip(*path);
  return size;
}

}  // namespace
}  // namespace tallowmere::fuzz

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  using namespace tallowmere::fuzz;
  MakeSmallTree();
  PutFileInPlaceOf(STDIN_FILENO);
  PutFileInPlaceOf(STDOUT_FILENO);
  const InsideSmallTree inside;
  VolumeNumberHere(-1);  // the mount table stays open from now on
  return 0;
}

// The input: requests one after the other.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  std::string bytes(reinterpret_cast<const char*>(data), size);
  const int free = LowestFreeDescriptor();
  const InsideSmallTree inside;
  while (const auto served = ServeOne(bytes)) bytes.erase(0, *served);
  Check(LowestFreeDescriptor() == free);
  return 0;
}
