#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/ChildProgram.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

using testing::ContainsRegex;
using testing::HasSubstr;
using testing::StartsWith;

TEST(CommandLine, VolumesPrintsNumberNameAndMountPointOfEachVolume) {
  Service service;
  const std::string name = service.NameOf(0);
  ChildProgram cli(TALLOWMERE_CLI, {"volumes"});
  const std::string text = cli.ReadToEnd();
  EXPECT_EQ(cli.Wait(), 0);
  EXPECT_THAT(text, StartsWith("vRefNum  name"));
  EXPECT_THAT(text, HasSubstr(std::to_string(service.NumberOf(name)) + "  "));
  EXPECT_THAT(text, ContainsRegex(" /\n"));
}

TEST(CommandLine, VolumesPrintsNamesAsUtf8AndControlCharactersInOctal) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const ScopedMount volume("none", folder.MakeFolder("\xC3\x89t\xC3\xA9\n:\x1B[1m").string(),
                           "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  ChildProgram cli(TALLOWMERE_CLI, {"volumes"});
  const std::string text = cli.ReadToEnd();
  EXPECT_EQ(cli.Wait(), 0);
  EXPECT_THAT(text, HasSubstr("  \xC3\x89t\xC3\xA9\\012/\\033[1m  "));
  EXPECT_THAT(text, HasSubstr("/\xC3\x89t\xC3\xA9\\012:\\033[1m\n"));
}

TEST(CommandLine, VolumesTellsWhichOfTwoVolumesWithOneNameAnswersToIt) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const ScopedMount first("none", folder.MakeFolder("a/Twin").string(), "tmpfs");
  const ScopedMount second("none", folder.MakeFolder("b/Twin").string(), "tmpfs");
  ASSERT_TRUE(second.IsMounted());
  ChildProgram cli(TALLOWMERE_CLI, {"volumes"});
  const std::string text = cli.ReadToEnd();
  EXPECT_EQ(cli.Wait(), 0);
  EXPECT_THAT(text, HasSubstr("/a/Twin\n"));
  EXPECT_THAT(text, HasSubstr("/b/Twin  (the first volume of this name answers to it)\n"));
}

TEST(CommandLine, IdentifyPrintsRecordFullPathAndWayBack) {
  const TemporaryFolder folder;
  const std::string file = folder.MakeFile("a:b\xC3\xA9");
  ChildProgram cli(TALLOWMERE_CLI, {"identify", file, "/"});
  const std::string text = cli.ReadToEnd();
  EXPECT_EQ(cli.Wait(), 0);
  EXPECT_THAT(text, StartsWith("vRefNum  parent id  HFS name"));
  EXPECT_THAT(text, HasSubstr("  a/b\xC3\xA9"));
  EXPECT_THAT(text, HasSubstr(":a/b\xC3\xA9"));
  EXPECT_THAT(text, HasSubstr("  " + file + "\n"));
  EXPECT_THAT(text, ContainsRegex(":  +/\n"));
}

TEST(CommandLine, IdentifyGoesOnBehindAPathWithoutARecord) {
  const TemporaryFolder folder;
  const std::string missing = folder.Path() / "missing/file";
  ChildProgram cli(TALLOWMERE_CLI, {"identify", missing, folder.Path()});
  EXPECT_THAT(cli.ReadToEnd(), HasSubstr("  " + folder.Path().string() + "\n"));
  EXPECT_EQ(cli.ReadErrorsToEnd(), "tallowmere-cli: " + missing + ": there is no folder \"" +
                                       folder.Path().string() + "/missing\"\n");
  EXPECT_EQ(cli.Wait(), 1);
}

TEST(CommandLine, AiffPrintsTheSettingsAsATree) {
  ChildProgram cli(TALLOWMERE_CLI, {"aiff", "--format", "raw ", "--rate", "22050.5", "--bits", "8",
                                    "--channels", "1"});
  EXPECT_EQ(cli.ReadToEnd(),
            "sean\n  soun\n    ssct  raw \n    ssrt  22050.5\n    ssss  8\n    sscc  1\n");
  EXPECT_EQ(cli.Wait(), 0);
}

TEST(CommandLine, AiffTellsTheResultOfASoundThatIsRefused) {
  ChildProgram cli(TALLOWMERE_CLI, {"aiff", "--format", "mp3 "});
  EXPECT_EQ(cli.ReadErrorsToEnd(), "tallowmere-cli: no AIFF file can hold this format\n");
  EXPECT_EQ(cli.Wait(), 1);
}

TEST(CommandLine, OutputThatCannotBeWrittenIsStatus1AndOneSentence) {
  for (const char* const command :
       {"volumes", "identify /", "aiff", "aiff --output -", "serve-check", "census /dev/shm",
        "--help", "--version", "spec --help", "help", "help spec"}) {
    ChildProgram cli("/bin/sh",
                     {"-c", std::string("exec \"$0\" ") + command + " >/dev/full", TALLOWMERE_CLI});
    EXPECT_EQ(cli.ReadErrorsToEnd(), "tallowmere-cli: the output could not be written\n")
        << command;
    EXPECT_EQ(cli.Wait(), 1) << command;
  }
}

TEST(CommandLine, AMissingServiceIsStatus1AndOneSentence) {
  ChildProgram cli(TALLOWMERE_CLI, {"--service", "/nonexistent/service", "volumes"});
  EXPECT_EQ(
      cli.ReadErrorsToEnd(),
      "tallowmere-cli: the service /nonexistent/service could not be started: No such file or "
      "directory\n");
  EXPECT_EQ(cli.ReadToEnd(), "");
  EXPECT_EQ(cli.Wait(), 1);
}

TEST(CommandLine, WrongUsageIsStatus2) {
  for (const std::vector<std::string>& arguments : {std::vector<std::string>{},
                                                    {"nonsense"},
                                                    {"volumes", "--nonsense"},
                                                    {"aiff", "--format", "raw"},
                                                    {"identify"},
                                                    {"spec"},
                                                    {"append", "/"},
                                                    {"spec", "-", "/"},
                                                    {"identify", "/", "-"},
                                                    {"append", "/", "a", "-"},
                                                    {"--deadline", "0", "volumes"},
                                                    {"--deadline", "nan", "volumes"},
                                                    {"aiff", "--rate", "nan"},
                                                    {"aiff", "--rate", "65536"},
                                                    {"aiff", "--rate", "65535.999999"},
                                                    {"aiff", "--rate", "-1"},
                                                    {"census", "/nonexistent"}}) {
    ChildProgram cli(TALLOWMERE_CLI, arguments);
    const std::string error = cli.ReadErrorsToEnd();
    EXPECT_THAT(error, StartsWith("tallowmere-cli: "));
    EXPECT_THAT(error, testing::EndsWith("; --help tells more\n"));
    EXPECT_EQ(std::count(error.begin(), error.end(), '\n'), 1) << error;
    EXPECT_EQ(cli.Wait(), 2);
  }
}

std::string WhatIsWrongWith(const std::vector<std::string>& arguments) {
  ChildProgram cli(TALLOWMERE_CLI, arguments);
  const std::string error = cli.ReadErrorsToEnd();
  EXPECT_EQ(cli.Wait(), 2);
  return error;
}

std::string Printed(const std::vector<std::string>& arguments) {
  ChildProgram cli(TALLOWMERE_CLI, arguments);
  std::string text = cli.ReadToEnd();
  EXPECT_EQ(cli.Wait(), 0);
  return text;
}

TEST(CommandLine, AnUnknownCommandIsNamedWithTheNearestOne) {
  const std::string tells = "; --help tells more\n";
  for (const auto& [word, nearest] : {std::pair("spce", "spec"),
                                      {"indentify", "identify"},
                                      {"serve", "serve-check"},
                                      {"volume", "volumes"}}) {
    const std::string expected = std::string("tallowmere-cli: there is no command \"") + word +
                                 "\"; the nearest is \"" + nearest + "\"" + tells;
    EXPECT_EQ(WhatIsWrongWith({word}), expected);
    EXPECT_EQ(WhatIsWrongWith({word, "/etc", "--json"}), expected);
    EXPECT_EQ(WhatIsWrongWith({"help", word}), expected);
  }
  EXPECT_EQ(WhatIsWrongWith({"xyzzy"}), "tallowmere-cli: there is no command \"xyzzy\"" + tells);
}

TEST(CommandLine, AWrongOptionIsNamedWhetherOrNotMoreIsMissing) {
  const std::string expected = "tallowmere-cli: there is no option --nonsense; --help tells more\n";
  for (const std::vector<std::string>& arguments : {std::vector<std::string>{"--nonsense"},
                                                    {"spec", "--nonsense"},
                                                    {"spec", "--nonsense", "/"},
                                                    {"append", "--nonsense", "/"},
                                                    {"census", "--nonsense"},
                                                    {"volumes", "--nonsense"}}) {
    EXPECT_EQ(WhatIsWrongWith(arguments), expected) << arguments[0];
  }
}

TEST(CommandLine, AWrongValueIsNamed) {
  const auto expect = [](const std::vector<std::string>& arguments, const std::string& fault) {
    EXPECT_EQ(WhatIsWrongWith(arguments), "tallowmere-cli: " + fault + "; --help tells more\n");
  };
  expect({"aiff", "--bits", "x"}, "--bits: x is no number of bits below 65536");
  expect({"aiff", "--bits", "65536"}, "--bits: 65536 is no number of bits below 65536");
  expect({"aiff", "--channels", "256"}, "--channels: 256 is no number of channels below 256");
  expect({"aiff", "--channels", "-1"}, "--channels: -1 is no number of channels below 256");
  expect({"census", "/nonexistent"}, "folder: there is no folder \"/nonexistent\"");
  expect({"census", "/etc/passwd"}, "folder: there is no folder \"/etc/passwd\"");
}

TEST(CommandLine, StandardInputThatCannotBeReadIsStatus1AndOneSentence) {
  for (const char* const command : {"name -", "identify -", "alias -", "path --packed -"}) {
    ChildProgram cli("/bin/sh",
                     {"-c", std::string("exec \"$0\" ") + command + " </", TALLOWMERE_CLI});
    EXPECT_EQ(cli.ReadErrorsToEnd(), "tallowmere-cli: standard input: Is a directory\n") << command;
    EXPECT_EQ(cli.Wait(), 1) << command;
  }
}

TEST(CommandLine, WordsThatACommandDoesNotTakeAreNamed) {
  EXPECT_EQ(WhatIsWrongWith({"volumes", "/"}),
            "tallowmere-cli: \"volumes\" takes no \"/\"; --help tells more\n");
}

TEST(CommandLine, HelpIsAnOptionAndACommand) {
  const std::string help = Printed({"--help"});
  EXPECT_THAT(help, HasSubstr("volumes"));
  EXPECT_EQ(Printed({"help"}), help);
  EXPECT_EQ(Printed({"-h"}), help);
  for (const char* const command : {"spec", "census", "help"}) {
    EXPECT_EQ(Printed({"help", command}), Printed({command, "--help"}));
  }
}

// It prints a table, and shows no progress.
TEST(CommandLine, IdentifyHasNoOptionsThatDoNothing) {
  for (const char* const option : {"--null-output", "--no-progress"}) {
    EXPECT_EQ(
        WhatIsWrongWith({"identify", option, "/"}),
        std::string("tallowmere-cli: there is no option ") + option + "; --help tells more\n");
  }
}

TEST(CommandLine, TheVersionHasAShortOption) {
  EXPECT_EQ(Printed({"-V"}), Printed({"--version"}));
}

// As a shell runs them.
TEST(CommandLine, TheExamplesOfTheHelpRun) {
  ChildProgram shell("/bin/bash",
                     {"-c",
                      "set -o pipefail; cd /etc/alternatives; PATH=$(dirname \"$0\"):$PATH; "
                      "eval \"$(\"$0\" spec --help | grep -- '-print0')\" | jq -r .path | sort | "
                      "cmp - <(find . | sort)",
                      TALLOWMERE_CLI});
  EXPECT_EQ(shell.ReadErrorsToEnd(), "");
  EXPECT_EQ(shell.Wait(), 0);
}

}  // namespace
}  // namespace tallowmere::test
