// How every subcommand ends.
#pragma once

#include <string_view>

namespace tallowmere::cli {

inline constexpr int kFailed = 1;      // something could not be answered
inline constexpr int kWrongUsage = 2;  // nothing was asked

// Says on standard error what went wrong, in one line. kFailed.
int Complain(std::string_view message);

// The exit status when everything has been printed: `status`, or kFailed when the output could not
// be written.
int FinishOutput(int status = 0);

}  // namespace tallowmere::cli
