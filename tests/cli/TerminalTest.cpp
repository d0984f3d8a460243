// What people see: colours and the progress bar, on a terminal that script(1) makes.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include "support/ChildProgram.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using testing::HasSubstr;
using testing::Not;

// What a shell command writes to a terminal. $CLI is the program.
std::string OnATerminal(const std::string& command) {
  ChildProgram terminal("/usr/bin/env", {"CLI=" TALLOWMERE_CLI, "TERM=xterm", "NO_COLOR=", "script",
                                         "-qec", command, "/dev/null"});
  terminal.CloseInput();
  return terminal.ReadToEnd();
}

// Some containers have no pseudo-terminals.
bool PseudoTerminalsExist() {
  const int controller = posix_openpt(O_RDWR | O_NOCTTY);
  if (controller < 0) return false;
  const char* const name = unlockpt(controller) == 0 ? ptsname(controller) : nullptr;
  const int terminal = name != nullptr ? open(name, O_RDWR | O_NOCTTY) : -1;
  if (terminal >= 0) close(terminal);
  close(controller);
  return terminal >= 0;
}

class Terminal : public testing::Test {
 protected:
  void SetUp() override {
    if (!PseudoTerminalsExist()) GTEST_SKIP() << "there are no pseudo-terminals here";
  }
};

TEST_F(Terminal, HeadsAreBoldAndComplaintsAreRed) {
  EXPECT_THAT(OnATerminal("$CLI volumes"), HasSubstr("\x1B[1mvRefNum  name"));
  EXPECT_THAT(OnATerminal("$CLI name /nonexistent/x"),
              HasSubstr("\x1B[31mtallowmere-cli:\x1B[0m /nonexistent/x: "));
}

TEST_F(Terminal, ColoursCanBeRefused) {
  EXPECT_THAT(OnATerminal("NO_COLOR=1 $CLI volumes"), Not(HasSubstr("\x1B[")));
  EXPECT_THAT(OnATerminal("TERM=dumb $CLI volumes"), Not(HasSubstr("\x1B[")));
  EXPECT_THAT(OnATerminal("unset TERM; $CLI volumes"), Not(HasSubstr("\x1B[")));
}

TEST_F(Terminal, WhatIsNoTerminalHasNoColours) {
  EXPECT_THAT(OnATerminal("$CLI volumes | cat"), Not(HasSubstr("\x1B[")));
}

TEST_F(Terminal, ControlCharactersOfAPathAreShownAndNotSent) {
  const TemporaryFolder folder;
  folder.MakeFile("\x1B[1m\xFF");
  const std::string command =
      "cd " + folder.Path().string() + "; printf '\\033[1m\\377' | $CLI name -";
  EXPECT_THAT(OnATerminal(command), HasSubstr("\\033[1m"));
  EXPECT_THAT(OnATerminal(command + " | cat"), HasSubstr("\x1B[1m"));
}

TEST_F(Terminal, AComplaintTakesTheProgressBarAway) {
  const std::string output =
      OnATerminal("(echo /; sleep 1; echo /; echo /nonexistent/x) | $CLI name - >/dev/null");
  EXPECT_THAT(output, HasSubstr(" items"));
  EXPECT_THAT(output, HasSubstr("\r\x1B[K\x1B[31mtallowmere-cli:"));
  EXPECT_THAT(OnATerminal("export TERM=dumb; (echo /; sleep 1; echo /) | $CLI name - >/dev/null"),
              Not(HasSubstr("\x1B[")));
}

TEST_F(Terminal, LongWorkHasAProgressBarAndShortWorkHasNone) {
  const std::string slowly =
      "(echo /; sleep 1; echo /; sleep 0.4; echo /) | $CLI name - >/dev/null";
  EXPECT_THAT(OnATerminal(slowly), HasSubstr(" items"));
  EXPECT_THAT(OnATerminal("echo / | $CLI name - >/dev/null"), Not(HasSubstr(" items")));
  // No bar where answers go to the same terminal.
  EXPECT_THAT(OnATerminal("(echo /; sleep 1; echo /) | $CLI name -"), Not(HasSubstr(" items")));
}

// Items that come slowly enough for a bar to be drawn.
const std::string kSlowly = "(echo /; sleep 0.7; echo /; sleep 0.3; echo /)";

// The widest line that a terminal shows, in characters.
std::size_t Width(const std::string& output) {
  std::size_t widest = 0;
  for (std::size_t begin = 0; begin < output.size();) {
    const std::size_t end = std::min(output.find_first_of("\r\n", begin), output.size());
    std::string line = output.substr(begin, end - begin);
    const std::string erase = "\x1B[K";
    if (line.starts_with(erase)) line.erase(0, erase.size());
    widest = std::max(widest, line.size());
    begin = end + 1;
  }
  return widest;
}

TEST_F(Terminal, AProgressBarIsNarrowerThanTheTerminal) {
  const std::string slow = "stty cols 40; " + kSlowly + " | $CLI name - >/dev/null";
  EXPECT_THAT(OnATerminal(slow), HasSubstr(" items"));
  EXPECT_LT(Width(OnATerminal(slow)), 40u);
  // The number of arguments is known, so the bar shows a percentage.
  const TemporaryFolder folder;
  const std::string service =
      folder.MakeFile("late", "#!/bin/sh\nsleep 0.7\nexec " TALLOWMERE_SERVICE " \"$@\"\n");
  chmod(service.c_str(), 0755);
  const std::string known = "$CLI --service " + service + " name / / >/dev/null";
  EXPECT_THAT(OnATerminal(known), HasSubstr(" %  "));
  EXPECT_THAT(OnATerminal("stty cols 40; " + known), HasSubstr(" %  "));
  EXPECT_LT(Width(OnATerminal("stty cols 40; " + known)), 40u);
  EXPECT_LT(Width(OnATerminal("stty cols 8; " + kSlowly + " | $CLI name - >/dev/null")), 8u);
}

TEST_F(Terminal, ProgressIsNotShownToWhoDoesNotWantIt) {
  for (const char* const option : {"--quiet", "-q", "--no-progress"}) {
    EXPECT_EQ(OnATerminal(kSlowly + " | $CLI name " + option + " - >/dev/null"), "") << option;
  }
}

// A pager that reads keys one by one owns the terminal's last line.
TEST_F(Terminal, ProgressIsNotShownWhileAPagerReadsTheAnswers) {
  EXPECT_EQ(
      OnATerminal(kSlowly + " | $CLI name - | (stty -icanon -echo </dev/tty; cat >/dev/null)"), "");
}

TEST_F(Terminal, ProgressIsNotShownWhereErrorsGoElsewhere) {
  const TemporaryFolder folder;
  const std::string errors = folder.MakeFile("errors", "");
  EXPECT_EQ(OnATerminal(kSlowly + " | $CLI name - 2>" + errors + " >/dev/null; cat " + errors), "");
}

}  // namespace
}  // namespace tallowmere::test
