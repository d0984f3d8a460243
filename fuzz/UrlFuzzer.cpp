// URLs: arbitrary bytes as a URL's text, and as a path or component of one.
#include <CoreFoundation/CoreFoundation.h>

#include <optional>
#include <string>

#include "CFOwned.h"
#include "foundation/PathText.h"
#include "foundation/PercentEncoding.h"
#include "foundation/String.h"
#include "foundation/Url.h"
#include "foundation/UrlParts.h"
#include "fuzz/Check.h"
#include "text/FileNameText.h"

namespace tallowmere::fuzz {
namespace {

using OwnedUrl = CFOwned<CFURLRef>;
using OwnedString = CFOwned<CFStringRef>;

OwnedString StringOfBytes(std::string_view bytes) {
  return OwnedString(foundation::CreateString(text::TextOfFileName(bytes)));
}

std::optional<std::string> BytesOf(const OwnedString& string) {
  if (!string) return std::nullopt;
  return text::FileNameOfText(foundation::StringOf(string.Get()).Text());
}

std::optional<std::string> PathOf(CFURLRef url) {
  return BytesOf(OwnedString(CFURLCopyFileSystemPath(url, kCFURLPOSIXPathStyle)));
}

// The parts of any text reassemble to the text.
void CheckParts(std::string_view text) {
  const foundation::UrlParts parts = foundation::SplitUrl(text);
  std::string whole;
  if (parts.scheme) whole.append(*parts.scheme).push_back(':');
  if (parts.authority) whole.append("//").append(*parts.authority);
  whole.append(parts.path);
  if (parts.query) whole.append("?").append(*parts.query);
  if (parts.fragment) whole.append("#").append(*parts.fragment);
  Check(whole == text);
  Check(foundation::WithPath(text, parts.path) == text);
}

// The URL of a URL's path names the same path.
void CheckPath(CFURLRef url) {
  const auto path = PathOf(url);
  Boolean isAbsolute = false;
  Check(BytesOf(OwnedString(CFURLCopyStrictPath(url, &isAbsolute))) == path);
  if (!path) return;
  Check((isAbsolute != 0) == path->starts_with('/'));
  Check(!path->ends_with('/') || *path == "/");
  for (const Boolean isFolder : {Boolean{0}, Boolean{1}}) {
    const OwnedUrl again(CFURLCreateWithFileSystemPath(
        kCFAllocatorDefault, StringOfBytes(*path).Get(), kCFURLPOSIXPathStyle, isFolder));
    Check(again.Get() != nullptr && PathOf(again.Get()) == path);
    Check(foundation::IsUrl(foundation::UrlOf(again.Get()).Text()));
    Check(CFURLHasDirectoryPath(again.Get()) || !isFolder);
  }
}

// A URL's folder, and that folder with the name added, are URLs; the latter has the name again.
void CheckComponents(CFURLRef url) {
  const auto name = BytesOf(OwnedString(CFURLCopyLastPathComponent(url)));
  const auto extension = BytesOf(OwnedString(CFURLCopyPathExtension(url)));
  if (extension && name) Check(name->ends_with("." + *extension));
  const OwnedUrl folder(CFURLCreateCopyDeletingLastPathComponent(kCFAllocatorDefault, url));
  if (!folder) return;
  Check(foundation::IsUrl(foundation::UrlOf(folder.Get()).Text()));
  Check(CFURLHasDirectoryPath(folder.Get()) != 0);
  if (!name) return;
  const OwnedUrl again(CFURLCreateCopyAppendingPathComponent(
      kCFAllocatorDefault, folder.Get(), StringOfBytes(*name).Get(), CFURLHasDirectoryPath(url)));
  Check(again.Get() != nullptr && foundation::IsUrl(foundation::UrlOf(again.Get()).Text()));
  if (name->find('/') != std::string::npos) return;
  Check(BytesOf(OwnedString(CFURLCopyLastPathComponent(again.Get()))) == name);
}

void CheckUrl(std::string_view text) {
  CheckParts(text);
  const OwnedUrl url(
      CFURLCreateWithBytes(kCFAllocatorDefault, reinterpret_cast<const UInt8*>(text.data()),
                           static_cast<CFIndex>(text.size()), kCFStringEncodingUTF8, nullptr));
  Check((url.Get() != nullptr) == foundation::IsUrl(text));
  if (!url) return;
  Check(foundation::UrlOf(url.Get()).Text() == text);
  CheckPath(url.Get());
  CheckComponents(url.Get());
}

// Arbitrary bytes can be percent-encoded and form a URL as an absolute path.
void CheckBytes(std::string_view bytes) {
  Check(foundation::PercentDecode(bytes).size() <= bytes.size());
  for (const bool isStart : {false, true}) {
    std::string text;
    foundation::AppendPercentEncodedPath(text, bytes, isStart);
    Check(foundation::PercentDecode(text) == bytes);
  }
  const std::string path = "/" + std::string(bytes);
  const OwnedUrl url(foundation::CreateUrlOfPath(path, false));
  Check(foundation::IsUrl(foundation::UrlOf(url.Get()).Text()));
  if (bytes.find('\0') != bytes.npos) return;
  Check(foundation::PathOfUrl(url.Get()) == foundation::WithFolderMark(path, false));
  Check(foundation::AbsolutePathOfUrl(url.Get()) == foundation::PathOfUrl(url.Get()));
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: a kind, then the bytes.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  Input input(data, size);
  switch (input.TakeByte() % 2) {
    case 0:
      CheckUrl(input.Rest());
      break;
    default:
      CheckBytes(input.Rest());
  }
  return 0;
}
