#include "kernel/UserDatabase.h"

#include <fcntl.h>

#include <algorithm>
#include <array>

#include "kernel/Descriptor.h"

namespace tallowmere::kernel {
namespace {

using std::string_view;

constexpr string_view kBlanks = " \t\r";

// Services that open files or ask a daemon on this machine.
constexpr auto kLocalServices = std::to_array<string_view>(
    {"files", "db", "systemd", "sss", "winbind", "mymachines", "extrausers", "altfiles", "cache"});

// Removes what precedes the first of these characters, and that character, from the front of a
// text; returns the former.
string_view TakeUpTo(string_view characters, string_view& text) {
  const std::size_t end = std::min(text.find_first_of(characters), text.size());
  const string_view taken = text.substr(0, end);
  text.remove_prefix(std::min(end + 1, text.size()));
  return taken;
}

bool IsLocal(string_view service) {
  return std::find(kLocalServices.begin(), kLocalServices.end(), service) != kLocalServices.end();
}

// The text after the colon: services, with actions in brackets between them.
bool AreLocal(string_view services) {
  while (!services.empty()) {
    if (services.front() == '[') {
      TakeUpTo("]", services);
      continue;
    }
    const std::size_t end = std::min(services.find_first_of(" \t\r["), services.size());
    const string_view service = services.substr(0, end);
    if (!service.empty() && !IsLocal(service)) return false;
    services.remove_prefix(end);
    services.remove_prefix(std::min(services.find_first_not_of(kBlanks), services.size()));
  }
  return true;
}

}  // namespace

bool NeedsNetwork(string_view nameServiceSwitch) {
  while (!nameServiceSwitch.empty()) {
    string_view line = TakeUpTo("\n", nameServiceSwitch);
    line = TakeUpTo("#", line);
    line.remove_prefix(std::min(line.find_first_not_of(kBlanks), line.size()));
    string_view database = TakeUpTo(":", line);
    database = database.substr(0, database.find_first_of(kBlanks));
    if (database == "passwd" && !AreLocal(line)) return true;
  }
  return false;
}

bool UserDatabaseNeedsNetwork() {
  const Descriptor file(open("/etc/nsswitch.conf", O_RDONLY | O_CLOEXEC));
  if (!file.IsOpen()) return false;
  std::array<char, 4096> text;
  const ssize_t size = read(file.Get(), text.data(), text.size());
  // A file that does not fit may name anything.
  if (size < 0 || size == static_cast<ssize_t>(text.size())) return true;
  return NeedsNetwork({text.data(), static_cast<std::size_t>(size)});
}

}  // namespace tallowmere::kernel
