// resolve_spec: reads FSSpecs of 70 bytes from standard input and prints a line for each: the
// result code and the path of the item in hexadecimal. It runs in a process that knows nothing of
// where the records came from. With the argument "unprivileged" it first gives up the superuser's
// rights.
#include <CoreFoundation/CoreFoundation.h>
#include <CoreServices/CoreServices.h>
#include <grp.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>

#include "platform/foundation/TestStrings.h"

int main(int count, char** arguments) {
  constexpr uid_t kNobody = 65534;
  if (count > 1 && std::strcmp(arguments[1], "unprivileged") == 0 &&
      (setgroups(0, nullptr) != 0 || setresuid(kNobody, kNobody, kNobody) != 0)) {
    return 1;
  }
  FSSpec spec;
  while (std::fread(&spec, sizeof spec, 1, stdin) == 1) {
    FSRef reference;
    OSErr error = FSpMakeFSRef(&spec, &reference);
    std::printf("%d ", error);
    const CFOwned url(error == noErr ? CFURLCreateFromFSRef(kCFAllocatorDefault, &reference)
                                     : nullptr);
    const auto path = url ? tallowmere::foundation::test::PathOf(url) : std::nullopt;
    if (path) {
      for (const char byte : *path) std::printf("%02x", static_cast<unsigned char>(byte));
    }
    std::printf("\n");
    std::fflush(stdout);
  }
}
