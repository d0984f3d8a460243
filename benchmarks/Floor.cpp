// The floors: what no service for these requests can do without.
//
// tallowmere_floor PARENT_PROCESS_ID ITEM VOLUME_NAME [sound]: reads a request field by field (0
// and unknown codes end it), writes an answer of constant content field by field, and checks for
// its parent, with exactly the calls that the service makes for that. In between it makes calls on
// files. It is assumed to remember, at no cost, all that an earlier request has found out; the
// mount table is read once. There are two floors:
//
//   - The lean one makes the fewest calls that an answer can rest on if nothing changes between
//     them: one poll on the mount table where the answer depends on which volumes there are, and
//     one look (statx) at everything that the answer claims to exist.
//   - The sound one makes the calls that an answer needs to be right whatever happens meanwhile,
//     about an item that is some seconds old on a disk.
//
// ITEM, which the requests are about, is the canonical path of an existing item whose name is also
// its HFS name.
#include <fcntl.h>
#include <linux/openat2.h>
#include <poll.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <climits>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string_view>

#include "service/Protocol.h"

namespace {

using namespace tallowmere::protocol;

// The steps of a request, one character each. Fields: a digit is that many bytes, 'r' a record, 's'
// a counted string; in an answer, 'i' is the path of the item, 'n' its name, 'v' the volume's name,
// 'b' as many bytes as the request's last 16-bit field says, and 'e' the settings. Calls on files:
//
//   i  statx of the item, by its path          l  the same by lstat, as the host's logic asks
//   f  statx of the item's folder, by path     d  the same by lstat
//   o  opens the folder by a path without links and holds it
//   h  statx of the held folder                n  statx of the item, by its name in that folder
//   c  closes the folder                       p  polls the mount table
struct Steps {
  const char* fields;
  const char* lean;
  const char* sound;
  const char* answer;
};

// Sound answers: "oh" finds out which folder it is and which mount it is on. "p" follows, as a
// mount keeps its number only while something on it is held. "n" is the item with the name in that
// folder. A path in the answer takes one look along all of it, "i", which must find that item.
constexpr auto kSteps = std::to_array<Steps>({
    {},
    // Lean: what kind of item is there, and is its folder the one whose names are remembered?
    // Sound: the host's logic asks whether each of the two is a folder; the names are those of the
    // walk to the folder, and the item tells which volume it is on.
    {"s21", "ifp", "ldohpnc", "2b"},
    // Plain names are the Linux names: the kernel walks the whole path in one look.
    {"ss1", "pi", "ohpnic", "2i"},
    {"s", "p", "p", "2"},
    {"2", "p", "p", "1v"},
    // The kernel also tells whether the item is a mounted root, which has its volume's name. The
    // host's logic first asks whether the item exists.
    {"s2", "ip", "lohpnc", "1n"},
    // The item is there and so is its folder. What a name means depends on whether that is on a
    // volume. The host's logic first asks whether the folder is one.
    {"ss1", "ip", "dohpnic", "1i"},
    // The item is there, and the record has the id of its folder.
    {"s", "ifp", "ohpnc", "1r"},
    // The folder with the id is where it was, and has the item; so does the next one.
    {"24s1", "pfi", "ohpnic", "1i"},
    {"r11", "pfi", "ohpnic", "1i"},
    // Makes no calls on files.
    {"4414", "", "", "2e"},
});
static_assert(kSteps.size() == kLastRequestCode + 1);

constexpr std::uint32_t kExportSettingsSize = 144;

char taken[1 << 16];   // the last field of a request
char answer[1 << 16];  // the source of all answers

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

void LookAt(int at, const char* path, int flags = 0) {
  struct statx about {};
  statx(at, path, AT_SYMLINK_NOFOLLOW | AT_NO_AUTOMOUNT | flags,
        STATX_BASIC_STATS | STATX_BTIME | STATX_MNT_ID, &about);
}

void AskFor(const char* path) {
  struct stat about {};
  lstat(path, &about);
}

int OpenWithoutLinks(const char* path) {
  open_how how{};
  how.flags = O_PATH | O_NOFOLLOW | O_CLOEXEC;
  how.resolve = RESOLVE_NO_SYMLINKS;
  return static_cast<int>(syscall(SYS_openat2, AT_FDCWD, path, &how, sizeof how));
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

// The item that the requests are about.
struct Place {
  const char* item;
  const char* folder;
  const char* name;
  const char* volume;
};

void Look(const char* looks, const Place& place) {
  int held = -1;
  for (; *looks != '\0'; ++looks) {
    switch (*looks) {
      case 'i':
        LookAt(AT_FDCWD, place.item);
        break;
      case 'f':
        LookAt(AT_FDCWD, place.folder);
        break;
      case 'l':
        AskFor(place.item);
        break;
      case 'd':
        AskFor(place.folder);
        break;
      case 'o':
        held = OpenWithoutLinks(place.folder);
        break;
      case 'h':
        LookAt(held, "", AT_EMPTY_PATH);
        break;
      case 'n':
        LookAt(held, place.name);
        break;
      case 'c':
        close(held);
        break;
      case 'p':
        PollMountTable();
        break;
    }
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

void PutAnswer(const char* fields, std::uint16_t size, const Place& place) {
  for (; *fields != '\0'; ++fields) {
    switch (*fields) {
      case 'i':
        PutString(place.item);
        break;
      case 'n':
        PutString(place.name);
        break;
      case 'v':
        PutString(place.volume);
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
  if (count < 4) return EXIT_FAILURE;
  const bool isSound = count > 4 && std::string_view(arguments[4]) == "sound";
  const pid_t parent = std::atoi(arguments[1]);  // NOLINT(cert-err34-c)
  const char* const item = arguments[2];
  const char* const name = std::strrchr(item, '/') + 1;
  static char folder[PATH_MAX];
  std::memcpy(folder, item, static_cast<std::size_t>(name - 1 - item));
  const Place place{item, folder, name, arguments[3]};
  do {
    const std::uint16_t code = TakeU16();
    if (code == kRequestQuit || code > kLastRequestCode) break;
    const Steps& steps = kSteps[code];
    std::uint16_t size = 0;
    TakeFields(steps.fields, size);
    Look(isSound ? steps.sound : steps.lean, place);
    PutAnswer(steps.answer, size, place);
  } while (kill(parent, 0) == 0);
}
