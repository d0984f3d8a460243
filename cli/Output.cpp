#include "cli/Output.h"

#include <unistd.h>

#include <cstdlib>
#include <iostream>

#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

// ECMA-48, "SGR".
constexpr std::string_view kBoldOn = "\x1B[1m";
constexpr std::string_view kRedOn = "\x1B[31m";
constexpr std::string_view kStyleOff = "\x1B[0m";

bool WantsColour(int descriptor) {
  const char* const refused = std::getenv("NO_COLOR");
  return IsAbleTerminal(descriptor) && (refused == nullptr || *refused == '\0');
}

}  // namespace

bool IsAbleTerminal(int descriptor) {
  const char* const terminal = std::getenv("TERM");
  return isatty(descriptor) == 1 && terminal != nullptr && std::string_view(terminal) != "dumb";
}

std::string Styled(std::string_view text, Style style, int descriptor) {
  if (!WantsColour(descriptor)) return std::string(text);
  return std::string(style == Style::kBold ? kBoldOn : kRedOn).append(text).append(kStyleOff);
}

int Complain(std::string_view message) {
  std::cerr << Styled("tallowmere-cli:", Style::kRed, STDERR_FILENO) << ' ' << Printable(message)
            << '\n';
  return kFailed;
}

int FinishOutput(int status) {
  return std::cout.flush() ? status : Complain("the output could not be written");
}

}  // namespace tallowmere::cli
