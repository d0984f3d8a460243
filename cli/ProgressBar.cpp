#include "cli/ProgressBar.h"

#include <unistd.h>

#include <algorithm>
#include <iomanip>
#include <iostream>

#include "cli/Output.h"

namespace tallowmere::cli {
namespace {

constexpr int kWidth = 40;  // characters
constexpr auto kFirstPause = std::chrono::milliseconds(500);
constexpr auto kPause = std::chrono::milliseconds(200);

// Moves to the first column and erases the line from there (ECMA-48, "EL").
constexpr const char* kStartAgain = "\r\x1B[K";

}  // namespace

ProgressBar::ProgressBar()
    : mIsTerminal(IsAbleTerminal(STDERR_FILENO)),
      mNext(std::chrono::steady_clock::now() + kFirstPause) {}

void ProgressBar::Show(std::optional<double> done, const std::string& text) {
  if (!mIsTerminal) return;
  const auto now = std::chrono::steady_clock::now();
  if (now < mNext) return;
  mNext = now + kPause;
  mIsShown = true;
  std::cerr << kStartAgain;
  if (done) {
    const double part = std::clamp(*done, 0.0, 1.0);
    const auto full = static_cast<std::size_t>(part * kWidth);
    std::cerr << '[' << std::string(full, '#') << std::string(kWidth - full, '.') << "] "
              << std::setw(3) << static_cast<int>(part * 100) << " %  ";
  }
  std::cerr << text << std::flush;
}

void ProgressBar::Hide() {
  if (!mIsShown) return;
  std::cerr << kStartAgain << std::flush;
  mIsShown = false;
}

}  // namespace tallowmere::cli
