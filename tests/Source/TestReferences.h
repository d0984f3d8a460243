// Shared by the tests of the file reference: access to its private fields, and paths.
#pragma once

#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <optional>
#include <string>

#include "Source/CFOwned.h"
#include "Source/CFileRef.h"
#include "platform/foundation/TestStrings.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

using foundation::test::MakeName;
using foundation::test::MakeString;
using foundation::test::MakeUrl;
using foundation::test::NameOf;
using foundation::test::ParseUrl;

// --- The private fields -----------------------------------------------------------------------
//
// An explicit instantiation may name private members.

template <typename Field, typename Field::Type kMember>
struct Reveal {
  friend typename Field::Type MemberOf(Field) { return kMember; }
};

#define TALLOWMERE_REVEAL(name, type, member) \
  struct name {                               \
    using Type = type CFileRef::*;            \
    friend Type MemberOf(name);               \
  };                                          \
  template struct Reveal<name, &CFileRef::member>

TALLOWMERE_REVEAL(UrlField, CFURLRef, mURL);
TALLOWMERE_REVEAL(ValidField, UInt32, mValid);
TALLOWMERE_REVEAL(PathField, char*, mPath);
TALLOWMERE_REVEAL(FSRefField, FSRef, mFSRef);
TALLOWMERE_REVEAL(FSSpecField, FSSpec, mFSSpec);

#undef TALLOWMERE_REVEAL

inline CFURLRef UrlOf(const CFileRef& reference) {
  return reference.*MemberOf(UrlField());
}
inline const char* CachedPathOf(const CFileRef& reference) {
  return reference.*MemberOf(PathField());
}
inline const FSRef& CachedFSRefOf(const CFileRef& reference) {
  return reference.*MemberOf(FSRefField());
}
inline FSSpec& CachedFSSpecOf(CFileRef& reference) {
  return reference.*MemberOf(FSSpecField());
}

inline bool IsZero(const FSRef& item) {
  return std::all_of(std::begin(item.hidden), std::end(item.hidden),
                     [](UInt8 byte) { return byte == 0; });
}

// Returns whether every field is as in a new reference.
inline bool IsEmpty(const CFileRef& reference) {
  const FSSpec& spec = reference.*MemberOf(FSSpecField());
  return UrlOf(reference) == nullptr && reference.*MemberOf(ValidField()) == 0 &&
         CachedPathOf(reference) == nullptr && IsZero(CachedFSRefOf(reference)) &&
         spec.vRefNum == 32767 && spec.parID == -1 && spec.name[0] == 0;
}

// --- Paths ------------------------------------------------------------------------------------

// Returns the POSIX path, which may be relative, or nullopt for an empty reference.
inline std::optional<std::string> PathOf(const CFileRef& reference) {
  return NameOf(CFOwned(reference.CopyFileSystemPath(kPathStylePOSIX)).Get());
}

inline bool IsMarkedAsFolder(const CFileRef& reference) {
  return CFURLHasDirectoryPath(UrlOf(reference)) != 0;
}

// Changes the current folder while the object exists.
class CurrentFolder {
 public:
  explicit CurrentFolder(const std::filesystem::path& path)
      : mFormer(std::filesystem::current_path()) {
    std::filesystem::current_path(path);
  }
  CurrentFolder(const CurrentFolder&) = delete;
  CurrentFolder& operator=(const CurrentFolder&) = delete;
  ~CurrentFolder() {
    std::error_code ignored;
    std::filesystem::current_path(mFormer, ignored);
  }

 private:
  std::filesystem::path mFormer;
};

}  // namespace tallowmere::test
