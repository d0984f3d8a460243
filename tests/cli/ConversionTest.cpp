// The commands that turn items into something else, from arguments and from standard input.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <nlohmann/json.hpp>
#include <set>
#include <sstream>
#include <thread>

#include "RunCli.h"
#include "support/ChildProgram.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using nlohmann::json;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

std::string ReadFile(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

// The calls in a table of strace, except those that read, write or wait for pipes.
int CallsBesidePipes(const std::string& table) {
  int count = 0;
  std::istringstream lines(ReadFile(table));
  for (std::string line; std::getline(lines, line);) {
    std::istringstream fields(line);
    double share = 0;
    double seconds = 0;
    long each = 0;
    int calls = 0;
    if (!(fields >> share >> seconds >> each >> calls)) continue;
    const std::string name = line.substr(line.rfind(' ') + 1);
    if (name == "total" || name == "read" || name == "write" || name == "poll" ||
        name == "clock_nanosleep") {
      continue;
    }
    count += calls;
  }
  return count;
}

// The keys of an object, in their order.
std::vector<std::string> Keys(const std::string& object) {
  std::vector<std::string> keys;
  const auto parsed = nlohmann::ordered_json::parse(object);
  for (const auto& [key, value] : parsed.items()) keys.push_back(key);
  return keys;
}

// A folder with the file "a:b" in it.
class Conversion : public testing::Test {
 protected:
  Conversion() : mFile(mFolder.MakeFile("a:b")), mHere(mFolder.Path()) {}

  TemporaryFolder mFolder;
  std::string mFile;
  std::string mHere;
};

TEST_F(Conversion, ARecordAndItsPathLeadToEachOther) {
  for (const std::vector<std::string>& command :
       {std::vector<std::string>{"spec", mFile}, {"spec", "--hex", mFile}}) {
    const Output record = Cli(command);
    EXPECT_EQ(record.status, 0);
    const Output path = Cli({"path", "-"}, record.text);
    EXPECT_EQ(path.text, mFile + "\n");
    EXPECT_EQ(path.status, 0);
  }
}

TEST_F(Conversion, ARecordIsVolumeParentAndHFSName) {
  struct stat folder {};
  stat(mHere.c_str(), &folder);
  EXPECT_THAT(Cli({"spec", mFile}).text, testing::MatchesRegex("-[0-9]+:[0-9]+:a/b\n"));
  if (folder.st_ino >= 16 && folder.st_ino <= 0x7FFFFEFF) {
    EXPECT_THAT(Cli({"spec", mFile}).text, HasSubstr(":" + std::to_string(folder.st_ino) + ":"));
  }
}

TEST_F(Conversion, AColumnOfATableIsAsWideAsItsLongestTextHasCharacters) {
  const std::string name = "caf\xC3\xA9 \xC3\xA0 la cr\xC3\xA8me";
  const std::string file = mFolder.MakeFile(name);
  const std::string hfsPath = Lines(Cli({"hfs", file}).text).at(0);
  EXPECT_THAT(Cli({"identify", file, mFile}).text, HasSubstr(" " + name + "  " + hfsPath));
}

TEST_F(Conversion, AnItemMayEndWhereAPieceOfTheInputDoes) {
  constexpr std::size_t kPiece = 65536;
  std::string input;
  std::string names;
  while (input.size() + 2 * mFile.size() < kPiece) {
    input += mFile + "\n";
    names += "a/b\n";
  }
  input += mHere + std::string(kPiece - input.size() - mHere.size() - 3, '/') + "a:b";
  ASSERT_EQ(input.size(), kPiece);
  const std::string file = mFolder.MakeFile("items", input + "\n" + mFile + "\n");
  ChildProgram shell("/bin/sh", {"-c", "exec \"$0\" name - <\"$1\"", TALLOWMERE_CLI, file});
  EXPECT_EQ(shell.ReadToEnd(), names + "a/b\na/b\n");
}

TEST_F(Conversion, AnHFSPathAndItsPathLeadToEachOther) {
  const Output hfs = Cli({"hfs", mFile, mHere});
  const auto lines = Lines(hfs.text);
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[0], lines[1] + "a/b");
  EXPECT_EQ(lines[1].back(), ':');
  EXPECT_EQ(Cli({"posix", "-"}, hfs.text).text, mFile + "\n" + mHere + "\n");
}

TEST_F(Conversion, ANameAndAFolderGiveThePath) {
  EXPECT_EQ(Cli({"name", mFile}).text, "a/b\n");
  EXPECT_EQ(Cli({"append", mHere, "a/b", "n\xC3\xA9w"}).text,
            mFile + "\n" + mHere + "/n\xC3\xA9w\n");
  EXPECT_EQ(Cli({"append", mHere, "-"}, "a/b\n").text, mFile + "\n");
}

TEST_F(Conversion, ARelativePathIsOneFromTheCurrentFolder) {
  ChildProgram cli("/bin/sh",
                   {"-c", "cd \"$1\" && exec \"$0\" name a:b ./a:b .", TALLOWMERE_CLI, mHere});
  EXPECT_EQ(cli.ReadToEnd(), "a/b\na/b\n" + mFolder.Path().filename().string() + "\n");
}

TEST_F(Conversion, SlashesAtTheEndDoNotCount) {
  EXPECT_EQ(Cli({"hfs", mHere + "/", mHere + "//"}).text, Cli({"hfs", mHere, mHere}).text);
  EXPECT_EQ(Cli({"identify", mHere + "/"}).text, Cli({"identify", mHere}).text);
  EXPECT_EQ(Cli({"name", "//"}).text, Cli({"name", "/"}).text);
}

TEST_F(Conversion, ALinkToAFolderIsAnItemOfItsFolder) {
  const std::string link = mFolder.MakeLink("link", "/");
  EXPECT_EQ(Cli({"hfs", link}).text, Lines(Cli({"hfs", mHere}).text)[0] + "link\n");
}

// --- Standard input -----------------------------------------------------------------------------

TEST_F(Conversion, LinesOfStandardInputAreAnsweredInTheirOrder) {
  std::string input;
  std::string expected;
  for (int i = 0; i < 3000; ++i) {
    const std::string name = std::to_string(i * 7919 % 3000);
    input += mHere + "/" + name + "\n";
    expected += name + "\n";
    if (i % 100 == 0) mFolder.MakeFile(name);
  }
  const Output output = Cli({"spec", "-"}, input);
  std::string names;
  for (const std::string& line : Lines(output.text)) {
    names += line.substr(line.rfind(':') + 1) + "\n";
  }
  EXPECT_EQ(names, expected);
  EXPECT_EQ(output.status, 0);
}

// The path of a service that leaves a line in the file "started" when it starts.
std::string CountedService(const TemporaryFolder& folder) {
  const std::string started = folder.Path() / "started";
  const std::string path = folder.MakeFile(
      "counted", "#!/bin/sh\necho >>'" + started + "'\nexec " TALLOWMERE_SERVICE " \"$@\"\n");
  chmod(path.c_str(), 0755);
  return path;
}

// How many services answer this many items.
std::size_t ServicesFor(const TemporaryFolder& folder, int items) {
  const std::string started = folder.MakeFile("started", "");
  const std::string service = CountedService(folder);
  std::string input;
  std::string expected;
  for (int i = 0; i < items; ++i) {
    input += "/" + std::to_string(i) + "\n";
    expected += std::to_string(i) + "\n";
  }
  EXPECT_EQ(Cli({"--service", service, "name", "-"}, input).text, expected);
  return std::filesystem::file_size(started);
}

bool EachFileSystemIsMountedOnce() {
  std::set<std::string> devices;
  std::istringstream lines(ReadFile("/proc/self/mountinfo"));
  for (std::string line; std::getline(lines, line);) {
    std::istringstream fields(line);
    std::string id;
    std::string parent;
    std::string device;
    fields >> id >> parent >> device;
    if (!devices.insert(device).second) return false;
  }
  return true;
}

TEST_F(Conversion, ManyItemsAreAnsweredByAServiceForEachCoreInTheirOrder) {
  if (!EachFileSystemIsMountedOnce()) GTEST_SKIP() << "one service answers all here";
  const std::size_t cores = std::thread::hardware_concurrency();
  EXPECT_EQ(ServicesFor(mFolder, 2), 1u);
  EXPECT_EQ(ServicesFor(mFolder, 20'000), cores);
}

TEST_F(Conversion, OneServiceAnswersAllWhereASecondDoesNotStart) {
  if (!EachFileSystemIsMountedOnce()) GTEST_SKIP() << "one service answers all here";
  const std::string started = mFolder.Path() / "started";
  const std::string service = mFolder.MakeFile(
      "only", "#!/bin/sh\nmkdir '" + started + "' || exit\nexec " TALLOWMERE_SERVICE " \"$@\"\n");
  chmod(service.c_str(), 0755);
  std::string input;
  std::string expected;
  for (int i = 0; i < 20'000; ++i) {
    input += "/" + std::to_string(i) + "\n";
    expected += std::to_string(i) + "\n";
  }
  const Output output = Cli({"--service", service, "name", "--quiet", "-"}, input);
  EXPECT_EQ(output.text, expected);
  EXPECT_THAT(output.errors, HasSubstr("File exists"));  // said by the second, which was tried
}

// Each service may give either path of an item.
TEST_F(Conversion, WhereAFolderIsShownTwiceOneServiceAnswersAll) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const std::string twice = mFolder.MakeFolder("twice");
  const ScopedMount volume("none", mFolder.MakeFolder("volume").string(), "tmpfs");
  ASSERT_EQ(mount((mHere + "/volume").c_str(), twice.c_str(), nullptr, MS_BIND, nullptr), 0);
  EXPECT_EQ(ServicesFor(mFolder, 20'000), 1u);
  umount(twice.c_str());
}

TEST_F(Conversion, ManyItemsEndInASummary) {
  std::string input;
  for (int i = 0; i < 999; ++i) input += mFile + "\n";
  EXPECT_EQ(Cli({"name", "-"}, input).errors, "");
  EXPECT_EQ(Cli({"name", "-"}, input + mFile).errors,
            "tallowmere-cli: 1000 items: 1000 found, 0 new, 0 nothing, 0 failed\n");
  input += mHere + "/new\n" + mHere + "/missing/x\n/proc/1/status\n";
  EXPECT_EQ(Cli({"name", "--json", "-"}, input).errors,
            "tallowmere-cli: 1002 items: 999 found, 1 new, 1 nothing, 1 failed\n");
  EXPECT_EQ(Cli({"name", "--json", "--quiet", "-"}, input).errors, "");
}

// Each item is in exactly one of the four counts.
TEST_F(Conversion, WhatFailsForBeingNewIsSummedUpAsFailed) {
  std::string input = mFile + "\n" + mHere + "/missing/x\n";
  for (int i = 0; i < 1000; ++i) input += mHere + "/new\n";
  EXPECT_EQ(Cli({"name", "--json", "--existing", "-"}, input).errors,
            "tallowmere-cli: 1002 items: 1 found, 0 new, 1 nothing, 1000 failed\n");
}

// Beside those on pipes, of which there are fewer than items.
TEST_F(Conversion, AnItemCostsTheCommandLineFewSystemCalls) {
  if (access("/usr/bin/strace", X_OK) != 0) GTEST_SKIP() << "strace is not installed";
  constexpr int kItems = 4000;
  std::string input;
  for (int i = 0; i < kItems; ++i) input += mFile + "\n";
  const std::string calls = mFolder.Path() / "calls";
  const std::string names = mFolder.MakeFile("names", input);
  for (const char* const command : {"spec", "hfs", "name"}) {
    ChildProgram traced("/bin/sh", {"-c",
                                    "exec strace -E ASAN_OPTIONS=detect_leaks=0 -qq -c -b execve "
                                    "-f -o \"$1\" \"$0\" $2 -q - <\"$3\" >/dev/null",
                                    TALLOWMERE_CLI, calls, command, names});
    EXPECT_EQ(traced.Wait(), 0);
    const int count = CallsBesidePipes(calls);
    EXPECT_GE(count, kItems) << command << ": not all have been counted";
    EXPECT_LE(count, 3 * kItems) << command;
  }
}

TEST_F(Conversion, TheLastLineMayLackItsEnd) {
  EXPECT_EQ(Cli({"name", "-"}, mFile + "\n" + mFile).text, "a/b\na/b\n");
  EXPECT_EQ(Cli({"name", "-"}, mFile + "\n").text, "a/b\n");
  EXPECT_EQ(Cli({"name", "-"}, "").text, "");
}

TEST_F(Conversion, NullEndsTheItemsAndNullOutputTheResults) {
  const std::string file = mFolder.MakeFile("x\ny");
  const std::string items = file + '\0' + mFile + '\0';
  EXPECT_EQ(Cli({"name", "-0", "--null-output", "-"}, items).text, std::string("x\ny\0a/b\0", 8));
  EXPECT_EQ(Cli({"name", "--null", "-"}, mFile + '\0' + mFile + '\0').text, "a/b\na/b\n");
  EXPECT_EQ(Cli({"name", "--null-output", "-"}, mFile + "\n").text, std::string("a/b\0", 4));
}

TEST_F(Conversion, JsonIsOneObjectALineWhateverEndsItemsAndResults) {
  const std::string items = mFile + '\0' + mHere + '\0';
  for (const char* const command : {"name", "spec", "hfs"}) {
    const Output output = Cli({command, "-0", "--null-output", "--json", "-"}, items);
    const auto lines = Lines(output.text);
    ASSERT_EQ(lines.size(), 2u) << command;
    EXPECT_EQ(json::parse(lines[0])["path"], mFile) << command;
    EXPECT_EQ(output.text.find('\0'), std::string::npos) << command;
  }
}

// Two lines for one item would be taken for two items.
TEST_F(Conversion, AnAnswerWithANewlineIsRefusedUnlessItsEndCanBeTold) {
  const std::string file = mFolder.MakeFile("x\ny");
  const Output lines = Cli({"name", file, mFile});
  EXPECT_EQ(lines.text, "\na/b\n");
  EXPECT_THAT(lines.errors, testing::EndsWith("/x\\012y: the answer has a newline; --json or "
                                              "--null-output prints it\n"));
  EXPECT_EQ(lines.status, 1);
  EXPECT_EQ(json::parse(Cli({"name", "--json", file}).text)["name"], "x\ny");
  EXPECT_EQ(Cli({"name", "--null-output", file}).text, std::string("x\ny\0", 4));
  EXPECT_EQ(Cli({"spec", "--hex", file}).status, 0);
}

TEST_F(Conversion, AComplaintShowsControlCharactersAsOctalDigits) {
  EXPECT_THAT(Cli({"name", "/nonexistent/\x1F\x7F\xC2\x80\xC2\x9F\xC2\xA0"}).errors,
              testing::HasSubstr("/nonexistent/\\037\\177\\302\\200\\302\\237\xC2\xA0"));
}

TEST_F(Conversion, ALineIsAnsweredBeforeTheNextOneIsThere) {
  ChildProgram cli(TALLOWMERE_CLI, {"name", "-"});
  for (int i = 0; i < 3; ++i) {
    cli.Write(mFile + "\n");
    EXPECT_EQ(cli.Read(4), "a/b\n");
  }
  cli.CloseInput();
  EXPECT_EQ(cli.Wait(), 0);
}

// With a non-blocking descriptor, another reader can take what poll(2) promised.
TEST_F(Conversion, AnInputThatHasNothingYetIsWaitedFor) {
  ChildProgram cli("env", {"ASAN_OPTIONS=verify_asan_link_order=0", "TALLOWMERE_UNREADY_READS=3",
                           "LD_PRELOAD=" TALLOWMERE_FAULTY_INPUT, TALLOWMERE_CLI, "name", "-"});
  cli.Write(mFile + "\n");
  cli.CloseInput();
  EXPECT_EQ(cli.ReadToEnd(), "a/b\n");
  EXPECT_EQ(cli.Wait(), 0);
}

TEST_F(Conversion, AnInputThatCannotBeReadIsSaid) {
  ChildProgram cli("/bin/sh", {"-c", "exec \"$0\" name - <\"$1\"", TALLOWMERE_CLI, mHere});
  EXPECT_EQ(cli.ReadErrorsToEnd(), "tallowmere-cli: standard input: Is a directory\n");
  EXPECT_EQ(cli.Wait(), 1);
}

// --- JSON ---------------------------------------------------------------------------------------

TEST_F(Conversion, JsonIsOneObjectALineWithStableKeys) {
  const std::string record = Lines(Cli({"spec", mFile}).text)[0];
  const std::string hfsPath = Lines(Cli({"hfs", mFile}).text)[0];
  const auto keysOf = [](const std::vector<std::string>& command) {
    const Output output = Cli(command);
    EXPECT_EQ(output.status, 0);
    return Keys(Lines(output.text).at(0));
  };
  EXPECT_THAT(keysOf({"spec", "--json", mFile}),
              ElementsAre("path", "status", "volume", "parent", "name", "record"));
  EXPECT_THAT(keysOf({"path", "--json", record}),
              ElementsAre("record", "status", "path", "exists", "by"));
  EXPECT_THAT(keysOf({"hfs", "--json", mFile}), ElementsAre("path", "status", "hfs_path"));
  EXPECT_THAT(keysOf({"posix", "--json", hfsPath}),
              ElementsAre("hfs_path", "status", "path", "exists", "by"));
  EXPECT_THAT(keysOf({"name", "--json", mFile}), ElementsAre("path", "status", "name"));
  EXPECT_THAT(keysOf({"append", "--json", mHere, "a/b"}), ElementsAre("name", "status", "path"));
  EXPECT_THAT(
      keysOf({"identify", "--json", mFile}),
      ElementsAre("path", "status", "volume", "parent", "name", "record", "hfs_path", "way_back"));
  EXPECT_THAT(keysOf({"volumes", "--json"}),
              ElementsAre("volume", "name", "mount_point", "answers_to_its_name"));
  EXPECT_THAT(keysOf({"aiff", "--json"}),
              ElementsAre("rate", "bits", "channels", "format", "settings"));
  EXPECT_THAT(keysOf({"census", "--json", mHere}),
              ElementsAre("items", "came_back", "missing", "vanished", "left_out"));
  EXPECT_THAT(keysOf({"serve-check", "--json"}), ElementsAre("code", "request", "ok"));
}

TEST_F(Conversion, JsonHoldsWhatTheTextSays) {
  const std::string text = Lines(Cli({"spec", mFile}).text)[0];
  const std::string hex = Lines(Cli({"spec", "--hex", mFile}).text)[0];
  const json object = json::parse(Cli({"spec", "--json", mFile}).text);
  EXPECT_EQ(object["path"], mFile);
  EXPECT_EQ(object["name"], "a/b");
  EXPECT_EQ(object["record"], hex);
  EXPECT_EQ(std::to_string(object["volume"].get<int>()) + ":" +
                std::to_string(object["parent"].get<int>()) + ":a/b",
            text);
}

TEST_F(Conversion, AFailedItemIsAnObjectInItsPlace) {
  const Output output =
      Cli({"name", "--json", "-"}, mFile + "\n" + mHere + "/missing/x\n\n" + mFile);
  const auto lines = Lines(output.text);
  ASSERT_EQ(lines.size(), 4u);
  EXPECT_EQ(json::parse(lines[1]),
            json({{"path", mHere + "/missing/x"},
                  {"status", "nothing"},
                  {"error", "there is no folder \"" + mHere + "/missing\""}}));
  EXPECT_EQ(json::parse(lines[2]),
            json({{"path", ""}, {"status", "invalid"}, {"error", "an empty path names nothing"}}));
  EXPECT_EQ(json::parse(lines[3])["name"], "a/b");
  EXPECT_EQ(output.errors, "");
  EXPECT_EQ(output.status, 1);
}

TEST_F(Conversion, TheStatusTellsHowItEnded) {
  const std::string file = mFolder.MakeFile("file");
  mFolder.MakeLink("dangling", "nowhere");
  const auto statusOf = [](const std::string& command, const std::string& item) {
    return json::parse(Cli({command, "--json", item}).text)["status"].get<std::string>();
  };
  const std::string record = Lines(Cli({"spec", file}).text)[0];
  const std::string hfsPath = Lines(Cli({"hfs", file}).text)[0];
  for (const char* const command : {"spec", "hfs", "name", "identify"}) {
    EXPECT_EQ(statusOf(command, file), "found") << command;
    EXPECT_EQ(statusOf(command, mHere + "/dangling"), "found") << command;
    EXPECT_EQ(statusOf(command, mHere + "/new"), "new") << command;
    EXPECT_EQ(statusOf(command, mHere + "/missing/new"), "nothing") << command;
    EXPECT_EQ(statusOf(command, file + "/new"), "nothing") << command;
    EXPECT_EQ(statusOf(command, mHere + "/dangling/new"), "nothing") << command;
    EXPECT_EQ(statusOf(command, "/proc/self/status"), "not-a-volume") << command;
    EXPECT_EQ(statusOf(command, mHere + "/\xE6\x97\xA5"), "invalid") << command;
    EXPECT_EQ(statusOf(command, ""), "invalid") << command;
  }
  EXPECT_EQ(statusOf("path", record), "found");
  EXPECT_EQ(statusOf("path", record + "2"), "new");
  EXPECT_EQ(statusOf("path", "99:2:x"), "not-a-volume");
  EXPECT_EQ(statusOf("path", "0:3:x"), "nothing");
  EXPECT_EQ(statusOf("path", "1:2"), "invalid");
  EXPECT_EQ(statusOf("posix", hfsPath), "found");
  EXPECT_EQ(statusOf("posix", hfsPath + "2"), "new");
  EXPECT_EQ(statusOf("posix", hfsPath + ":x"), "nothing");
  EXPECT_EQ(statusOf("posix", "no such volume:x"), "not-a-volume");
  EXPECT_EQ(statusOf("posix", "\xE6\x97\xA5"), "invalid");
}

TEST_F(Conversion, WithExistingANewItemFails) {
  const std::string record = Lines(Cli({"spec", mFile}).text)[0];
  const std::string hfsPath = Lines(Cli({"hfs", mFile}).text)[0];
  const std::string last = mHere + "/new";
  for (const std::vector<std::string>& command : {std::vector<std::string>{"spec", last, mFile},
                                                  {"hfs", last, mFile},
                                                  {"name", last, mFile},
                                                  {"path", record + "2", record},
                                                  {"posix", hfsPath + "2", hfsPath},
                                                  {"append", mHere, "new", "a/b"},
                                                  {"identify", last, mFile}}) {
    EXPECT_EQ(Cli(command).status, 0) << command[0];
    std::vector<std::string> existing = command;
    existing.insert(existing.begin() + 1, {"--existing", "--json"});
    const Output output = Cli(existing);
    EXPECT_EQ(output.status, 1) << command[0];
    const json first = json::parse(Lines(output.text).at(0));
    EXPECT_EQ(first["status"], "new") << command[0];
    EXPECT_TRUE(first.contains("error")) << command[0];
    EXPECT_EQ(json::parse(Lines(output.text).at(1))["status"], "found") << command[0];
  }
  const Output output = Cli({"name", "--existing", last, mFile});
  EXPECT_EQ(output.text, "\na/b\n");
  EXPECT_THAT(output.errors, HasSubstr("/new: there is no such file or folder, only a folder"));
}

TEST_F(Conversion, BytesThatAreNoUtf8AreInJsonInHexadecimalToo) {
  const std::string file = mFolder.MakeFile("\xFFz");
  const json object = json::parse(Cli({"identify", "--json", file}).text);
  EXPECT_EQ(object["path"], mHere + "/\xEF\xBF\xBDz");
  EXPECT_THAT(object["path_hex"].get<std::string>(), testing::EndsWith("2fff7a"));
  EXPECT_THAT(object["way_back_hex"].get<std::string>(), testing::EndsWith("2fff7a"));
  EXPECT_FALSE(json::parse(Cli({"identify", "--json", mFile}).text).contains("path_hex"));
}

// --- What goes wrong ----------------------------------------------------------------------------

TEST_F(Conversion, AnEmptyPlaceOfAVolumeIsRefused) {
  for (const char* const option : {"--volume", "--volumes"}) {
    const Output output = Cli({"path", option, "", "--", "-1:2:x"});
    EXPECT_EQ(output.status, 2) << option;
    EXPECT_THAT(output.errors, HasSubstr("an empty text is no place")) << option;
  }
}

TEST_F(Conversion, EachFailureIsOneSentenceAndTheRestIsAnswered) {
  const auto errorsOf = [&](const std::vector<std::string>& command) {
    const Output output = Cli(command);
    EXPECT_EQ(output.status, 1);
    return output.errors;
  };
  const std::string prefix = "tallowmere-cli: ";
  const std::string missing = mHere + "/missing";
  const auto quoted = [&](const std::string& text) { return prefix + '"' + text + '"'; };
  for (const char* const command : {"spec", "name", "hfs", "identify"}) {
    EXPECT_EQ(errorsOf({command, missing + "/x"}),
              prefix + missing + "/x: there is no folder \"" + missing + "\"\n");
    EXPECT_EQ(errorsOf({command, mFile + "/x"}),
              prefix + mFile + "/x: there is no folder \"" + mFile + "\"\n");
    EXPECT_EQ(errorsOf({command, "/proc/1/status"}),
              quoted("/proc/1/status") + " is on no volume\n");
    EXPECT_EQ(errorsOf({command, ""}), prefix + "\"\": an empty path names nothing\n");
  }
  EXPECT_EQ(errorsOf({"path", "1:2"}),
            prefix +
                "1:2: a record is volume:parent:name, the name of at most 63 Mac Roman "
                "characters, or its 70 bytes in hexadecimal or base64\n");
  EXPECT_EQ(errorsOf({"path", "99:2:x"}), prefix + "99:2:x: no volume has the number 99\n");
  EXPECT_EQ(errorsOf({"path", "0:3:x"}),
            prefix + "there is neither the item \"0:3:x\" nor a folder for it\n");
  EXPECT_EQ(errorsOf({"posix", "no such volume:x"}),
            prefix + "no such volume:x: no volume is called \"no such volume\"\n");
  EXPECT_EQ(errorsOf({"posix", "a name that nobody has"}),
            prefix + "the HFS path \"a name that nobody has\" begins with no volume's name\n");
  EXPECT_EQ(errorsOf({"posix", std::string(256, 'x')}),
            prefix + std::string(256, 'x') + ": an HFS path has at most 255 bytes\n");
  EXPECT_EQ(errorsOf({"posix", "\xE6\x97\xA5"}),
            prefix + "\xE6\x97\xA5: it has a character that HFS names cannot have\n");
  EXPECT_EQ(errorsOf({"append", missing, "x"}),
            prefix + "x: there is no folder \"" + missing + "\"\n");
  EXPECT_EQ(errorsOf({"append", "", "x"}), prefix + "x: an empty path names nothing\n");
  EXPECT_EQ(errorsOf({"append", mHere, ".."}), prefix + "no item has the HFS name \"..\"\n");
  EXPECT_EQ(errorsOf({"append", mHere, "\xE6\x97\xA5"}),
            prefix + "\xE6\x97\xA5: it has a character that HFS names cannot have\n");
  EXPECT_EQ(errorsOf({"append", mHere, "caf\x8E"}), prefix + "caf\\216: it is not UTF-8\n");
  EXPECT_EQ(errorsOf({"posix", "Root:caf\x8E"}), prefix + "Root:caf\\216: it is not UTF-8\n");
  EXPECT_THAT(errorsOf({"append", mHere, std::string(256, 'x')}),
              HasSubstr("an HFS name has at most 63 bytes"));
}

// Its path ends with its name; the service alone gives that of the folder above.
TEST_F(Conversion, AnInterfaceOfTheKernelHasItsOwnHFSPath) {
  const std::string root = Lines(Cli({"hfs", "/"}).text)[0];
  EXPECT_EQ(Cli({"hfs", "/proc"}).text, root + "proc:\n");
  EXPECT_EQ(json::parse(Cli({"identify", "--json", "/proc"}).text)["hfs_path"], root + "proc:");
}

TEST_F(Conversion, AnHFSPathThatIsCutIsNone) {
  std::string path = mHere;
  for (int i = 0; i < 3; ++i) path += "/" + std::string(200, static_cast<char>('a' + i));
  std::filesystem::create_directories(path);
  const Output output = Cli({"hfs", path, mFile});
  EXPECT_THAT(output.text, testing::StartsWith("\n"));
  EXPECT_EQ(output.status, 1);
  EXPECT_EQ(json::parse(Cli({"hfs", "--json", path}).text)["status"], "invalid");
  EXPECT_EQ(json::parse(Cli({"identify", "--json", path}).text)["hfs_path"], nullptr);
}

// So that paste(1) can put items and answers beside each other.
TEST_F(Conversion, AnItemThatFailsIsAnEmptyLineInItsPlace) {
  const std::string missing = mHere + "/missing/x";
  const std::string record = Lines(Cli({"spec", mFile}).text)[0];
  const std::string hfsPath = Lines(Cli({"hfs", mFile}).text)[0];
  const auto expect = [](std::vector<std::string> command, const std::string& answer) {
    const Output output = Cli(command);
    EXPECT_EQ(output.text, "\n" + answer + "\n\n") << command[0];
    EXPECT_EQ(output.status, 1) << command[0];
  };
  expect({"name", missing, mFile, ""}, "a/b");
  expect({"spec", missing, mFile, ""}, record);
  expect({"hfs", missing, mFile, ""}, hfsPath);
  expect({"path", "1:2", record, "99:2:x"}, mFile);
  expect({"posix", "no such volume:x", hfsPath, "\xE6\x97\xA5"}, mFile);
  expect({"append", mHere, "", "a/b", "\xE6\x97\xA5"}, mFile);
  EXPECT_EQ(Cli({"name", "--null-output", missing, mFile}).text, std::string("\0a/b\0", 5));
  const auto table = Lines(Cli({"identify", missing, mFile, ""}).text);
  ASSERT_EQ(table.size(), 4u);
  EXPECT_EQ(table[1], "");
  EXPECT_THAT(table[2], HasSubstr("a/b"));
  EXPECT_EQ(table[3], "");
}

TEST_F(Conversion, AGiantItemIsQuotedInPart) {
  const Output output = Cli({"spec", "-"}, "/" + std::string(1'000'000, 'x') + "\n" + mFile + "\n");
  EXPECT_EQ(output.errors, "tallowmere-cli: \"/" + std::string(99, 'x') +
                               "... (1000001 bytes)\" is too long: File name too long\n");
  EXPECT_EQ(Lines(output.text).size(), 2u);
}

TEST_F(Conversion, APathThatIsTooLongIsSaid) {
  const Output output = Cli({"spec", "--json", "/" + std::string(70000, 'x')});
  EXPECT_EQ(json::parse(output.text)["status"], "invalid");
}

TEST_F(Conversion, WithOtherVolumesARecordOfAnUnknownVolumeIsLookedForElsewhere) {
  const std::string volume = Lines(Cli({"spec", mFile}).text)[0];
  const std::string unknown = "99" + volume.substr(volume.find(':'));
  EXPECT_EQ(Cli({"path", "--other-volumes", unknown}).text, mFile + "\n");
  EXPECT_EQ(Cli({"path", unknown}).status, 1);
}

TEST_F(Conversion, AServiceThatCannotBeStartedIsSaidOnce) {
  const Output output = Cli({"--service", "/nonexistent", "name", "/", "/etc", "/tmp"});
  EXPECT_EQ(output.errors,
            "tallowmere-cli: the service /nonexistent could not be started: No such file or "
            "directory\n");
  EXPECT_EQ(output.status, 1);
}

// A service that dies at its second request and works once it is started again.
TEST_F(Conversion, AServiceThatDiesOfAnItemIsSaidOfThatItemAndTheRestIsAnswered) {
  const std::string died = mFolder.Path() / "died";
  const std::string script = mFolder.MakeFile(
      "mortal", "#!/bin/sh\n[ -e '" + died + "' ] && exec '" TALLOWMERE_SERVICE "' $1\ntouch '" +
                    died + "'\nhead -c 4 >/dev/null; printf '\\1\\5\\0Root\\0MWLT'\nexit 0\n");
  chmod(script.c_str(), 0755);
  for (const char* const command : {"name", "hfs", "spec"}) {
    const Output output = Cli({"--service", script, command, "--json", mFile, mHere, mFile});
    const auto lines = Lines(output.text);
    ASSERT_EQ(lines.size(), 3u) << command;
    EXPECT_EQ(json::parse(lines[0])["error"], "the service ended before it answered") << command;
    EXPECT_EQ(json::parse(lines[0])["status"], "service-failed") << command;
    EXPECT_FALSE(json::parse(lines[1]).contains("error")) << command;
    EXPECT_EQ(output.status, 1);
    unlink(died.c_str());
  }
}

TEST_F(Conversion, AReasonThatIsNoUtf8IsJsonAllTheSame) {
  const Output output = Cli({"append", "--json", "\xFF", "x"});
  EXPECT_EQ(json::parse(output.text)["error"], "there is no folder \"\xEF\xBF\xBD\"");
  EXPECT_EQ(output.status, 1);
}

TEST_F(Conversion, LinksOnTheWayAreResolved) {
  const std::string folder = mFolder.MakeFolder("real");
  const std::string file = mFolder.MakeFile("real/file");
  const std::string link = mFolder.MakeLink("link", "real");
  for (const char* const command : {"hfs", "spec", "identify", "name"}) {
    for (const std::string name : {"/file", "/../a:b", "/.", "/.."}) {
      const std::string direct = Cli({command, folder + name}).text;
      EXPECT_EQ(Cli({command, link + name}).text, direct) << command << name;
      EXPECT_NE(direct, "");
    }
  }
  EXPECT_EQ(Cli({"spec", link + "/new"}).text, Cli({"spec", folder + "/new"}).text);
  EXPECT_EQ(Cli({"append", link, "file"}).text, file + "\n");
}

TEST_F(Conversion, TheShortestDeadlineIsOne) {
  const Output output = Cli({"--deadline", "0.0005", "volumes"});
  EXPECT_THAT(output.errors, testing::AnyOf("", HasSubstr("did not answer in time")));
  EXPECT_EQ(Cli({"--deadline", "inf", "name", "/"}).status, 0);
}

TEST_F(Conversion, AServiceThatDoesNotAnswerIsSaidWhenTheDeadlineHasPassed) {
  const std::string script = mFolder.MakeFile("silent", "#!/bin/sh\nexec sleep 60\n");
  chmod(script.c_str(), 0755);
  const Output output = Cli({"--service", script, "--deadline", "0.2", "name", "/"});
  EXPECT_EQ(
      output.errors,
      "tallowmere-cli: the service did not answer in time, asked for the name of the volume 0\n");
  EXPECT_EQ(output.status, 1);
}

TEST_F(Conversion, AReaderThatLeavesEndsTheProgramQuietly) {
  ChildProgram cli(
      "/bin/bash",
      {"-c", "yes \"$1\" | head -200000 | \"$0\" name - | head -1; echo ${PIPESTATUS[2]}",
       TALLOWMERE_CLI, mFile});
  EXPECT_EQ(cli.ReadToEnd(), "a/b\n" + std::to_string(128 + SIGPIPE) + "\n");
  EXPECT_EQ(cli.ReadErrorsToEnd(), "");
}

TEST_F(Conversion, AFullDiskIsSaid) {
  ChildProgram cli("/bin/sh", {"-c", "exec \"$0\" name \"$1\" >/dev/full", TALLOWMERE_CLI, mFile});
  EXPECT_EQ(cli.ReadErrorsToEnd(), "tallowmere-cli: the output could not be written\n");
  EXPECT_EQ(cli.Wait(), 1);
}

// --- The others ---------------------------------------------------------------------------------

TEST_F(Conversion, SettingsOfASoundAreStoredAsTheyAre) {
  const std::string path = mFolder.Path() / "settings";
  EXPECT_EQ(Cli({"aiff", "--output", path}).text, "");
  std::ifstream file(path, std::ios::binary);
  const std::string stored{std::istreambuf_iterator<char>(file), {}};
  EXPECT_EQ(stored.size(), 144u);
  EXPECT_EQ(Cli({"aiff", "--output", "-"}).text, stored);
  EXPECT_EQ(Cli({"aiff", "--output", mHere + "/missing/file"}).errors,
            "tallowmere-cli: " + mHere + "/missing/file: No such file or directory\n");
  EXPECT_EQ(Cli({"aiff", "--output", "/dev/full"}).errors,
            "tallowmere-cli: /dev/full: it could not be written\n");
}

// With the limit's signal ignored, the write fails as on a full disk.
TEST_F(Conversion, SettingsThatCannotBeStoredLeaveNoFile) {
  const std::string path = mFolder.Path() / "settings";
  ChildProgram cli("/bin/sh", {"-c", "trap '' XFSZ; ulimit -f 0; exec \"$0\" aiff --output \"$1\"",
                               TALLOWMERE_CLI, path});
  EXPECT_EQ(cli.ReadErrorsToEnd(), "tallowmere-cli: " + path + ": it could not be written\n");
  EXPECT_EQ(cli.Wait(), 1);
  EXPECT_FALSE(std::filesystem::exists(path));
  EXPECT_EQ(Cli({"aiff", "--format", "mp3 ", "--output", path}).status, 1);
  EXPECT_FALSE(std::filesystem::exists(path));
}

TEST_F(Conversion, AServiceThatWorksPassesTheCheckAndAnotherDoesNot) {
  const Output good = Cli({"serve-check"});
  EXPECT_EQ(good.status, 0);
  EXPECT_EQ(Lines(good.text).size(), 11u);
  EXPECT_THAT(good.text, Not(HasSubstr("not fit")));
  for (const char* const code :
       {" 1 ", " 2 ", " 3 ", " 4 ", " 5 ", " 6 ", " 7 ", " 8 ", " 9 ", "10 "}) {
    EXPECT_THAT(good.text, HasSubstr(std::string("  ") + code)) << code;
  }
  const Output bad = Cli({"--service", "/bin/true", "serve-check"});
  EXPECT_EQ(bad.status, 1);
  EXPECT_THAT(bad.text, HasSubstr("the service ended before it answered"));
  EXPECT_EQ(Lines(bad.text).size(), 2u);
}

TEST_F(Conversion, EachCommandHasHelpWithExamples) {
  for (const char* const command : {"spec", "path", "hfs", "posix", "name", "append", "identify",
                                    "volumes", "aiff", "census", "serve-check"}) {
    const Output output = Cli({command, "--help"});
    EXPECT_EQ(output.status, 0);
    EXPECT_THAT(output.text, HasSubstr(std::string("Examples:\n  tallowmere-cli ") + command));
  }
}

}  // namespace
}  // namespace tallowmere::test
