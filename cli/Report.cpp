#include "cli/Report.h"

#include <unistd.h>

#include <iostream>
#include <string>
#include <system_error>

#include "cli/Output.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

// From this many items on, nobody counts failures by hand.
constexpr std::uint64_t kManyItems = 1000;

}  // namespace

Report::Report(const Format& format)
    : mFormat(format), mOutputIsTerminal(isatty(STDOUT_FILENO) == 1), mBar(format.HasProgress()) {}

void Report::Print(const Finding& finding) {
  Count(finding);
  if (mOutputIsTerminal && !mFormat.isJson) {
    std::cout << Printable(finding.text);
  } else {
    std::cout << finding.text;
  }
  std::cout << mFormat.OutputEnd();
}

void Report::Count(const Finding& finding) {
  ++mItems;
  if (!finding.isFailure) {
    ++(finding.outcome == Outcome::kNew ? mNew : mFound);
    return;
  }
  if (finding.outcome == Outcome::kNothing) ++mNothing;
  mStatus = kFailed;
  mBar.Hide();
  if (!finding.complaint.empty()) Complain(finding.complaint);
}

void Report::ShowProgress(std::optional<double> done) {
  ++mTaken;
  if (!mOutputIsTerminal) mBar.Show(done, mTaken);
}

bool Report::GoesOn() const {
  return std::cout.good();
}

int Report::Finish(const Items& items) {
  mBar.Hide();
  const int status = FinishOutput(mStatus);
  if (mItems >= kManyItems && !mFormat.isQuiet && GoesOn()) Summarize();
  if (const int error = items.ReadError()) {
    return Complain("standard input: " + std::generic_category().message(error));
  }
  return status;
}

void Report::Summarize() const {
  std::cerr << "tallowmere-cli: " << mItems << " items: " << mFound << " found, " << mNew
            << " new, " << mNothing << " nothing, " << mItems - mFound - mNew - mNothing
            << " failed\n";
}

}  // namespace tallowmere::cli
