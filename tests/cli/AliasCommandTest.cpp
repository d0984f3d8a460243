// tallowmere-cli alias: records, bookmarks and files with them, told apart by their content.
#include <gmock/gmock.h>

#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "support/ChildProgram.h"
#include "support/OldFormats.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using nlohmann::json;
using testing::HasSubstr;

// A record that leads nowhere: of a volume that is not mounted.
RecordToWrite Record() {
  RecordToWrite record;
  record.volumeName = "Caf\x8E Disk of Tallowmere";
  record.volumeCreation = 0xB0000000;
  record.name = "file";
  record.parentID = 23;
  record.targetID = 42;
  record.tags = {{2, "Caf\x8E Disk of Tallowmere:folder:file"}};
  return record;
}

std::string Hex(const std::string& bytes) {
  std::string digits;
  for (const char byte : bytes) {
    constexpr const char* kDigits = "0123456789ABCDEF";
    digits += kDigits[static_cast<unsigned char>(byte) >> 4U];
    digits += kDigits[static_cast<unsigned char>(byte) & 15U];
    digits += ' ';
  }
  return digits;
}

struct Printed {
  std::string output;
  std::string errors;
  int status;
};
Printed RunAlias(std::vector<std::string> arguments, const std::string& input = "") {
  arguments.insert(arguments.begin(), "alias");
  ChildProgram cli(TALLOWMERE_CLI, arguments);
  cli.Write(input);
  cli.CloseInput();
  Printed printed;
  printed.output = cli.ReadToEnd();
  printed.errors = cli.ReadErrorsToEnd();
  printed.status = cli.Wait();
  return printed;
}

json JsonOf(const std::string& file) {
  return json::parse(RunAlias({"--json", file}).output);
}

TEST(AliasCommand, ShowsWhatARecordSays) {
  const TemporaryFolder folder;
  const json shown = JsonOf(folder.MakeFile("record", Write(Record())));
  EXPECT_EQ(shown["form"], "alias record, version 2");
  EXPECT_EQ(shown["volume"], "Caf\u00E9 Disk of Tallowmere");
  EXPECT_EQ(shown["file_system"], "H+");
  EXPECT_EQ(shown["volume_created"], "1997-07-26T19:26:56");
  EXPECT_EQ(shown["name"], "file");
  EXPECT_EQ(shown["id"], 42);
  EXPECT_EQ(shown["parent_id"], 23);
  EXPECT_EQ(shown["hfs_path"], "Caf\u00E9 Disk of Tallowmere:folder:file");
  EXPECT_EQ(shown["status"], "not-a-volume");
  EXPECT_EQ(shown["exists"], false);
  EXPECT_EQ(shown["error"], "its volume is not mounted");
}

TEST(AliasCommand, TellsContainersApartByTheirContent) {
  const TemporaryFolder folder;
  const std::string fork = WriteResourceFork({{"alis", 0, Write(Record())}});
  MacBinaryToWrite macBinary;
  macBinary.resourceFork = fork;
  const std::vector<std::pair<std::string, std::string>> files = {
      {"resource fork", fork},
      {"AppleDouble file", WriteAppleDouble({{2, fork}})},
      {"MacBinary file", Write(macBinary)},
  };
  for (const auto& [container, content] : files) {
    const json shown = JsonOf(folder.MakeFile("x", content));
    EXPECT_EQ(shown["container"], container);
    EXPECT_EQ(shown["id"], 42) << container;
  }
  const BookmarkWriter bookmark =
      Write(BookmarkToWrite{.components = {"a", "b"}, .volumeName = "V"});
  EXPECT_EQ(JsonOf(folder.MakeFile("x", bookmark.File()))["container"], "alias file");
  const json bare = JsonOf(folder.MakeFile("x", bookmark.Bare()));
  EXPECT_EQ(bare["form"], "bookmark");
  EXPECT_EQ(bare["posix_path"], "/a/b");
  EXPECT_FALSE(bare.contains("container"));
}

TEST(AliasCommand, ShowsTheNameInABookmarkInHFSForm) {
  const auto bookmark = Write(BookmarkToWrite{.components = {"a", "b:c"}, .volumeName = "V"});
  const TemporaryFolder folder;
  const json shown = JsonOf(folder.MakeFile("x", bookmark.Bare()));
  EXPECT_EQ(shown["name"], "b/c");
  EXPECT_EQ(shown["posix_path"], "/a/b:c");
}

// What writers put where the file system has no date: 1970-01-01 0:00, in seconds since 2001.
TEST(AliasCommand, ShowsNoDateOfAVolumeThatHasNone) {
  const TemporaryFolder folder;
  const auto shownOf = [&](std::uint64_t bits) {
    BookmarkWriter writer;
    const auto date = writer.Add(0x0400, Big(bits, 8));
    writer.AddTable(1, {{0x2013, date}});
    return JsonOf(folder.MakeFile("x", writer.Bare()));
  };
  EXPECT_FALSE(shownOf(0xC1CD27E440000000).contains("volume_created"));
  EXPECT_EQ(shownOf(0xC1CD27E43F800000)["volume_created"], "1970-01-01T00:00:01Z");
}

TEST(AliasCommand, ReadsTheRecordBesideABrokenBookmark) {
  const TemporaryFolder folder;
  const std::string bookmark =
      Write(BookmarkToWrite{.components = {"a", "b"}, .volumeName = "V"}).File();
  MacBinaryToWrite macBinary;
  macBinary.resourceFork = WriteResourceFork({{"alis", 0, Write(Record())}});
  macBinary.dataFork = bookmark;
  EXPECT_EQ(JsonOf(folder.MakeFile("whole", Write(macBinary)))["form"], "bookmark");
  macBinary.dataFork = bookmark.substr(0, 60);
  EXPECT_EQ(JsonOf(folder.MakeFile("cut", Write(macBinary)))["id"], 42);
}

// Not the file that the path names once ".." is taken out of its text.
TEST(AliasCommand, GoesTheKernelsWayToAFile) {
  const TemporaryFolder folder;
  folder.MakeFolder("other/inner");
  std::filesystem::create_directory_symlink("other/inner", folder.Path() / "link");
  folder.MakeFile("record", "no alias");
  folder.MakeFile("other/record", Write(Record()));
  EXPECT_EQ(JsonOf(folder.Path() / "link/../record")["id"], 42);
}

TEST(AliasCommand, TellsWhereAnAliasFileLeads) {
  const TemporaryFolder folder;
  const std::string target = folder.MakeFile("file");
  RecordToWrite record = Record();
  record.levelsUp = record.levelsDown = 1;
  const std::string alias = folder.MakeFile("alias");
  folder.MakeFile("._alias", WriteSidecarOfAlias(Write(record)));
  const json shown = JsonOf(alias);
  EXPECT_EQ(shown["container"], "alias file");
  EXPECT_EQ(shown["exists"], true);
  EXPECT_EQ(shown["target"], target);
  EXPECT_EQ(shown["by"], "levels");
  const Printed text = RunAlias({alias});
  EXPECT_EQ(text.status, 0);
  EXPECT_THAT(text.output, HasSubstr("leads to          " + target + " (by levels)\n"));
}

TEST(AliasCommand, ReadsHexadecimalDigits) {
  const Printed shown = RunAlias({"--hex", "--json", Hex(Write(Record()))});
  EXPECT_EQ(json::parse(shown.output)["id"], 42);
  EXPECT_EQ(shown.status, 1);
}

TEST(AliasCommand, ReadsItemsFromStandardInputAndCounts) {
  const TemporaryFolder folder;
  const std::string record = folder.MakeFile("record", Write(Record()));
  const Printed shown =
      RunAlias({"--json", "-"}, record + "\n" + folder.MakeFile("other", "x").string());
  EXPECT_THAT(shown.output, HasSubstr("its volume is not mounted"));
  EXPECT_THAT(shown.output, HasSubstr("no alias, or a broken one"));
  EXPECT_EQ(shown.errors, "0 of 2 lead to an item\n");
}

TEST(AliasCommand, ComplainsOfWhatIsNone) {
  const TemporaryFolder folder;
  for (const std::string& item : {folder.MakeFile("x", "text").string(),
                                  (folder.Path() / "none").string(), folder.Path().string()}) {
    const Printed shown = RunAlias({item});
    EXPECT_EQ(shown.output, "");
    EXPECT_THAT(shown.errors, HasSubstr(item));
    EXPECT_EQ(shown.status, 1);
  }
  EXPECT_EQ(RunAlias({"--hex", "no digits"}).status, 1);
}

}  // namespace
}  // namespace tallowmere::test
