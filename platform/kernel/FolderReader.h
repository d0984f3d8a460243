// Reads the entries of an open folder one by one: getdents64(2).
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "kernel/Descriptor.h"
#include "kernel/Result.h"

namespace tallowmere::kernel {

// One entry, valid until the next one is read.
struct Entry {
  enum class Kind { kFolder, kOther, kUnknown };

  std::uint64_t inode;  // the item's, unless something is mounted there; see FileSystemKinds.h
  Kind kind;            // kUnknown when the file system does not say
  const char* name;
};

// Reads a folder from the descriptor's position to its end, skipping "." and "..".
class FolderReader {
 public:
  // REQUIRES: `folder` is open for reading and outlives the reader.
  explicit FolderReader(const Descriptor& folder) : mFolder(folder.Get()) {}
  FolderReader(const FolderReader&) = delete;
  FolderReader& operator=(const FolderReader&) = delete;

  // The next entry, or null at the end and after an error.
  const Entry* Next();

  // The error that ended the reading; number 0 for none.
  Error FailedBy() const { return mError; }

 private:
  bool Fill();

  static constexpr std::size_t kBufferSize = 32768;

  int mFolder;
  Error mError{0};
  std::size_t mAt = 0;
  std::size_t mEnd = 0;
  Entry mEntry{};
  alignas(8) std::array<char, kBufferSize> mBuffer;
};

}  // namespace tallowmere::kernel
