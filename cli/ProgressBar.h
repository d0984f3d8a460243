// A progress bar on standard error, narrower than the terminal. Does nothing when that is not a
// terminal, nor while a pager has the terminal.
#pragma once

#include <chrono>
#include <cstdint>
#include <optional>

namespace tallowmere::cli {

class ProgressBar {
 public:
  explicit ProgressBar(bool isWanted);
  ProgressBar(const ProgressBar&) = delete;
  ProgressBar& operator=(const ProgressBar&) = delete;
  ~ProgressBar() { Hide(); }

  // Draws the part that is done, 0 to 1, if known, followed by the number of items, at most a few
  // times a second. Draws nothing in the first half second: short work needs no bar.
  void Show(std::optional<double> done, std::uint64_t items);

  // Removes the bar until it is next shown, to make way for a line of output.
  void Hide();

 private:
  bool mIsWanted;
  bool mIsShown = false;
  std::chrono::steady_clock::time_point mNext;
};

}  // namespace tallowmere::cli
