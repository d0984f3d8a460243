// One request from its code to the trailer of its response.
#pragma once

#include <MacTypes.h>

namespace tallowmere::service {

// Reads a request from standard input, carries it out and writes its response to standard output.
// noErr: read whole and answered whole. ioErr: the channel failed, by the end of input, a read or
// write error or a length out of its bound; a response can be left half written. The outcome of the
// work is never an error here, it is in the response.
// Does not return for the quit request, which ends the process with status 0, nor for a code that
// no command has, which ends it with status 1; neither is answered.
OSErr ServeOneRequest();

}  // namespace tallowmere::service
