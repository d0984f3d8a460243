#include <Tallowmere/Process.h>

#include "kernel/Confinement.h"

void tallowmere::process::LockIn() {
  tallowmere::kernel::LockIn();
}
