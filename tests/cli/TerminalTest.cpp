// What people see: colours and the progress bar, on a terminal that script(1) makes.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <stdlib.h>
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
  EXPECT_THAT(OnATerminal("$CLI name /nonexistent"),
              HasSubstr("\x1B[31mtallowmere-cli:\x1B[0m /nonexistent: "));
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
      "cd " + folder.Path().string() + "; printf '\\033[1m\\377' | $CLI name --null -";
  EXPECT_THAT(OnATerminal(command), HasSubstr("\\033[1m"));
  EXPECT_THAT(OnATerminal(command + " | cat"), HasSubstr("\x1B[1m"));
}

TEST_F(Terminal, AComplaintTakesTheProgressBarAway) {
  const std::string output =
      OnATerminal("(echo /; sleep 1; echo /; echo /nonexistent) | $CLI name - >/dev/null");
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
  // Not in the way of answers on the same terminal.
  EXPECT_THAT(OnATerminal("(echo /; sleep 1; echo /) | $CLI name -"), Not(HasSubstr(" items")));
}

}  // namespace
}  // namespace tallowmere::test
