#include "kernel/FolderReader.h"

#include <dirent.h>

namespace tallowmere::kernel {
namespace {

// struct linux_dirent64 of getdents(2).
struct RawEntry {
  std::uint64_t inode;
  std::int64_t offset;
  std::uint16_t size;
  std::uint8_t type;
  char name[1];
};

bool IsThisOrParent(const char* name) {
  return name[0] == '.' && (name[1] == '\0' || (name[1] == '.' && name[2] == '\0'));
}

Entry::Kind KindOf(std::uint8_t type) {
  if (type == DT_UNKNOWN) return Entry::Kind::kUnknown;
  return type == DT_DIR ? Entry::Kind::kFolder : Entry::Kind::kOther;
}

}  // namespace

const Entry* FolderReader::Next() {
  while (mAt < mEnd || Fill()) {
    const char* const begin = mBuffer.data() + mAt;
    const auto* const raw = reinterpret_cast<const RawEntry*>(begin);
    mAt += raw->size;
    mEntry = {raw->inode, KindOf(raw->type), begin + offsetof(RawEntry, name)};
    if (!IsThisOrParent(mEntry.name)) return &mEntry;
  }
  return nullptr;
}

bool FolderReader::Fill() {
  if (mError.number != 0) return false;
  const ssize_t got = getdents64(mFolder, mBuffer.data(), mBuffer.size());
  if (got < 0) mError = Error::OfLastCall();
  mAt = 0;
  mEnd = got > 0 ? static_cast<std::size_t>(got) : 0;
  return got > 0;
}

}  // namespace tallowmere::kernel
