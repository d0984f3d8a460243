// Records and HFS paths as other machines stored them: byte order, packed files, volumes that have
// other numbers or were copied.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <tallowmere/Types.h>

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
  EXPECT_THAT(Cli({"path", "99:2:x"}).errors, testing::Not(HasSubstr("byte order")));
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
    EXPECT_THAT(output.errors, HasSubstr("are no record of 70"));
    EXPECT_EQ(output.text, "");
  }
  EXPECT_THAT(Cli({"path", "--packed", "--skip", "9", Write("packed", "x")}).errors,
              HasSubstr("fewer bytes than are to be skipped"));
  EXPECT_THAT(Cli({"path", "--packed", mFolder.Path().string()}).errors,
              HasSubstr("Is a directory"));
  EXPECT_EQ(Cli({"path", "--packed", "--stride", "69", "x"}).status, 2);
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
  const json missing = Posix("Old Disk:Folder \xC3\xA9:none");
  EXPECT_EQ(missing["status"], "nothing");
  EXPECT_EQ(missing["exists"], false);
  EXPECT_EQ(StatusOf("Old Disk:no folder:none"), "nothing");
  // As names of Linux these are other files.
  EXPECT_EQ(StatusOf("Old Disk:lost"), "nothing");
  EXPECT_EQ(StatusOf("Old Disk:lost:item"), "nothing");
}

TEST_F(ACopiedDisk, HasAccentedNamesInEitherForm) {
  std::ofstream(mCopy / "re\xCC\x81sum\xC3\xA9") << "x";
  EXPECT_EQ(Posix("Old Disk:r\xC3\xA9sum\xC3\xA9")["path"],
            (mCopy / "re\xCC\x81sum\xC3\xA9").string());
  std::ofstream(mCopy / "r\xC3\xA9sume\xCC\x81") << "y";
  EXPECT_EQ(StatusOf("Old Disk:r\xC3\xA9sum\xC3\xA9"), "ambiguous");
}

TEST_F(ACopiedDisk, IsNotLeft) {
  EXPECT_EQ(StatusOf("Old Disk:out:outside"), "nothing");
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

TEST_F(ACopiedDisk, ThatIsNoFolderIsRefused) {
  EXPECT_THAT(Cli({"posix", "--map", "Old Disk=/nonexistent", "x:y"}).errors,
              HasSubstr("there is no folder \"/nonexistent\""));
  EXPECT_THAT(Cli({"posix", "--map", "Old Disk", "x:y"}).errors,
              HasSubstr("is no OLD-NAME=FOLDER"));
  EXPECT_THAT(Cli({"posix", "--map", "A=/", "--map", "A=/etc", "x:y"}).errors,
              HasSubstr("\"A\" has two places"));
}

}  // namespace
}  // namespace tallowmere::test
