// Serves one request, from its code to the trailer of its response.
#pragma once

#include <MacTypes.h>

namespace tallowmere::service {

// Reads a request from standard input, carries it out and writes its response to standard output.
//
//   Returns  noErr     the request was read and answered in full
//            ioErr     the channel failed: end of input, a read or write error, or a length out of
//                      its bounds; a response may be left half written
//   Exits    status 0  the quit request
//            status 1  a code that no command has
//
// The outcome of the work is part of the response and never an error here. Neither exit writes a
// response.
OSErr ServeOneRequest();

}  // namespace tallowmere::service
