// enter_root FOLDER PROGRAM ARGUMENTS…: makes FOLDER, a mount point, the root of this mount
// namespace, leaves nothing of the former root in it, and executes the program.
#include <unistd.h>

#include <cstdio>

#include "support/MountNamespace.h"

int main(int count, char** arguments) {
  if (count < 3) return 1;
  if (!tallowmere::test::MakeRootOfMounts(arguments[1])) {
    std::perror("enter_root");
    return 1;
  }
  execv(arguments[2], arguments + 2);
  std::perror(arguments[2]);
  return 1;
}
