// Output and exit statuses common to all subcommands.
#pragma once

#include <string>
#include <string_view>

namespace tallowmere::cli {

inline constexpr int kFailed = 1;      // a question was not answered
inline constexpr int kWrongUsage = 2;  // nothing was asked

enum class Style { kBold, kRed };

// Whether the descriptor is a terminal that understands more than plain text.
bool IsAbleTerminal(int descriptor);

// The text in this style when the descriptor is such a terminal and the user has not turned colours
// off (NO_COLOR, see no-color.org); otherwise unchanged.
std::string Styled(std::string_view text, Style style, int descriptor);

// Prints an error message as one line on standard error. Returns kFailed.
int Complain(std::string_view message);

// The exit status when everything has been printed: `status`, or kFailed when the output could not
// be written.
int FinishOutput(int status = 0);

}  // namespace tallowmere::cli
