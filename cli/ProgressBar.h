// A bar on standard error while something long goes on; nothing where that is no terminal.
#pragma once

#include <chrono>
#include <optional>
#include <string>

namespace tallowmere::cli {

class ProgressBar {
 public:
  ProgressBar();
  ProgressBar(const ProgressBar&) = delete;
  ProgressBar& operator=(const ProgressBar&) = delete;
  ~ProgressBar() { Hide(); }

  // Draws the part that is done, 0 to 1, where that is known, and a text behind it, a few times a
  // second at the most. Nothing is drawn in the first half second: short work needs no bar.
  void Show(std::optional<double> done, const std::string& text);

  // Takes the bar away until it is next shown, for a line of output.
  void Hide();

 private:
  bool mIsTerminal;
  bool mIsShown = false;
  std::chrono::steady_clock::time_point mNext;
};

}  // namespace tallowmere::cli
