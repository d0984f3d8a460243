// How a conversion ended. The names are the same in every client and on the command line.
#pragma once

#include <string_view>

namespace tallowmere {

enum class Outcome {
  kFound,          // the item exists
  kNew,            // its folder exists, it does not
  kNothing,        // neither is there: nothing, below a file or below a link that leads nowhere
  kAmbiguous,      // more than one item could be meant, or the answer would name another one
  kRefused,        // the system does not let this process look
  kNotAVolume,     // it is on no volume; no volume has this number or name
  kInvalid,        // no question can be made of it, or no answer would lead back to it
  kServiceFailed,  // the service gave no answer
};

// "found", "new", "nothing", "ambiguous", "refused", "not-a-volume", "invalid" or "service-failed".
std::string_view Name(Outcome outcome);

}  // namespace tallowmere
