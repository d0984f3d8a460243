#include "cli/Output.h"

#include <iostream>

#include "cli/Text.h"

namespace tallowmere::cli {

int Complain(std::string_view message) {
  std::cerr << "tallowmere-cli: " << Printable(message) << '\n';
  return kFailed;
}

int FinishOutput(int status) {
  return std::cout.flush() ? status : Complain("the output could not be written");
}

}  // namespace tallowmere::cli
