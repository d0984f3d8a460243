#include "stores/Stores.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string_view>
#include <utility>

#include "formats/AppleDouble.h"
#include "formats/Bytes.h"
#include "kernel/Contents.h"
#include "kernel/Paths.h"

namespace tallowmere::stores {
namespace {

using formats::AppleDouble;
using kernel::Result;

// What a store has of a file; empty for nothing.
using Content = Result<std::string>;

constexpr std::size_t kFinderInfoSize = 32;
constexpr std::size_t kFlagsAt = 8;

bool IsAllZero(std::string_view bytes) {
  return bytes.find_first_not_of('\0') == std::string_view::npos;
}

// The Finder information that these bytes begin with; empty when it is not there or all zero.
std::string FinderInfoIn(std::string_view bytes) {
  const auto info = formats::Piece(bytes, 0, kFinderInfoSize);
  return info && !IsAllZero(*info) ? std::string(*info) : std::string();
}

// Whatever else a file system answers, it has no such attribute.
Content AttributeOf(const kernel::Descriptor& file, const char* name) {
  auto value = kernel::ReadAttribute(file, name);
  if (value) return value;
  const kernel::Error error = value.Error();
  const bool isHidden = error.number == EACCES || error.number == EIO || error.number == ENOMEM;
  return isHidden ? Content(error) : std::string();
}

// --- The SMB server's streams -------------------------------------------------------------------

// One byte more than the stream: 0 where all of it is in this attribute.
std::string_view StreamIn(std::string_view attribute) {
  if (attribute.empty() || attribute.back() != '\0') return {};
  attribute.remove_suffix(1);
  return attribute;
}

// AFP_AfpInfo: "AFP" and NUL, version 1.0, reserved, backup time, then the Finder information.
std::string FinderInfoInStream(std::string_view stream) {
  constexpr std::uint32_t kSignature = 0x41465000;
  constexpr std::uint32_t kVersion = 0x00010000;
  constexpr std::size_t kSize = 60;
  constexpr std::size_t kFinderInfoAt = 16;
  if (stream.size() != kSize || formats::BigEndianAt<std::uint32_t>(stream, 0) != kSignature ||
      formats::BigEndianAt<std::uint32_t>(stream, 4) != kVersion) {
    return {};
  }
  return FinderInfoIn(stream.substr(kFinderInfoAt));
}

// --- AppleDouble --------------------------------------------------------------------------------

std::string FinderInfoInHeader(const std::string& bytes) {
  const auto header = formats::ReadAppleDouble(bytes, bytes.size());
  const auto* const entry =
      header && !header->isSingle ? header->Find(AppleDouble::kFinderInfo) : nullptr;
  if (entry == nullptr) return {};
  return FinderInfoIn(formats::Piece(bytes, entry->offset, entry->length).value_or(""));
}

// An entry of an AppleDouble file; its first bytes, where it is longer than `most`.
Content EntryIn(const kernel::Descriptor& file, std::uint32_t id, std::size_t most) {
  const auto size = kernel::SizeOf(file);
  if (!size) return size.Error();
  const auto head = kernel::ReadBytes(file, 0, formats::kLongestAppleDoubleHead);
  if (!head) return head.Error();
  const auto header = formats::ReadAppleDouble(*head, *size);
  const auto* const entry = header && !header->isSingle ? header->Find(id) : nullptr;
  if (entry == nullptr) return std::string();
  return kernel::ReadBytes(file, entry->offset,
                           static_cast<std::size_t>(std::min<std::uint64_t>(entry->length, most)));
}

// Of an AppleDouble file that is not there, or does not open.
Content Without(kernel::Error error) {
  const bool isMissing = kernel::MeansGone(error) || error.number == ENAMETOOLONG;
  return isMissing ? Content(std::string()) : error;
}

Content EntryAt(const kernel::Spot& sidecar, std::uint32_t id, std::size_t most) {
  const auto opened = kernel::OpenFile(sidecar);
  return opened ? EntryIn(*opened, id, most) : Without(opened.Error());
}

Content EntryBeside(const catalog::Look& file, std::uint32_t id, std::size_t most) {
  const std::string name = std::string("._") + file.Name();
  return EntryAt(file.Folder().SpotOf(name.c_str()), id, most);
}

// A link in place of the folder would lead to other files' entries.
Content EntryInFolder(const catalog::Look& file, std::uint32_t id, std::size_t most) {
  const auto folder = kernel::HoldFolderIn(file.Folder().SpotOf(".AppleDouble"));
  return folder ? EntryAt({folder->Get(), file.Name()}, id, most) : Without(folder.Error());
}

// --- In their order -----------------------------------------------------------------------------

// What one of the two is in an attribute: its name, and how to take it out.
struct Attribute {
  const char* name;
  std::string (*take)(const std::string& attribute);
};

std::string Whole(const std::string& attribute) {
  return attribute;
}

constexpr Attribute kFinderInfoAttributes[] = {
    {"user.com.apple.FinderInfo", [](const std::string& info) { return FinderInfoIn(info); }},
    {"com.apple.FinderInfo", [](const std::string& info) { return FinderInfoIn(info); }},
    {"osx.com.apple.FinderInfo", [](const std::string& info) { return FinderInfoIn(info); }},
    {"user.org.netatalk.Metadata", FinderInfoInHeader},
    {"user.DosStream.AFP_AfpInfo:$DATA",
     [](const std::string& stream) { return FinderInfoInStream(StreamIn(stream)); }},
};

constexpr Attribute kForkAttributes[] = {
    {"user.com.apple.ResourceFork", Whole},
    {"com.apple.ResourceFork", Whole},
    {"user.org.netatalk.ResourceFork", Whole},
    {"user.DosStream.AFP_Resource:$DATA",
     [](const std::string& stream) { return std::string(StreamIn(stream)); }},
};

// The first content that is not empty: of the attributes, then of entries of sidecars, from which
// at most so many bytes are wanted.
template <std::size_t count>
Content FirstOf(const Attribute (&attributes)[count], std::uint32_t entry, std::size_t most,
                const catalog::Look& file, const kernel::Descriptor& contents) {
  for (const Attribute& attribute : attributes) {
    const auto value = AttributeOf(contents, attribute.name);
    if (!value) return value.Error();
    std::string taken = attribute.take(*value);
    if (!taken.empty()) return taken;
  }
  for (const auto& entryOf : {EntryBeside, EntryInFolder}) {
    auto content = entryOf(file, entry, most);
    if (!content) return content;
    const bool isThere =
        entry == AppleDouble::kFinderInfo ? !FinderInfoIn(*content).empty() : !content->empty();
    if (isThere) return content;
  }
  return std::string();
}

}  // namespace

Result<std::optional<std::uint16_t>> FinderFlagsOf(const catalog::Look& file,
                                                   const kernel::Descriptor& contents) {
  const auto info =
      FirstOf(kFinderInfoAttributes, AppleDouble::kFinderInfo, kFinderInfoSize, file, contents);
  if (!info) return info.Error();
  return formats::BigEndianAt<std::uint16_t>(*info, kFlagsAt);
}

Result<std::string> ResourceForkOf(const catalog::Look& file, const kernel::Descriptor& contents) {
  auto fork =
      FirstOf(kForkAttributes, AppleDouble::kResourceFork, kLongestFork + 1, file, contents);
  if (fork && fork->size() > kLongestFork) return kernel::Error{EFBIG};
  return fork;
}

}  // namespace tallowmere::stores
