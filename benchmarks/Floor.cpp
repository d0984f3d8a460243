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
// ITEM is the path of an existing item with a name that is its HFS name, the one that the requests
// are about.
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <climits>
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "service/Protocol.h"

namespace {

using namespace tallowmere::protocol;

// What is done for a request, a character each. Fields: digits are so many bytes, 'r' a record, 's'
// a counted string; in an answer 'i' is the path of the item, 'n' its name, 'v' the volume's, 'b'
// as many bytes as the request's last 16-bit field says, and 'e' the settings. Looks: 'i' at the
// item, 'f' at the folder that holds it, 'p' the poll.
struct Steps {
  const char* fields;
  const char* looks;
  const char* answer;
};

constexpr auto kSteps = std::to_array<Steps>({
    {},
    // What kind of item is there, and is its folder the one whose names are remembered?
    {"s21", "ifp", "2b"},
    // Plain names are the names of Linux: the kernel walks the whole path in one look.
    {"ss1", "pi", "2i"},
    {"s", "p", "2"},
    {"2", "p", "1v"},
    // The kernel says too whether the item is a mounted root, which is called as its volume.
    {"s2", "ip", "1n"},
    // The item is there and so is its folder. Whether that is on a volume decides what a name is.
    {"ss1", "ip", "1i"},
    // There is the item, and the record has the number of its folder.
    {"s", "ifp", "1r"},
    // The folder with the id is where it was, and has the item; the next one too.
    {"24s1", "pfi", "1i"},
    {"r11", "pfi", "1i"},
    // Asks nobody.
    {"4414", "", "2e"},
});
static_assert(kSteps.size() == kLastRequestCode + 1);

constexpr std::uint32_t kExportSettingsSize = 144;

char taken[1 << 16];   // the last field of a request
char answer[1 << 16];  // what answers consist of

void Take(std::size_t size) {
  for (std::size_t count = 0; count < size;) {
    const ssize_t got = read(STDIN_FILENO, taken + count, size - count);
    if (got < 1) _exit(EXIT_SUCCESS);
    count += static_cast<std::size_t>(got);
  }
}

std::uint16_t TakeU16() {
  Take(sizeof(std::uint16_t));
  std::uint16_t number;
  std::memcpy(&number, taken, sizeof number);
  return number;
}

void Put(const void* field, std::size_t size) {
  if (write(STDOUT_FILENO, field, size) != static_cast<ssize_t>(size)) _exit(EXIT_SUCCESS);
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
    while (read(table, taken, sizeof taken) > 0) continue;
  } else {
    pollfd watched{table, POLLPRI, 0};
    poll(&watched, 1, 0);
  }
}

std::size_t SizeOf(char field) {
  return field == 'r' ? kFileSpecSize : static_cast<std::size_t>(field - '0');
}

void TakeFields(const char* fields, std::uint16_t& last) {
  for (; *fields != '\0'; ++fields) {
    switch (*fields) {
      case 's':
        Take(TakeU16());
        break;
      case '2':
        last = TakeU16();
        break;
      default:
        Take(SizeOf(*fields));
    }
  }
}

void PutAnswer(const char* fields, std::uint16_t size, const char* item, const char* name,
               const char* volume) {
  for (; *fields != '\0'; ++fields) {
    switch (*fields) {
      case 'i':
        PutString(item);
        break;
      case 'n':
        PutString(name);
        break;
      case 'v':
        PutString(volume);
        break;
      case 'b':
        Put(answer, size);
        break;
      case 'e':
        Put(&kExportSettingsSize, sizeof kExportSettingsSize);
        Put(answer, kExportSettingsSize);
        break;
      default:
        Put(answer, SizeOf(*fields));
    }
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
    const std::uint16_t code = TakeU16();
    if (code == kRequestQuit || code > kLastRequestCode) break;
    std::uint16_t size = 0;
    TakeFields(kSteps[code].fields, size);
    for (const char* look = kSteps[code].looks; *look != '\0'; ++look) {
      *look == 'p' ? PollMountTable() : LookAt(*look == 'i' ? item : folder);
    }
    PutAnswer(kSteps[code].answer, size, item, name, arguments[3]);
  } while (kill(parent, 0) == 0);
}
