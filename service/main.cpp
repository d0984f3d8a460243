// The helper process: serves its parent's requests on standard input and output until the parent is
// gone, the channel fails, or the parent tells it to stop.

#include <Tallowmere/Process.h>
#include <signal.h>
#include <sys/types.h>

#include <cstdio>
#include <cstdlib>

#include "service/Request.h"

int main(int argumentCount, char** arguments) {
  if (argumentCount < 2) {
    std::fputs("Tallowmere missing a parameter.\n", stderr);
    return EXIT_FAILURE;
  }
  // The parent is trusted to pass its own process id; text that is not a number gives 0, this
  // process group.
  const pid_t parent = std::atoi(arguments[1]);  // NOLINT(cert-err34-c)

  // It reads a file system that others write to, and never needs to do more than read.
  tallowmere::process::LockIn();

  // The parent is checked for after every request, answered or not, and never before the first one:
  // a service without a parent ends when its input does.
  OSErr result = noErr;
  bool parentExists = true;
  while (result == noErr && parentExists) {
    result = tallowmere::service::ServeOneRequest();
    parentExists = kill(parent, 0) == 0;
  }
  return EXIT_SUCCESS;
}
