// Every item of a folder comes back by its record, asked of one service, from another.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstring>
#include <fstream>
#include <iomanip>
#include <sstream>
#include <utility>

#include "support/ChildProgram.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"
#include "support/Wire.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"

namespace tallowmere::test {
namespace {

using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

constexpr int kPlainUser = 65534;

struct CensusResult {
  int status;
  std::string text;
};

CensusResult CensusOf(const std::string& folder, std::vector<std::string> options = {}) {
  options.insert(options.end(), {"census", folder});
  ChildProgram cli(TALLOWMERE_CLI, options);
  std::string text = cli.ReadToEnd();
  return {cli.Wait(), std::move(text)};
}

CensusResult AsPlainUser(std::vector<std::string> arguments) {
  arguments.insert(arguments.begin(),
                   {"--reuid", std::to_string(kPlainUser), "--clear-groups", "--", TALLOWMERE_CLI});
  ChildProgram cli("setpriv", arguments);
  std::string text = cli.ReadToEnd();
  return {cli.Wait(), std::move(text)};
}

std::string Figures(int items) {
  const std::string count = std::to_string(items);
  return count + " items, " + count + " came back, 0 did not, 0 vanished meanwhile, 0 left out\n";
}

// A folder in which every item that is made has to come back.
class CensusOfHostileFolder : public testing::Test {
 protected:
  void TearDown() override {
    if (IsSkipped()) return;
    const CensusResult result = CensusOf(mFolder.Path());
    EXPECT_EQ(result.text, Figures(mItems));
    EXPECT_EQ(result.status, 0);
    if (geteuid() != 0 || HasFailure()) return;
    // Once more without the privilege to find an item by its number.
    ASSERT_EQ(chmod(mFolder.Path().c_str(), 0755), 0);
    if (AsPlainUser({"serve-check"}).status != 0) return;  // the programs are out of its reach
    EXPECT_EQ(AsPlainUser({"census", mFolder.Path()}).text, Figures(mItems));
  }

  std::string PathOf(const std::string& name) { return mFolder.Path() / name; }

  void Make(const std::string& name) {
    const int file = open(PathOf(name).c_str(), O_CREAT | O_EXCL | O_WRONLY | O_CLOEXEC, 0644);
    if (file < 0 && errno == EEXIST) return;
    ASSERT_GE(file, 0) << name << ": " << std::strerror(errno);
    close(file);
    ++mItems;
  }

  void MakeFolder(const std::string& name) {
    ASSERT_EQ(mkdir(PathOf(name).c_str(), 0755), 0);
    ++mItems;
  }

  unsigned NumberOf(const std::string& name) {
    struct stat status {};
    EXPECT_EQ(lstat(PathOf(name).c_str(), &status), 0);
    return static_cast<unsigned>(status.st_ino);
  }

  TemporaryFolder mFolder;
  int mItems = 1;  // the folder itself
};

// All letters that Mac Roman has beyond ASCII.
std::vector<std::u16string> Letters() {
  std::vector<std::u16string> letters;
  for (int byte = 0x80; byte <= 0xFF; ++byte) {
    letters.push_back(text::DecodeMacRoman(std::string(1, static_cast<char>(byte))));
  }
  return letters;
}

std::string Bytes(const std::u16string& text) {
  return text::FileNameOfText(text).value_or("");
}

TEST_F(CensusOfHostileFolder, EveryKindOfItem) {
  Make("file");
  MakeFolder("folder");
  for (const char* const target :
       {"file", "folder", "/", "nowhere", "link to link to itself", "."}) {
    const std::string name = std::string("link to ") + (*target == '/' ? "root" : target);
    ASSERT_EQ(symlink(target, PathOf(name).c_str()), 0);
    ++mItems;
  }
  ASSERT_EQ(mkfifo(PathOf("pipe").c_str(), 0600), 0);
  ++mItems;
  const int listener = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  PathOf("socket").copy(address.sun_path, sizeof address.sun_path - 1);
  ASSERT_EQ(bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
  close(listener);
  ++mItems;
  if (mknod(PathOf("device").c_str(), S_IFCHR | 0600, makedev(1, 3)) == 0) ++mItems;
}

TEST_F(CensusOfHostileFolder, NamesOf1To255Bytes) {
  for (std::size_t length = 1; length <= 255; ++length) Make(std::string(length, 'n'));
}

TEST_F(CensusOfHostileFolder, LongNamesWithExtensionsOfEveryKind) {
  const std::string stem(80, 'e');
  for (const char* const extension :
       {".", ".a", ".aif", ".12345", ".123456", ".a#b", ".#", ".#1F", ".\xC3\xA9", ".e\xCC\x81",
        ".\xE6\x97\xA5", ".\xFF", ".:", ".\n", "..", ".tar.gz"}) {
    Make(stem + extension);
  }
  Make("." + stem);
  Make("\xE6\x97\xA5.");
}

TEST_F(CensusOfHostileFolder, NamesOfEverySingleByteAndPairOfBytesOutsideAscii) {
  for (int byte = 1; byte <= 255; ++byte) {
    if (byte == '/' || byte == '.') continue;
    Make(std::string(1, static_cast<char>(byte)));
  }
  for (int first = 0x80; first <= 0xFF; first += 3) {
    for (int second = 0x80; second <= 0xFF; second += 5) {
      Make({static_cast<char>(first), static_cast<char>(second)});
    }
  }
}

TEST_F(CensusOfHostileFolder, EveryMacRomanLetterPrecomposed) {
  for (const std::u16string& letter : Letters()) Make(Bytes(letter));
}

TEST_F(CensusOfHostileFolder, EveryMacRomanLetterDecomposed) {
  for (const std::u16string& letter : Letters()) {
    Make(Bytes(text::DecomposeMacRoman(letter)));
  }
}

TEST_F(CensusOfHostileFolder, EveryMacRomanLetterInBothNormalFormsSideBySide) {
  for (const std::u16string& letter : Letters()) {
    const std::string precomposed = Bytes(letter);
    const std::string decomposed = Bytes(text::DecomposeMacRoman(letter));
    Make(precomposed);
    Make(decomposed);
    Make(precomposed + decomposed);
    Make(decomposed + precomposed);
  }
}

TEST_F(CensusOfHostileFolder, LongAccentedNamesInBothNormalFormsSideBySide) {
  for (const std::size_t count : {10U, 31U, 32U, 63U, 64U, 80U}) {
    std::string precomposed;
    std::string decomposed;
    for (std::size_t i = 0; i < count; ++i) {
      precomposed += "\xC3\xA9";
      decomposed += "e\xCC\x81";
    }
    Make(precomposed);
    Make(decomposed);
  }
}

TEST_F(CensusOfHostileFolder, ColonsAndControlCharacters) {
  for (const char* const name :
       {":",    "::",      ":a",    "a:", "a:b", ".:",    ":.", "..:",  ":..",
        "...",  "~",       "~root", "%",  "%2F", "%00",   "\n", "a\nb", "\t",
        "\r\n", "\x1B[2J", "\x7F",  " ",  "  ",  "a ",    " a", "-",    "--help",
        "#",    "##",      "?",     "*",  "\\",  "C:\\a", "\"", "'",    "file:a"}) {
    Make(name);
  }
}

TEST_F(CensusOfHostileFolder, NamesThatAreNotUtf8) {
  for (const char* const name :
       {"\x80", "\xFF", "\xC3", "\xC3(", "\xE2\x82", "\xED\xB2\x80", "\xED\xA0\x80\xED\xB0\x80",
        "\xF4\x90\x80\x80", "\xC0\xAF", "\xC0\x80", "a\xFF.txt", "\xFF\xFE", "e\xCC"}) {
    Make(name);
    Make(name + std::string(70, 'x'));
    Make(std::string(70, 'x') + name);
  }
}

TEST_F(CensusOfHostileFolder, NamesOutsideMacRoman) {
  for (const char* const name :
       {"\xE6\x97\xA5\xE6\x9C\xAC", "\xF0\x9F\x8E\xB5.aif", "\xF0\x9F\x8E\xB6.aif", "\xE2\x82\xAC",
        "\xEF\xA3\xBF", "\xC2\xA0", "\xC2\xA4", "\xE2\x84\xA6", "\xCE\xA9", "\xE2\x84\xAB",
        "\xC3\x85", "A\xCC\x8A", "\xEF\xBF\xBD", "\xEF\xBB\xBF"}) {
    Make(name);
  }
}

TEST_F(CensusOfHostileFolder, NamesThatDifferOnlyBeyondByte63) {
  const std::string same(63, 's');
  for (int i = 0; i < 100; ++i) Make(same + std::to_string(i));
  for (int i = 0; i < 100; ++i) Make(same + std::to_string(i) + ".aif");
}

TEST_F(CensusOfHostileFolder, NamesThatLookLikeShortForms) {
  for (const char* const name :
       {"a#1", "a#1F", "a##1F", "#2", "a#FFFFFFFF", "a#100000000", "a#0", "a#01", "a#1f", "a#.aif",
        "a#1F.aif", "a#1F.", "?#10", "?#10.aif"}) {
    Make(name);
  }
}

TEST_F(CensusOfHostileFolder, ANameThatIsTheShortFormOfAnotherItem) {
  const auto shortForm = [this](const std::string& name, const std::string& marks) {
    std::ostringstream tail;
    tail << marks << std::uppercase << std::hex << NumberOf(name);
    return name.substr(0, 31 - tail.str().size()) + tail.str();
  };
  const std::string once(70, 'o');
  const std::string threeTimes(70, 't');
  Make(once);
  Make(threeTimes);
  Make(shortForm(once, "#"));
  for (const char* const marks : {"#", "##", "###"}) Make(shortForm(threeTimes, marks));
}

TEST_F(CensusOfHostileFolder, SeveralNamesOfOneItem) {
  const std::string same(63, 's');
  Make(same + "first");
  for (const char* const name : {"second", "third.aif", "fourth.aif"}) {
    ASSERT_EQ(link(PathOf(same + "first").c_str(), PathOf(same + name).c_str()), 0);
    ++mItems;
  }
}

TEST_F(CensusOfHostileFolder, AChain200FoldersDeep) {
  std::string path;
  for (int depth = 0; depth < 200; ++depth) {
    path += (depth == 0 ? "" : "/") + std::string("n\xC3\xA9:") + std::to_string(depth);
    MakeFolder(path);
  }
  Make(path + "/file");
}

TEST_F(CensusOfHostileFolder, LongFolderNames) {
  std::string path;
  for (int depth = 0; depth < 12; ++depth) {
    path += (depth == 0 ? "" : "/") + std::string(250, 'd') + std::to_string(depth);
    MakeFolder(path);
    Make(path + "/file");
  }
}

// --- What it says
// ---------------------------------------------------------------------------------

TEST(Census, LeavesOutInterfacesOfTheKernelAndSaysSo) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string place = folder.MakeFolder("processes").string();
  const ScopedMount processes("none", place, "proc");
  if (!processes.IsMounted()) GTEST_SKIP() << "proc cannot be mounted here";
  const CensusResult result = CensusOf(folder.Path());
  EXPECT_EQ(result.text, place +
                             ": left out, an interface of the kernel\n"
                             "2 items, 2 came back, 0 did not, 0 vanished meanwhile, 1 left out\n");
  EXPECT_EQ(result.status, 0);
}

TEST(Census, GoesIntoOtherVolumes) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string place = folder.MakeFolder("Volume").string();
  const ScopedMount volume("none", place, "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  folder.MakeFile("Volume/" + std::string(70, 'v'));
  folder.MakeFolder("Volume/folder");
  folder.MakeFile("Volume/folder/file");
  EXPECT_EQ(CensusOf(folder.Path()).text, Figures(5));
}

TEST(Census, TakesARelativeFolderAndALinkToOne) {
  const TemporaryFolder folder;
  folder.MakeFolder("real");
  folder.MakeFile("real/file");
  folder.MakeLink("link", "real");
  EXPECT_EQ(CensusOf(folder.Path() / "link").text, Figures(2));
  EXPECT_EQ(CensusOf(std::filesystem::relative(folder.Path() / "real")).text, Figures(2));
}

// A request that an impostor answers, and its answer: protocol bytes.
struct Exchange {
  std::string request;
  std::string answer;
  std::string removed;  // a file that is gone before the answer; none when it is empty
};

std::string InHexadecimal(std::string_view bytes) {
  std::ostringstream text;
  text << std::hex << std::setfill('0');
  for (const char byte : bytes) {
    text << std::setw(2) << static_cast<unsigned>(static_cast<unsigned char>(byte));
  }
  return text.str();
}

// The path of a script that takes the place of each service, and knows these requests.
std::string Impostor(const TemporaryFolder& folder, std::vector<Exchange> exchanges) {
  // By which one service more is tried.
  exchanges.push_back({VolumeNameRequest(0), VolumeNameResponse("Root"), ""});
  std::string script = "#!/usr/bin/python3\nimport os\nknown = {\n";
  for (const auto& [request, answer, removed] : exchanges) {
    script += "  '" + InHexadecimal(request) + "': ('" + InHexadecimal(answer) + "', '" +
              InHexadecimal(removed) + "'),\n";
  }
  script +=
      "}\n"
      "sizes = {len(request) for request in known}\n"
      "asked = ''\n"
      "while piece := os.read(0, 65536):\n"
      "  asked += piece.hex()\n"
      "  while request := next((asked[:n] for n in sizes if asked[:n] in known), None):\n"
      "    answer, removed = map(bytes.fromhex, known[request])\n"
      "    if removed: os.unlink(removed)\n"
      "    os.write(1, answer)\n"
      "    asked = asked[len(request):]\n";
  std::string path = folder.MakeFile("impostor", script).string();
  chmod(path.c_str(), 0755);
  return path;
}

Exchange NoRecordOf(const std::string& path, const std::string& removed = "") {
  return {RecordRequest(path), RecordResponse(0, kEmptyRecord), removed};
}
Exchange RecordOf(const std::string& path, const std::string& name = "a") {
  return {RecordRequest(path), RecordResponse(1, Record(-1, 2, name)), ""};
}
Exchange RecordIn(const std::string& folder) {
  return RecordOf(folder + "/any");
}
Exchange PathIs(const std::string& path, const std::string& name = "a") {
  return {PathOfRecordRequest(Record(-1, 2, name), 0, 0), PathResponse(path), ""};
}
const Exchange kNoPath{PathOfRecordRequest(Record(-1, 2, "a"), 0, 0), kNoPathResponse, ""};

TEST(Census, AnItemWithoutARecordIsSaidInOctalAndIsStatus1) {
  const TemporaryFolder folder;
  const std::string path = folder.MakeFolder("a\nb").string();
  const std::string service = Impostor(folder, {NoRecordOf(path), RecordIn(path)});
  const CensusResult result = CensusOf(path, {"--service", service});
  EXPECT_THAT(result.text, HasSubstr("/a\\012b: has no record\n"
                                     "1 items, 0 came back, 1 did not, 0 vanished"));
  EXPECT_EQ(result.status, 1);
}

TEST(Census, AnItemThatComesBackAsAnotherIsSaidAndIsStatus1) {
  const TemporaryFolder folder;
  const std::string path = folder.MakeFolder("asked").string();
  const std::string service = Impostor(folder, {RecordOf(path), RecordIn(path), PathIs("/")});
  const CensusResult result = CensusOf(path, {"--service", service});
  EXPECT_THAT(result.text, StartsWith(path + ": came back as /\n"));
  EXPECT_EQ(result.status, 1);
}

TEST(Census, ARecordThatLeadsNowhereIsSaidAndIsStatus1) {
  const TemporaryFolder folder;
  const std::string path = folder.MakeFolder("asked").string();
  const std::string service = Impostor(folder, {RecordOf(path), RecordIn(path), kNoPath});
  const CensusResult result = CensusOf(path, {"--service", service});
  EXPECT_THAT(result.text, StartsWith(path + ": its record leads nowhere\n"));
  EXPECT_EQ(result.status, 1);
}

// The census of a folder that comes back, and of the item "a" in it, which comes back as `other`.
CensusResult CensusWith(const TemporaryFolder& folder, const std::string& asked,
                        const std::string& other) {
  return CensusOf(asked, {"--service", Impostor(folder, {RecordOf(asked, "asked"), RecordIn(asked),
                                                         RecordOf(asked + "/a"),
                                                         PathIs(asked, "asked"), PathIs(other)})});
}

TEST(Census, IsStatus1WhereSomeItemsComeBackAndOthersDoNot) {
  const TemporaryFolder folder;
  const std::string asked = folder.MakeFolder("asked");
  folder.MakeFile("asked/a");
  const CensusResult result = CensusWith(folder, asked, "/");
  EXPECT_EQ(result.text, asked + "/a: came back as /\n" +
                             "2 items, 1 came back, 1 did not, 0 vanished meanwhile, 0 left out\n");
  EXPECT_EQ(result.status, 1);
}

// Enough items for several services.
TEST(Census, TellsWhatDidNotComeBackInTheOrderOfTheWalk) {
  const TemporaryFolder folder;
  const std::string asked = folder.MakeFolder("asked");
  for (int i = 0; i < 3000; ++i) folder.MakeFile("asked/" + std::to_string(i));
  std::string lost;
  std::vector<Exchange> exchanges{RecordIn(asked)};
  ChildProgram find("find", {asked});
  std::istringstream items(find.ReadToEnd());
  int count = 0;
  for (std::string item; std::getline(items, item);) {
    const std::string number = std::to_string(++count);
    if (number.ends_with("00")) {
      lost += item + ": has no record\n";
      exchanges.push_back(NoRecordOf(item));
    } else {
      exchanges.push_back(RecordOf(item, number));
      exchanges.push_back(PathIs(item, number));
    }
  }
  const CensusResult result = CensusOf(asked, {"--service", Impostor(folder, exchanges)});
  EXPECT_EQ(result.text,
            lost + "3001 items, 2971 came back, 30 did not, 0 vanished meanwhile, 0 left out\n");
}

TEST(Census, AnItemComesBackUnderItsOtherName) {
  const TemporaryFolder folder;
  const std::string asked = folder.MakeFolder("asked");
  std::filesystem::create_hard_link(folder.MakeFile("other"), asked + "/a");
  const CensusResult result = CensusWith(folder, asked, folder.Path() / "other");
  EXPECT_EQ(result.text, Figures(2));
  EXPECT_EQ(result.status, 0);
}

TEST(Census, AnotherPlaceIsAnotherItemWhereNumbersDoNotTellItemsApart) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string asked = folder.MakeFolder("tree/asked");
  std::filesystem::create_hard_link(folder.MakeFile("tree/other"), asked + "/a");
  const std::string mount = folder.MakeFolder("mount");
  ChildProgram bindfs("bindfs", {"-f", folder.Path() / "tree", mount});
  for (int i = 0; i < 500 && !std::filesystem::exists(mount + "/asked"); ++i) usleep(10'000);
  if (!std::filesystem::exists(mount + "/asked")) GTEST_SKIP() << "there is no bindfs here";
  const CensusResult result = CensusWith(folder, mount + "/asked", mount + "/other");
  umount(mount.c_str());
  EXPECT_THAT(result.text, StartsWith(mount + "/asked/a: came back as " + mount + "/other\n"));
  EXPECT_EQ(result.status, 1);
}

TEST(Census, WhatVanishesMeanwhileDoesNotCount) {
  const TemporaryFolder folder;
  const std::string path = folder.MakeFolder("asked").string();
  const std::string victim = folder.MakeFile("asked/victim").string();
  const std::string service =
      Impostor(folder, {NoRecordOf(path), RecordIn(path), NoRecordOf(victim, victim)});
  const CensusResult result = CensusOf(path, {"--service", service});
  EXPECT_THAT(result.text, Not(HasSubstr("victim")));
  EXPECT_THAT(result.text,
              EndsWith("2 items, 0 came back, 1 did not, 1 vanished meanwhile, 0 left out\n"));
  std::ofstream(victim).flush();
  ChildProgram json(TALLOWMERE_CLI, {"--service", service, "census", "--json", path});
  EXPECT_THAT(json.ReadToEnd(), EndsWith("{\"items\":2,\"came_back\":0,\"missing\":1,"
                                         "\"vanished\":1,\"left_out\":0}\n"));
}

TEST(Census, LeavesOutAFolderThatCanBeReadOnlyInPart) {
  const TemporaryFolder folder;
  for (int i = 0; i < 10; ++i) folder.MakeFile(std::to_string(i));
  ChildProgram cli(
      "env", {"ASAN_OPTIONS=verify_asan_link_order=0", "TALLOWMERE_FAILING_ENTRY=6",
              "LD_PRELOAD=" TALLOWMERE_FAULTY_INPUT, TALLOWMERE_CLI, "census", folder.Path()});
  EXPECT_EQ(cli.ReadToEnd(),
            folder.Path().string() +
                ": left out, Input/output error\n"
                "1 items, 1 came back, 0 did not, 0 vanished meanwhile, 1 left out\n");
  EXPECT_EQ(cli.Wait(), 0);
}

TEST(Census, AServiceThatEndsIsStatus1AndOneSentence) {
  const TemporaryFolder folder;
  ChildProgram cli(TALLOWMERE_CLI, {"--service", "/bin/true", "census", folder.Path()});
  EXPECT_EQ(cli.ReadErrorsToEnd(), "tallowmere-cli: the service ended before it answered\n");
  EXPECT_EQ(cli.Wait(), 1);
}

TEST(Census, AFolderThatIsNoneIsWrongUsage) {
  EXPECT_EQ(CensusOf("/nonexistent/folder").status, 2);
  EXPECT_EQ(CensusOf("/dev/null").status, 2);
}

}  // namespace
}  // namespace tallowmere::test
