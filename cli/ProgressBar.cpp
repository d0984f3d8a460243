#include "cli/ProgressBar.h"

#include <sys/ioctl.h>
#include <termios.h>
#include <unistd.h>

#include <algorithm>
#include <iostream>
#include <string>

#include "cli/Output.h"

namespace tallowmere::cli {
namespace {

constexpr std::size_t kWidth = 40;            // characters of the bar
constexpr std::size_t kNarrowest = 3;         // of a bar
constexpr std::size_t kUsualTerminal = 80;    // columns of one that does not tell
constexpr std::size_t kRoomForPercents = 11;  // characters beside the bar: "[] 100 %  "
constexpr auto kFirstPause = std::chrono::milliseconds(500);
constexpr auto kPause = std::chrono::milliseconds(200);

// Moves to the first column and erases the line from there (ECMA-48, "EL").
constexpr const char* kStartAgain = "\r\x1B[K";

// The longest line that the terminal does not wrap, in characters.
std::size_t Room() {
  winsize size{};
  const bool isKnown = ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0;
  return (isKnown ? size.ws_col : kUsualTerminal) - 1;
}

// Whether another program takes the terminal's keys one by one, as a pager does.
bool IsTakenByAPager() {
  termios modes{};
  return tcgetattr(STDERR_FILENO, &modes) == 0 && (modes.c_lflag & ICANON) == 0;
}

// The bar with its percentage; empty when there is no room for it.
std::string BarOf(double done, std::size_t room) {
  if (room < kNarrowest + kRoomForPercents) return {};
  const double part = std::clamp(done, 0.0, 1.0);
  const std::size_t width = std::min(kWidth, room - kRoomForPercents);
  const auto full = static_cast<std::size_t>(part * static_cast<double>(width));
  const std::string percents = std::to_string(static_cast<int>(part * 100));
  return '[' + std::string(full, '#') + std::string(width - full, '.') + "] " +
         std::string(3 - percents.size(), ' ') + percents + " %  ";
}

}  // namespace

ProgressBar::ProgressBar(bool isWanted)
    : mIsWanted(isWanted && IsAbleTerminal(STDERR_FILENO)),
      mNext(std::chrono::steady_clock::now() + kFirstPause) {}

void ProgressBar::Show(std::optional<double> done, std::uint64_t items) {
  if (!mIsWanted) return;
  const auto now = std::chrono::steady_clock::now();
  if (now < mNext) return;
  mNext = now + kPause;
  if (IsTakenByAPager()) return;
  mIsShown = true;
  const std::size_t room = Room();
  const std::string text = std::to_string(items) + " items";
  const std::string bar = done ? BarOf(*done, room - std::min(room, text.size())) : "";
  std::cerr << kStartAgain << bar << text.substr(0, room - std::min(room, bar.size()))
            << std::flush;
}

void ProgressBar::Hide() {
  if (!mIsShown) return;
  std::cerr << kStartAgain << std::flush;
  mIsShown = false;
}

}  // namespace tallowmere::cli
