// How every subcommand speaks and ends.
#pragma once

#include <string>
#include <string_view>

namespace tallowmere::cli {

inline constexpr int kFailed = 1;      // something could not be answered
inline constexpr int kWrongUsage = 2;  // nothing was asked

enum class Style { kBold, kRed };

// Whether the descriptor is a terminal that understands more than text.
bool IsAbleTerminal(int descriptor);

// The text in that style where the descriptor is such a terminal and the user has not refused
// colours (NO_COLOR, see no-color.org); otherwise as it is.
std::string Styled(std::string_view text, Style style, int descriptor);

// Says on standard error what went wrong, in one line. kFailed.
int Complain(std::string_view message);

// The exit status when everything has been printed: `status`, or kFailed when the output could not
// be written.
int FinishOutput(int status = 0);

}  // namespace tallowmere::cli
