// Records and references of real items, for the tests of the calls that make and take them.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <CoreServices/CoreServices.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "files/Catalog.h"
#include "files/ItemReference.h"
#include "files/NodeID.h"
#include "files/PascalName.h"
#include "support/OwnMountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::files {

struct Str255Of {
  explicit Str255Of(std::string_view text) { CopyToPascal(text, bytes); }
  Str255 bytes = {};
};

inline FSRef ReferenceTo(const std::string& path) {
  const auto item = ReadItem(AT_FDCWD, path.c_str());
  EXPECT_TRUE(item) << path;
  if (!item) return {};
  RememberPlace({path, *item});
  return Pack(*item);
}

inline std::string PathOf(const FSRef& reference) {
  const auto item = Unpack(&reference);
  const auto path = item ? FindCanonicalPath(*item) : std::nullopt;
  return path.value_or("(none)");
}

inline FSSpec SpecOf(const std::string& path) {
  const FSRef reference = ReferenceTo(path);
  FSSpec spec{};
  EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr), noErr)
      << path;
  return spec;
}

inline std::string NameOf(const FSSpec& spec) {
  return std::string(TextOfPascal(spec.name));
}

// By value: the field is not aligned, so no reference may be bound to it.
inline std::uint32_t ParentOf(const FSSpec& spec) {
  return static_cast<std::uint32_t>(spec.parID);
}

inline FSCatalogInfo InfoOf(const std::string& path) {
  const FSRef reference = ReferenceTo(path);
  FSCatalogInfo info{};
  EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoVolume | kFSCatInfoNodeID, &info, nullptr,
                             nullptr, nullptr),
            noErr)
      << path;
  return info;
}

inline std::uint32_t IDOf(const std::string& path) {
  return InfoOf(path).nodeID;
}

// What FSpMakeFSRef finds: a path, or the result code in brackets.
inline std::string ItemOf(const FSSpec& spec) {
  FSRef reference{};
  const OSErr error = FSpMakeFSRef(&spec, &reference);
  return error == noErr ? PathOf(reference) : "(" + std::to_string(error) + ")";
}

inline FSSpec MakeRecord(SInt16 volume, std::uint32_t parent, std::string_view name) {
  FSSpec spec{};
  spec.vRefNum = volume;
  spec.parID = static_cast<SInt32>(parent);
  CopyToPascal(name, spec.name);
  return spec;
}

// Whether `work` says true in a child process that has no privileges.
template <class Work>
bool HoldsForNobody(Work work) {
  constexpr uid_t kNobody = 65534;
  const pid_t child = fork();
  if (child == 0) _exit(setresuid(kNobody, kNobody, kNobody) == 0 && work() ? 0 : 1);
  int status = 0;
  return waitpid(child, &status, 0) == child && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

}  // namespace tallowmere::files
