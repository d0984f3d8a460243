// Takes the place of the platform's in a service that is to be compared with one that is locked in.
#include <Tallowmere/Process.h>

void tallowmere::process::LockIn() {}
