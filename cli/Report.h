// Prints a command's findings, in the items' order, and how far it is.
#pragma once

#include <cstdint>
#include <optional>

#include "cli/Finding.h"
#include "cli/Items.h"
#include "cli/ProgressBar.h"

namespace tallowmere::cli {

class Report {
 public:
  explicit Report(const Format& format);

  // Prints the answer, or what takes its place, and the complaint.
  void Print(const Finding& finding);

  // Counts a finding whose answer is printed elsewhere, and prints its complaint.
  void Count(const Finding& finding);

  // Shows the progress, unless the answers themselves show it.
  void ShowProgress(std::optional<double> done);

  // Whether the output can still be written.
  bool GoesOn() const;

  // Prints what remains and returns the program's exit status: kFailed also where standard input
  // could not be read to its end, with a complaint. After many items, prints a summary on standard
  // error.
  int Finish(const Items& items);

 private:
  void Summarize() const;

  Format mFormat;
  bool mOutputIsTerminal;
  ProgressBar mBar;
  std::uint64_t mTaken = 0;    // items that have been read
  std::uint64_t mItems = 0;    // items that have a finding
  std::uint64_t mFound = 0;    // of those: answered
  std::uint64_t mNew = 0;      // answered
  std::uint64_t mNothing = 0;  // failed, as nothing is there; the rest failed for another reason
  int mStatus = 0;
};

}  // namespace tallowmere::cli
