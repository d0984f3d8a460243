// tallowmere-cli alias: records, bookmarks and files with them, told apart by their content.
#include <gmock/gmock.h>
#include <sys/stat.h>

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
  EXPECT_EQ(shown["error"], "its volume \"Caf\u00E9 Disk of Tallowmere\" is not mounted");
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

// Makes an alias file that leads to "file" in the same folder, and returns its path.
std::string MakeAliasOfFile(const TemporaryFolder& folder) {
  RecordToWrite record = Record();
  record.levelsUp = record.levelsDown = 1;
  folder.MakeFile("._alias", WriteSidecarOfAlias(Write(record)));
  return folder.MakeFile("alias");
}

TEST(AliasCommand, TellsWhereAnAliasFileLeads) {
  const TemporaryFolder folder;
  const std::string target = folder.MakeFile("file");
  const std::string alias = MakeAliasOfFile(folder);
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
  EXPECT_THAT(shown.output, HasSubstr("is not mounted"));
  EXPECT_THAT(shown.output, HasSubstr("no alias, or a broken one"));
  EXPECT_EQ(shown.errors, "");
  std::string many;
  for (int i = 0; i < 1000; ++i) many += record + "\n";
  EXPECT_EQ(RunAlias({"--json", "-"}, many).errors,
            "tallowmere-cli: 1000 items: 0 found, 0 new, 0 nothing, 1000 failed\n");
}

TEST(AliasCommand, NamesWhatIsWrongWithAnItemAndPrintsAnEmptyLineForIt) {
  const TemporaryFolder folder;
  const std::string here = folder.Path();
  ASSERT_EQ(mkfifo((here + "/pipe").c_str(), 0600), 0);
  const std::vector<std::pair<std::string, std::string>> faults = {
      {folder.MakeFile("x", "text"), "no alias, or a broken one"},
      {here + "/none", "there is no such file"},
      {here + "/none/x", "there is no folder \"" + here + "/none\""},
      {here, "it is a folder, not a file"},
      {here + "/pipe", "it is no regular file"},
      {folder.MakeLink("link", "nowhere"), "it is a link that leads nowhere"},
  };
  for (const auto& [item, fault] : faults) {
    const Printed shown = RunAlias({item});
    EXPECT_EQ(shown.output, "\n") << item;
    EXPECT_EQ(shown.errors, "tallowmere-cli: " + item + ": " + fault + "\n");
    EXPECT_EQ(shown.status, 1);
  }
}

TEST(AliasCommand, NamesDigitsThatAreNotHexadecimal) {
  for (const char* const item : {"zz", "abc", "0x41"}) {
    const Printed shown = RunAlias({"--hex", item});
    EXPECT_EQ(shown.output, "\n");
    EXPECT_EQ(shown.errors, std::string("tallowmere-cli: ") + item +
                                ": it is not in hexadecimal, two digits a byte\n");
    EXPECT_EQ(shown.status, 1);
  }
  EXPECT_EQ(RunAlias({"--hex", " "}).errors, "tallowmere-cli:  : it has no hexadecimal digits\n");
}

TEST(AliasCommand, ReadsTheFileThatALinkLeadsTo) {
  const TemporaryFolder folder;
  folder.MakeFile("record", Write(Record()));
  EXPECT_EQ(JsonOf(folder.MakeLink("link", "record"))["id"], 42);
}

TEST(AliasCommand, HasTrueBytesInJsonWhereTheyAreNoUtf8) {
  const TemporaryFolder folder;
  RecordToWrite record = Record();
  record.tags.push_back({18, "/folder/\xFFile"});
  const json shown = JsonOf(folder.MakeFile("\xFFrecord", Write(record)));
  EXPECT_EQ(shown["posix_path"], "/folder/\xEF\xBF\xBDile");
  EXPECT_EQ(shown["posix_path_hex"], "2f666f6c6465722fff696c65");
  EXPECT_THAT(shown["alias_hex"].get<std::string>(), testing::EndsWith("2fff7265636f7264"));
}

// So that paste(1) can put items and targets beside each other.
TEST(AliasCommand, WithTargetPrintsALineForEachItem) {
  const TemporaryFolder folder;
  const std::string target = folder.MakeFile("file");
  const std::string alias = MakeAliasOfFile(folder);
  const std::string lost = folder.MakeFile("lost", Write(Record()));
  const Printed shown = RunAlias({"--target", lost, alias, folder.Path() / "none"});
  EXPECT_EQ(shown.output, "\n" + target + "\n\n");
  EXPECT_EQ(shown.status, 1);
  EXPECT_THAT(shown.errors,
              HasSubstr(lost + ": its volume \"Caf\u00E9 Disk of Tallowmere\" is not"));
  EXPECT_EQ(RunAlias({"--target", "--null-output", alias}).output, target + '\0');
  EXPECT_EQ(RunAlias({"--null-output", alias}).status, 2);
}

TEST(AliasCommand, SaysOnStandardErrorWhyAnAliasLeadsNowhere) {
  const TemporaryFolder folder;
  const std::string lost = folder.MakeFile("lost", Write(Record()));
  const Printed shown = RunAlias({lost});
  EXPECT_THAT(shown.output, HasSubstr("leads to          nothing: its volume"));
  EXPECT_EQ(shown.errors, "tallowmere-cli: " + lost +
                              ": its volume \"Caf\u00E9 Disk of Tallowmere\" is not mounted\n");
}

// A copy of the disk that Record() is of.
class AliasOfACopiedDisk : public testing::Test {
 protected:
  AliasOfACopiedDisk() : mCopy(mFolder.Path() / "copy") {
    mFolder.MakeFolder("copy/folder");
    mFolder.MakeFile("copy/folder/file");
    mMap = "Caf\u00E9 Disk of Tallowmere=" + mCopy;
  }
  json Leads(const RecordToWrite& record) {
    const std::string file = mFolder.MakeFile("record", Write(record));
    return json::parse(RunAlias({"--json", "--map", mMap, file}).output);
  }

  TemporaryFolder mFolder;
  std::string mCopy;
  std::string mMap;
};

TEST_F(AliasOfACopiedDisk, LeadsToTheItemThere) {
  for (const bool isPosix : {false, true}) {
    RecordToWrite record = Record();
    if (isPosix) record.tags = {{18, "/folder/file"}};
    const json found = Leads(record);
    EXPECT_EQ(found["status"], "found") << isPosix;
    EXPECT_EQ(found["target"], mCopy + "/folder/file");
    EXPECT_EQ(found["by"], "map");
    EXPECT_EQ(found["exists"], true);
  }
  EXPECT_EQ(RunAlias({"--target", "--map", mMap, (mFolder.Path() / "record").string()}).output,
            mCopy + "/folder/file\n");
}

TEST_F(AliasOfACopiedDisk, LeadsToNothingThatIsNoneOrOfAnotherKind) {
  RecordToWrite record = Record();
  record.tags = {{18, "/folder/none"}};
  EXPECT_EQ(Leads(record)["status"], "nothing");
  EXPECT_EQ(Leads(record)["error"], "there is no file or folder \"" + mCopy + "/folder/none\"");
  record.tags = {{18, "/folder"}};
  EXPECT_EQ(Leads(record)["error"], "\"" + mCopy + "/folder\" is a folder, unlike its target");
  record.tags = {{18, "/none/file"}};
  EXPECT_EQ(Leads(record)["error"], "there is no folder \"" + mCopy + "/none\"");
}

TEST_F(AliasOfACopiedDisk, IsNotLeft) {
  mFolder.MakeFile("file");
  mFolder.MakeLink("copy/out", "..");
  RecordToWrite record = Record();
  for (const char* const path : {"/../file", "/out/file"}) {
    record.tags = {{18, path}};
    EXPECT_EQ(Leads(record)["exists"], false) << path;
  }
}

TEST_F(AliasOfACopiedDisk, MayBeToldInATable) {
  const std::string record = mFolder.MakeFile("record", Write(Record()));
  const std::string table = mFolder.MakeFile("table", mMap + "\n");
  EXPECT_EQ(RunAlias({"--target", "--volumes", table, record}).output, mCopy + "/folder/file\n");
}

}  // namespace
}  // namespace tallowmere::test
