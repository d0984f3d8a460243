#include <tallowmere/Outcome.h>

namespace tallowmere {

std::string_view Name(Outcome outcome) {
  switch (outcome) {
    case Outcome::kFound:
      return "found";
    case Outcome::kNew:
      return "new";
    case Outcome::kNothing:
      return "nothing";
    case Outcome::kAmbiguous:
      return "ambiguous";
    case Outcome::kRefused:
      return "refused";
    case Outcome::kNotAVolume:
      return "not-a-volume";
    case Outcome::kInvalid:
      return "invalid";
    case Outcome::kServiceFailed:
      break;
  }
  return "service-failed";
}

}  // namespace tallowmere
