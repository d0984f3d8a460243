// Replaces the platform's function in a service that is compared with a confined one.
#include <Tallowmere/Process.h>

void tallowmere::process::LockIn() {}
