// The floor: what no service for these requests can do without.
//
// tallowmere_floor PARENT_PROCESS_ID ITEM VOLUME_NAME: reads, field by field, a request (0 and
// unknown codes end it), writes an answer of constant content field by field, and looks for its
// parent, with the very calls that the service makes for that. In between it makes the fewest
// file-system calls that an answer can rest on, given a memory without cost of everything that an
// earlier request has told:
//
// - One poll on the mount table where the answer depends on which volumes there are. The table is
//   read once.
// - One look (statx) at everything that the answer claims to exist, as all else of it can have been
//   remembered: that the folder with an id is still at its place (one look at that place) and that
//   a path leads to an item (one look at the path, whatever its depth, which proves the folders on
//   the way too).
//
// For each code it says below which those are. ITEM is the path of an existing item with a name
// that is its HFS name, the one that the requests are about.
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <climits>
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "service/Protocol.h"

namespace {

using namespace tallowmere::protocol;

constexpr std::size_t kExportSettingsSize = 144;

char fields[1 << 16];
char answer[1 << 16];

void Take(std::size_t size) {
  for (std::size_t count = 0; count < size;) {
    const ssize_t got = read(STDIN_FILENO, fields + count, size - count);
    if (got < 1) _exit(EXIT_SUCCESS);
    count += static_cast<std::size_t>(got);
  }
}

std::uint16_t TakeU16() {
  Take(sizeof(std::uint16_t));
  std::uint16_t number;
  std::memcpy(&number, fields, sizeof number);
  return number;
}

void TakeCounted() {
  Take(TakeU16());
}

void Put(const void* bytes, std::size_t size) {
  if (write(STDOUT_FILENO, bytes, size) != static_cast<ssize_t>(size)) _exit(EXIT_SUCCESS);
}

void PutString(const char* text) {
  const auto size = static_cast<std::uint16_t>(std::strlen(text) + 1);
  Put(&size, sizeof size);
  Put(text, size);
}

void LookAt(const char* path) {
  struct statx about {};
  statx(AT_FDCWD, path, AT_SYMLINK_NOFOLLOW | AT_NO_AUTOMOUNT, STATX_BASIC_STATS | STATX_MNT_ID,
        &about);
}

void PollMountTable() {
  static int table = -1;
  if (table < 0) {
    table = open("/proc/self/mountinfo", O_RDONLY | O_CLOEXEC);
    while (read(table, fields, sizeof fields) > 0) continue;
  } else {
    pollfd watched{table, POLLPRI, 0};
    poll(&watched, 1, 0);
  }
}

// `item` is that of the request, `folder` holds it and `name` is its last component.
void Serve(std::uint16_t code, const char* item, const char* folder, const char* name,
           const char* volume) {
  switch (code) {
    // The full path is that of the folder of what is there: is the item one, and is its folder the
    // one whose names are remembered?
    case kRequestMakeFullPath: {
      TakeCounted();
      const std::uint16_t size = TakeU16();
      Take(1);
      LookAt(item);
      LookAt(folder);
      PollMountTable();
      Put(answer, sizeof(std::uint16_t));
      Put(answer, size);
      break;
    }
    // Plain names are the names of Linux: the kernel walks the whole path in one look.
    case kRequestMakeFileRefFromPath:
      TakeCounted();
      TakeCounted();
      Take(1);
      PollMountTable();
      LookAt(item);
      Put(answer, sizeof(std::int16_t));
      PutString(item);
      break;
    case kRequestGetVolRefnumByHFSName:
      TakeCounted();
      PollMountTable();
      Put(answer, sizeof(std::int16_t));
      break;
    case kRequestGetHFSVolumeName:
      Take(sizeof(std::int16_t));
      PollMountTable();
      Put(answer, 1);
      PutString(volume);
      break;
    // There is such an item; the kernel says too whether it is a mounted root, which is called as
    // its volume.
    case kRequestGetHFSName:
      TakeCounted();
      TakeU16();
      LookAt(item);
      PollMountTable();
      Put(answer, 1);
      PutString(name);
      break;
    // The item is there and so is its folder. Whether that is on a volume decides what a name is.
    case kRequestAddHFSName:
      TakeCounted();
      TakeCounted();
      Take(1);
      LookAt(item);
      PollMountTable();
      Put(answer, 1);
      PutString(item);
      break;
    // There is the item, and the record has the number of its folder.
    case kRequestGetFSSpec:
      TakeCounted();
      LookAt(item);
      LookAt(folder);
      PollMountTable();
      Put(answer, 1);
      Put(answer, kFileSpecSize);
      break;
    // The folder with the id is where it was, and has the item.
    case kRequestSetFileRefFromFSSpecData:
      Take(sizeof(std::int16_t));
      Take(sizeof(std::int32_t));
      TakeCounted();
      Take(1);
      PollMountTable();
      LookAt(folder);
      LookAt(item);
      Put(answer, 1);
      PutString(item);
      break;
    case kRequestSetFileRefFromFSSpec:
      Take(kFileSpecSize);
      Take(1);
      Take(1);
      PollMountTable();
      LookAt(folder);
      LookAt(item);
      Put(answer, 1);
      PutString(item);
      break;
    // Asks nobody.
    case kRequestGetAIFFExportSettings:
      Take(sizeof(std::uint32_t));
      Take(sizeof(std::uint32_t));
      Take(1);
      Take(sizeof(std::uint32_t));
      Put(answer, sizeof(std::int16_t));
      Put(&kExportSettingsSize, sizeof(std::uint32_t));
      Put(answer, kExportSettingsSize);
      break;
    default:
      _exit(EXIT_SUCCESS);
  }
  Put(kTrailer.data(), kTrailer.size());
}

}  // namespace

int main(int count, char** arguments) {
  if (count != 4) return EXIT_FAILURE;
  const pid_t parent = std::atoi(arguments[1]);  // NOLINT(cert-err34-c)
  const char* const item = arguments[2];
  const char* const name = std::strrchr(item, '/') + 1;
  static char folder[PATH_MAX];
  std::memcpy(folder, item, static_cast<std::size_t>(name - 1 - item));
  do {
    Serve(TakeU16(), item, folder, name, arguments[3]);
  } while (kill(parent, 0) == 0);
}
