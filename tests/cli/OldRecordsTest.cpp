// Records and HFS paths as other machines stored them: byte order, packed files, volumes that have
// other numbers or were copied.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <tallowmere/Types.h>
#include <unistd.h>

#include <bit>
#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>

#include "RunCli.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::Not;

constexpr std::int16_t kForeignNumber = -3000;  // of no volume here

// A folder with the file "a:b" in it.
class OldRecords : public testing::Test {
 protected:
  OldRecords() : mFile(mFolder.MakeFile("a:b")) {
    const Output record = Cli({"spec", mFile});
    mRecord = *FSSpecOfText(Lines(record.text).at(0));
    mNumber = mRecord.vRefNum;
    mRecord.vRefNum = kForeignNumber;
  }

  // The place of the volume that the folder is on.
  std::string Place() const {
    for (const std::string& line : Lines(Cli({"volumes", "--json"}).text)) {
      const json volume = json::parse(line);
      if (volume["volume"] == mNumber) return volume["mount_point"];
    }
    return "(none)";
  }
  std::string Hex(std::endian order) const {
    std::string digits;
    for (const char byte : EncodeFSSpec(mRecord, order)) {
      char pair[3];
      std::snprintf(pair, sizeof pair, "%02X", static_cast<unsigned char>(byte));
      digits += pair;
    }
    return digits;
  }
  std::string Write(const std::string& name, const std::string& bytes) const {
    const std::string path = mFolder.Path() / name;
    std::ofstream(path, std::ios::binary) << bytes;
    return path;
  }

  TemporaryFolder mFolder;
  std::string mFile;
  FSSpec mRecord{};
  std::int16_t mNumber = 0;
};

TEST_F(OldRecords, OfAVolumeThatIsKnownComeBackInEitherByteOrder) {
  EXPECT_EQ(Cli({"path", "--volume", Place(), "--byte-order", "big", Hex(std::endian::big)}).text,
            mFile + "\n");
  EXPECT_EQ(
      Cli({"path", "--volume", Place(), "--byte-order", "little", Hex(std::endian::little)}).text,
      mFile + "\n");
  const Output wrong = Cli({"path", "--volume", Place(), Hex(std::endian::big)});
  EXPECT_EQ(wrong.status, 1);
  EXPECT_EQ(wrong.text, "\n");
}

TEST_F(OldRecords, InBase64AreRecords) {
  // "-27:19:hostname" with the highest byte first.
  const std::string base64 = "/+UAAAATCGhvc3RuYW1l" + std::string(74, 'A') + "==";
  const std::vector<std::string> path{"path", "--json", "--volume", Place(), "--byte-order", "big"};
  const auto statusOf = [&path](const std::string& record) {
    std::vector<std::string> command = path;
    command.insert(command.end(), {"--", record});
    return std::string(json::parse(Cli(command).text)["status"]);
  };
  EXPECT_EQ(statusOf(base64), statusOf("-27:19:hostname"));
  EXPECT_EQ(statusOf(base64.substr(1)), "invalid");
  EXPECT_EQ(statusOf("=" + base64.substr(1)), "invalid");
}

TEST_F(OldRecords, OfTheOtherByteOrderAreHintedAt) {
  const std::string other = std::endian::native == std::endian::little ? "big" : "little";
  const Output output = Cli({"path", Hex(std::endian::big)});
  EXPECT_THAT(output.errors, HasSubstr("in the other byte order (--byte-order " + other +
                                       ") its volume would be -3000"));
  EXPECT_THAT(Cli({"path", "99:2:x"}).errors, Not(HasSubstr("byte order")));
}

// Where the volume is told, any number is right: the parent id gives the hint.
TEST_F(OldRecords, OfTheOtherByteOrderAreHintedAtWhereTheirVolumeIsTold) {
  const std::string place = Place();
  const auto errorOf = [&](FSSpec record, std::endian order) {
    const std::string bytes = EncodeFSSpec(record, order);
    const Output output = Cli(
        {"path", "--packed", "--byte-order", "little", "--volume", place, Write("packed", bytes)});
    EXPECT_EQ(output.status, 1);
    return output.errors;
  };
  const std::string hint = "in the other byte order (--byte-order big) its ";
  EXPECT_THAT(errorOf({-1, 3, "x"}, std::endian::big), HasSubstr(hint + "folder would be 3\n"));
  EXPECT_THAT(errorOf({-3000, 3, "x"}, std::endian::big),
              HasSubstr(hint + "volume would be -3000\n"));
  EXPECT_THAT(errorOf({-1, 3, "x"}, std::endian::little), Not(HasSubstr("byte order")));
  EXPECT_THAT(errorOf({-1, 0x12345678, "x"}, std::endian::little), Not(HasSubstr("byte order")));
}

TEST_F(OldRecords, OfTheOtherByteOrderAreHintedAtWhereTheTableHasOnlyTheirOtherNumber) {
  const std::string table = Write("table", "-3=" + Place() + "\n");
  const std::string packed = Write("packed", EncodeFSSpec({-3, 2, "x"}, std::endian::big));
  const std::vector<std::string> path{"path", "--packed", "--volumes", table, "--byte-order"};
  std::vector<std::string> wrong = path;
  wrong.insert(wrong.end(), {"little", packed});
  EXPECT_EQ(Cli(wrong).errors,
            "tallowmere-cli: record 1 at byte 0 of " + packed +
                ": the table has no volume -513; in the other byte order (--byte-order big) its "
                "volume would be -3\n");
}

TEST_F(OldRecords, PackedInAFileAreNamedByTheirPlace) {
  FSSpec missing = mRecord;
  missing.parID = 3;  // of no folder
  const auto bytes = [](const FSSpec& record) { return EncodeFSSpec(record, std::endian::big); };
  std::string broken = bytes(mRecord);
  broken[6] = 64;
  const std::string packed =
      Write("packed", "HEAD" + bytes(mRecord) + "12" + bytes(missing) + "12" + broken);
  const std::vector<std::string> path{"path",     "--byte-order", "big", "--volume", Place(),
                                      "--packed", "--skip",       "4",   "--stride", "72"};
  std::vector<std::string> plain = path;
  plain.push_back(packed);
  const Output output = Cli(plain);
  EXPECT_EQ(output.text, mFile + "\n\n\n");
  EXPECT_EQ(output.errors, "tallowmere-cli: record 2 at byte 76 of " + packed +
                               ": there is neither the item \"" + std::to_string(mNumber) +
                               ":3:a/b\" nor a folder for it\n"
                               "tallowmere-cli: record 3 at byte 148 of " +
                               packed + ": the length of its name is above 63\n");
  std::vector<std::string> objects = path;
  objects.insert(objects.end(), {"--json", packed});
  const json second = json::parse(Lines(Cli(objects).text).at(1));
  EXPECT_EQ(second["file"], packed);
  EXPECT_EQ(second["byte"], 76);
  EXPECT_EQ(second["status"], "nothing");
}

TEST_F(OldRecords, PackedInAFileAreTakenOneByOne) {
  const std::string one = EncodeFSSpec(mRecord, std::endian::big);
  const std::string packed = Write("packed", one + one);
  EXPECT_EQ(Cli({"path", "--packed", "--byte-order", "big", "--volume", Place(), packed}).text,
            mFile + "\n" + mFile + "\n");
  EXPECT_EQ(
      Cli({"path", "--packed", "--byte-order", "big", "--volume", Place(), "-"}, one + one).text,
      mFile + "\n" + mFile + "\n");
}

TEST_F(OldRecords, InsideLargerStructuresAreTakenByTheirDistance) {
  const std::string one = EncodeFSSpec(mRecord, std::endian::big);
  const std::string packed = Write("packed", "HEAD" + one + "tail" + one);
  const Output output = Cli({"path", "--packed", "--skip", "4", "--stride", "74", "--byte-order",
                             "big", "--volume", Place(), packed});
  EXPECT_EQ(output.text, mFile + "\n" + mFile + "\n");
}

TEST_F(OldRecords, SideBySideHaveADistanceOf70Bytes) {
  const std::string one = EncodeFSSpec(mRecord);
  const Output output =
      Cli({"path", "--packed", "--stride", "70", "--volume", Place(), Write("packed", one + one)});
  EXPECT_EQ(output.text, mFile + "\n" + mFile + "\n");
}

TEST_F(OldRecords, AFileThatDoesNotEndWithARecordIsRefused) {
  const std::string one = EncodeFSSpec(mRecord);
  for (const std::string& bytes : {one + "x", one.substr(1)}) {
    const Output output = Cli({"path", "--packed", Write("packed", bytes)});
    EXPECT_EQ(output.status, 1);
    EXPECT_THAT(output.errors, HasSubstr("no record of 70 bytes"));
    EXPECT_EQ(output.text, "");
  }
  EXPECT_THAT(Cli({"path", "--packed", "--skip", "9", Write("packed", "x")}).errors,
              HasSubstr("fewer bytes than are to be skipped"));
  EXPECT_THAT(Cli({"path", "--packed", mFolder.Path().string()}).errors,
              HasSubstr("Is a directory"));
  EXPECT_EQ(Cli({"path", "--packed", "--stride", "69", "x"}).status, 2);
  EXPECT_EQ(Cli({"path", "--packed", Write("packed", one + "x")}).errors,
            "tallowmere-cli: " + (mFolder.Path() / "packed").string() +
                ": its last byte is no record of 70 bytes\n");
}

TEST_F(OldRecords, OptionsOfPackedFilesAreCheckedBeforeAnythingIsRead) {
  const auto faultOf = [](const std::vector<std::string>& options) {
    std::vector<std::string> command{"path", "--packed", "/nonexistent"};
    command.insert(command.end(), options.begin(), options.end());
    const Output output = Cli(command);
    EXPECT_EQ(output.status, 2);
    return output.errors;
  };
  EXPECT_THAT(faultOf({"--skip", "-1"}), HasSubstr("--skip: -1 is no number of bytes"));
  EXPECT_THAT(faultOf({"--stride", "1e3"}), HasSubstr("--stride: 1e3 is no number of bytes"));
  EXPECT_THAT(faultOf({"--stride", "69"}), HasSubstr("69 is less than the 70 bytes of a record"));
  // There are no lines for it to end.
  EXPECT_THAT(faultOf({"--null"}), HasSubstr("excludes"));
}

TEST_F(OldRecords, OfAVolumeItselfHaveTheNameThatItHasNow) {
  const Output output = Cli({"path", "--volume", Place(), "--", "-3000:1:Old Disk"});
  EXPECT_EQ(output.text, Place() + "\n");
}

TEST_F(OldRecords, OfATableAreOfTheVolumeThatItTells) {
  const std::string table =
      Write("table", "# disks\n\n-3000=" + Place() + "\n-3001=" + mFolder.Path().string() + "\r\n");
  const std::string rest = ":" + std::to_string(static_cast<std::uint32_t>(mRecord.parID)) + ":a/b";
  EXPECT_EQ(Cli({"path", "--volumes", table, "--", "-3000" + rest}).text, mFile + "\n");
  EXPECT_THAT(Cli({"path", "--volumes", table, "--", "-3001" + rest}).errors,
              HasSubstr("no volume is mounted at"));
  // Even where a volume has the number here.
  const std::string own = std::to_string(mNumber);
  EXPECT_THAT(Cli({"path", "--volumes", table, "--", own + rest}).errors,
              HasSubstr("the table has no volume " + own));
}

TEST_F(OldRecords, OfATableWithLinesOfWindowsAreFoundToo) {
  const std::string table = Write("table", "# disks\r\n\r\n-3000=" + Place() + "\r\n");
  const std::string rest = ":" + std::to_string(static_cast<std::uint32_t>(mRecord.parID)) + ":a/b";
  EXPECT_EQ(Cli({"path", "--volumes", table, "--", "-3000" + rest}).text, mFile + "\n");
}

TEST_F(OldRecords, ATableWithALineThatIsNoneIsRefused) {
  for (const char* const line : {"x", "=x", "x="}) {
    const Output output = Cli({"path", "--volumes", Write("table", line), "1:2:x"});
    EXPECT_EQ(output.status, 1);
    EXPECT_THAT(output.errors, HasSubstr("line 1: it is no OLD-NUMBER-OR-NAME=PLACE"));
  }
  EXPECT_THAT(Cli({"path", "--volumes", Write("table", "-1=/\n-1=/\n"), "1:2:x"}).errors,
              HasSubstr("line 2: \"-1\" has a place already"));
  EXPECT_THAT(Cli({"path", "--volumes", "/nonexistent", "1:2:x"}).errors,
              HasSubstr("No such file"));
}

TEST_F(OldRecords, TellHowTheyWereFoundAndWhetherTheyExist) {
  const std::string text = TextOfFSSpec(mRecord);
  const json known = json::parse(Cli({"path", "--json", "--volume", Place(), "--", text}).text);
  EXPECT_EQ(known["by"], "id");
  EXPECT_EQ(known["exists"], true);
  const json searched = json::parse(Cli({"path", "--json", "--other-volumes", "--", text}).text);
  EXPECT_EQ(searched["by"], "search");
  EXPECT_EQ(searched["path"], mFile);
  FSSpec own = mRecord;
  own.vRefNum = mNumber;
  const json present =
      json::parse(Cli({"path", "--json", "--other-volumes", "--", TextOfFSSpec(own)}).text);
  EXPECT_EQ(present["by"], "id") << "though the search finds it as well";
  const json made =
      json::parse(Cli({"path", "--json", "--volume", Place(), "--", text + "x"}).text);
  EXPECT_EQ(made["status"], "new");
  EXPECT_EQ(made["exists"], false);
}

// A copy of a disk: "Folder/a:b/Mix", and hostile items beside it.
class ACopiedDisk : public testing::Test {
 protected:
  ACopiedDisk() : mCopy(mFolder.Path() / "copy") {
    std::filesystem::create_directories(mCopy / "Folder \xC3\xA9" / "a:b");
    for (const char* const name : {"Folder \xC3\xA9/a:b/Mix", "top", ":lost", ":lost:item"}) {
      std::ofstream(mCopy / name) << name;
    }
    std::ofstream(mFolder.Path() / "outside") << "x";
    std::filesystem::create_symlink(mFolder.Path(), mCopy / "out");
  }

  json Posix(const std::string& hfsPath) const {
    const Output output =
        Cli({"posix", "--json", "--map", "Old Disk=" + mCopy.string(), "--", hfsPath});
    return json::parse(output.text);
  }
  std::string StatusOf(const std::string& hfsPath) const { return Posix(hfsPath)["status"]; }

  TemporaryFolder mFolder;
  std::filesystem::path mCopy;
};

TEST_F(ACopiedDisk, HasTheItemsOfItsHFSPaths) {
  const json found = Posix("Old Disk:Folder \xC3\xA9:a/b:Mix");
  EXPECT_EQ(found["path"], (mCopy / "Folder \xC3\xA9" / "a:b" / "Mix").string());
  EXPECT_EQ(found["by"], "map");
  EXPECT_EQ(found["exists"], true);
  EXPECT_EQ(Posix("Old Disk:top")["path"], (mCopy / "top").string());
  EXPECT_EQ(Posix("Old Disk:Folder \xC3\xA9:")["path"], (mCopy / "Folder \xC3\xA9").string());
  EXPECT_EQ(Posix("Old Disk:/lost/item")["path"], (mCopy / ":lost:item").string());
  for (const char* const itself : {"Old Disk", "Old Disk:"}) {
    EXPECT_EQ(Posix(itself)["path"], mCopy.string());
  }
}

TEST_F(ACopiedDisk, TellsWhatItLacks) {
  const std::string folder = mCopy / "Folder \xC3\xA9";
  const json made = Posix("Old Disk:Folder \xC3\xA9:none");
  EXPECT_EQ(made["status"], "new");
  EXPECT_EQ(made["path"], folder + "/none");
  EXPECT_EQ(made["exists"], false);
  EXPECT_EQ(made["by"], "map");
  const auto errorOf = [this](const std::string& hfsPath) {
    const json missing = Posix(hfsPath);
    EXPECT_EQ(missing["status"], "nothing");
    EXPECT_EQ(missing["exists"], false);
    return std::string(missing["error"]);
  };
  const std::string none = "there is no folder \"" + mCopy.string();
  EXPECT_EQ(errorOf("Old Disk:no folder:none"), none + "/no folder\"");
  EXPECT_EQ(errorOf("Old Disk:no folder:no other:none"), none + "/no folder\"");
  EXPECT_EQ(errorOf("Old Disk:no folder:"), none + "/no folder\"");
  EXPECT_EQ(errorOf("Old Disk:top:"), none + "/top\"");
  EXPECT_EQ(errorOf("Old Disk:top:none"), none + "/top\"");
  // Linux files with these names are called otherwise in HFS terms.
  EXPECT_EQ(Posix("Old Disk:lost")["status"], "new");
  EXPECT_EQ(Posix("Old Disk:lost:item")["status"], "nothing");
}

TEST_F(ACopiedDisk, RefusesWhatNoItemCanBeCalled) {
  EXPECT_EQ(Posix("Old Disk:..")["error"], "no item has the HFS name \"..\"");
  EXPECT_EQ(StatusOf("Old Disk:" + std::string(63, 'x')), "new");
  const json tooLong = Posix("Old Disk:" + std::string(64, 'x'));
  EXPECT_EQ(tooLong["status"], "invalid");
  EXPECT_EQ(tooLong["error"], "no new item can keep the HFS name \"" + std::string(64, 'x') + "\"");
  EXPECT_EQ(StatusOf("Old Disk:" + std::string(256, 'x')), "invalid");
}

TEST_F(ACopiedDisk, WithExistingHasNoNewItems) {
  const Output output = Cli({"posix", "--existing", "--map", "Old Disk=" + mCopy.string(),
                             "Old Disk:none", "Old Disk:top"});
  EXPECT_EQ(output.status, 1);
  EXPECT_EQ(output.text, "\n" + (mCopy / "top").string() + "\n");
  const json made = json::parse(
      Cli({"posix", "--existing", "--json", "--map", "Old Disk=" + mCopy.string(), "Old Disk:none"})
          .text);
  EXPECT_EQ(made["status"], "new");
  EXPECT_EQ(made["exists"], false);
  EXPECT_FALSE(made.contains("path"));
}

TEST_F(ACopiedDisk, ThatMayNotBeLookedAtIsRefused) {
  if (geteuid() != 0) GTEST_SKIP() << "becoming another user is not permitted here";
  std::filesystem::permissions(mFolder.Path(), std::filesystem::perms(0755));
  std::filesystem::create_directories(mCopy / "closed");
  std::ofstream(mCopy / "closed" / "file") << "x";
  std::filesystem::permissions(mCopy / "closed", std::filesystem::perms(0700));
  const auto statusOf = [this](const std::string& hfsPath) {
    ChildProgram cli("/usr/bin/setpriv",
                     {"--reuid=65534", "--regid=65534", "--clear-groups", TALLOWMERE_CLI, "posix",
                      "--json", "--map", "Old Disk=" + mCopy.string(), hfsPath});
    return std::string(json::parse(cli.ReadToEnd())["status"]);
  };
  EXPECT_EQ(statusOf("Old Disk:closed:file"), "refused");
  EXPECT_EQ(statusOf("Old Disk:closed:\xC3\xA9"), "refused");
  EXPECT_EQ(statusOf("Old Disk:closed:"), "found");
  // To find a name as it is, a folder need not be read.
  std::filesystem::permissions(mCopy / "closed", std::filesystem::perms(0711));
  EXPECT_EQ(statusOf("Old Disk:closed:file"), "found");
  EXPECT_EQ(statusOf("Old Disk:closed:none"), "new");
  EXPECT_EQ(statusOf("Old Disk:closed:\xC3\xA9"), "refused");
}

TEST_F(ACopiedDisk, HasAccentedNamesInEitherForm) {
  std::ofstream(mCopy / "re\xCC\x81sum\xC3\xA9") << "x";
  EXPECT_EQ(Posix("Old Disk:r\xC3\xA9sum\xC3\xA9")["path"],
            (mCopy / "re\xCC\x81sum\xC3\xA9").string());
  std::ofstream(mCopy / "r\xC3\xA9sume\xCC\x81") << "y";
  EXPECT_EQ(StatusOf("Old Disk:r\xC3\xA9sum\xC3\xA9"), "ambiguous");
}

// As a classic volume shows them that is mounted without a code page.
TEST_F(ACopiedDisk, HasNamesInMacRomanBytes) {
  std::ofstream(mCopy / "caf\x8E") << "x";
  const json found = Posix("Old Disk:caf\xC3\xA9");
  EXPECT_EQ(found["status"], "found");
  EXPECT_TRUE(found["path_hex"].get<std::string>().ends_with("6361668e"));
}

TEST_F(ACopiedDisk, IsNotLeft) {
  EXPECT_EQ(StatusOf("Old Disk:out:outside"), "nothing");
  EXPECT_EQ(Posix("Old Disk:out:outside")["error"],
            "\"" + (mCopy / "out").string() + "\" is a link, which is not followed in a copy");
  EXPECT_EQ(StatusOf("Old Disk:out"), "found");
  EXPECT_EQ(StatusOf("Old Disk::outside"), "invalid");
  EXPECT_EQ(StatusOf("Old Disk:Folder \xC3\xA9:::outside"), "invalid");
}

TEST_F(ACopiedDisk, LeavesOtherVolumesAsTheyAre) {
  const std::string root = Lines(Cli({"hfs", "/etc"}).text).at(0);
  const json found = Posix(root);
  EXPECT_EQ(found["path"], "/etc");
  EXPECT_EQ(found["by"], "path");
}

TEST_F(ACopiedDisk, MayBeToldInATable) {
  const std::string table = mFolder.Path() / "table";
  std::ofstream(table) << "Old Disk=" << mCopy.string() << '\n';
  EXPECT_EQ(Cli({"posix", "--volumes", table, "Old Disk:top"}).text,
            (mCopy / "top").string() + "\n");
}

// The other lines may be of other disks, and for other commands.
TEST_F(ACopiedDisk, ThatATableTellsWronglyFailsAlone) {
  const std::string table = mFolder.Path() / "table";
  std::ofstream(table) << "-3=Some Volume\nOld Disk=" << mCopy.string() << "\nGone=/nonexistent\n";
  const Output output = Cli({"posix", "--volumes", table, "Gone:top", "Old Disk:top"});
  EXPECT_EQ(output.text, "\n" + (mCopy / "top").string() + "\n");
  EXPECT_EQ(output.errors, "tallowmere-cli: Gone:top: there is no folder \"/nonexistent\"\n");
}

TEST_F(ACopiedDisk, ThatIsNoFolderIsRefused) {
  EXPECT_THAT(Cli({"posix", "--map", "Old Disk=/nonexistent", "x:y"}).errors,
              HasSubstr("there is no folder \"/nonexistent\""));
  const Output noMap = Cli({"posix", "--map", "Old Disk", "x:y"});
  EXPECT_THAT(noMap.errors, HasSubstr("\"Old Disk\" is no OLD-NAME=FOLDER"));
  EXPECT_EQ(noMap.status, 2);
  EXPECT_THAT(Cli({"posix", "--map", "A=/", "--map", "A=/etc", "x:y"}).errors,
              HasSubstr("\"A\" has two places"));
}

}  // namespace
}  // namespace tallowmere::test
