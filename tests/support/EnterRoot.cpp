// enter_root FOLDER PROGRAM ARGUMENTS…: makes FOLDER, at which something is mounted, the root of
// this mount namespace, leaves nothing of the former root in it, and becomes the program.
#include <sys/mount.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cstdio>

int main(int count, char** arguments) {
  if (count < 3) return 1;
  // The former root goes on top of the new one at the same place, and away from there.
  if (chdir(arguments[1]) != 0 || syscall(SYS_pivot_root, ".", ".") != 0 ||
      umount2(".", MNT_DETACH) != 0 || chdir("/") != 0) {
    std::perror("enter_root");
    return 1;
  }
  execv(arguments[2], arguments + 2);
  std::perror(arguments[2]);
  return 1;
}
