// The HFS names of items in a folder, and the items that such names find.
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstring>
#include <filesystem>
#include <set>
#include <vector>

#include "kernel/Descriptor.h"
#include "names/HFSNames.h"
#include "platform/HostCalls.h"
#include "support/OwnMountNamespace.h"
#include "support/Privileges.h"
#include "support/RefusedCalls.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using kernel::Descriptor;
using names::ShortHFSName;
using names::SpellHFSName;

const std::string kComposed = "caf\xC3\xA9";
const std::string kDecomposed = "cafe\xCC\x81";
const std::string kHFSForm = "caf\x8E";

class NamesInAFolder : public testing::Test {
 protected:
  void SetUp() override { mInfo = InfoOf(mFolder.Path().string()); }

  std::string Make(const std::string& name) const {
    const std::string path = PathTo(name);
    const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644);
    EXPECT_GE(file, 0) << name << ": " << std::strerror(errno);
    close(file);
    return path;
  }
  std::string PathTo(const std::string& name) const { return mFolder.Path().string() + "/" + name; }

  FSSpec Record(std::string_view name) const {
    return MakeRecord(mInfo.volume, mInfo.nodeID, name);
  }
  // Returns the path that an HFS name finds in the folder, or the result code in brackets.
  std::string LookUp(std::string_view name) const { return ItemOf(Record(name)); }

  std::string HFSName(const std::string& name) const { return NameOf(SpecOf(PathTo(name))); }

  void ExpectRoundTrip(const std::string& name) const {
    EXPECT_EQ(LookUp(HFSName(name)), PathTo(name)) << HFSName(name);
  }

  TemporaryFolder mFolder;
  FSCatalogInfo mInfo{};
};

std::string Hexadecimal(std::uint32_t id) {
  char text[9];
  std::snprintf(text, sizeof text, "%X", id);
  return text;
}

TEST_F(NamesInAFolder, APlainNameIsItsOwnHFSName) {
  Make("a file.txt");
  EXPECT_EQ(HFSName("a file.txt"), "a file.txt");
  ExpectRoundTrip("a file.txt");
}

TEST_F(NamesInAFolder, ColonsAndSlashesAreExchanged) {
  Make("a:b");
  EXPECT_EQ(HFSName("a:b"), "a/b");
  ExpectRoundTrip("a:b");
}

TEST_F(NamesInAFolder, CaseMatters) {
  Make("Name");
  EXPECT_EQ(LookUp("name"), "(-43)");
  Make("name");
  ExpectRoundTrip("Name");
  ExpectRoundTrip("name");
}

TEST_F(NamesInAFolder, AnAccentedNameIsFoundInEitherForm) {
  Make(kDecomposed);
  EXPECT_EQ(HFSName(kDecomposed), kHFSForm);
  ExpectRoundTrip(kDecomposed);
}

TEST_F(NamesInAFolder, ThePrecomposedNameCountsFirstAndTheOtherGetsAShortForm) {
  Make(kComposed);
  Make(kDecomposed);
  EXPECT_EQ(HFSName(kComposed), kHFSForm);
  EXPECT_EQ(HFSName(kDecomposed), kHFSForm + "#" + Hexadecimal(IDOf(PathTo(kDecomposed))));
  ExpectRoundTrip(kComposed);
  ExpectRoundTrip(kDecomposed);
}

TEST_F(NamesInAFolder, ANameOfMixedFormsIsFoundWhenItIsTheOnlyOne) {
  Make(
      "\xC3\xA9"
      "e\xCC\x81");
  EXPECT_EQ(LookUp("\x8E\x8E"), PathTo("\xC3\xA9"
                                       "e\xCC\x81"));
  EXPECT_EQ(HFSName("\xC3\xA9"
                    "e\xCC\x81"),
            "\x8E\x8E");
}

TEST_F(NamesInAFolder, ANameOfMixedFormsIsFoundThoughItIsTooLongWithAllItsAccentsApart) {
  std::string name = "e\xCC\x81";
  for (int letter = 1; letter < 120; ++letter) name += "\xC3\xA9";
  Make(name);
  FSSpec spec{};
  ASSERT_EQ(FSMakeFSSpec(mInfo.volume, static_cast<SInt32>(mInfo.nodeID),
                         Str255Of(std::string(120, '\x8E')).bytes, &spec),
            noErr);
  EXPECT_EQ(ItemOf(spec), PathTo(name));
}

TEST_F(NamesInAFolder, TwoNamesOfMixedFormsAreNotFoundByTheirCommonForm) {
  const std::string first =
      "\xC3\xA9"
      "e\xCC\x81";
  const std::string second = "e\xCC\x81\xC3\xA9";
  Make(first);
  Make(second);
  EXPECT_EQ(LookUp("\x8E\x8E"), "(-43)");
  ExpectRoundTrip(first);
  ExpectRoundTrip(second);
}

TEST_F(NamesInAFolder, AllFormsOfANameSideBySideSurviveARoundTrip) {
  const std::vector<std::string> forms{"\xC3\xA9\xC3\xA9",
                                       "e\xCC\x81"
                                       "e\xCC\x81",
                                       "\xC3\xA9"
                                       "e\xCC\x81",
                                       "e\xCC\x81\xC3\xA9"};
  for (const std::string& name : forms) Make(name);
  for (const std::string& name : forms) ExpectRoundTrip(name);
}

TEST_F(NamesInAFolder, EveryByteSurvivesARoundTripInEitherNormalForm) {
  for (int byte = 1; byte < 256; ++byte) {
    const auto names = SpellHFSName("x" + std::string(1, static_cast<char>(byte)));
    for (const std::string& name : {names.precomposed, names.decomposed}) {
      if (name.empty()) continue;
      Make(name);
      ExpectRoundTrip(name);
      std::filesystem::remove(PathTo(name));
    }
  }
}

TEST_F(NamesInAFolder, EveryByteSurvivesARoundTripBesideItsOtherForm) {
  std::vector<std::string> made;
  for (int byte = 1; byte < 256; ++byte) {
    const auto names = SpellHFSName("x" + std::string(1, static_cast<char>(byte)));
    for (const std::string& name : {names.precomposed, names.decomposed}) {
      if (!name.empty()) made.push_back(Make(name));
    }
  }
  EXPECT_GT(made.size(), 254u + 40u);
  for (const std::string& path : made) EXPECT_EQ(ItemOf(SpecOf(path)), path);
}

TEST_F(NamesInAFolder, InvalidUtf8SurvivesARoundTrip) {
  for (const std::string& name :
       std::vector<std::string>{"\xFF", "a\x80.aif", "\xC3", "\xED\xA0\x80", "\xF4\x90\x80\x80",
                                "\xC0\xAF", "\xFF\xFE\xFD"}) {
    Make(name);
  }
  for (const auto& entry : std::filesystem::directory_iterator(mFolder.Path())) {
    EXPECT_EQ(ItemOf(SpecOf(entry.path())), entry.path());
  }
}

TEST_F(NamesInAFolder, ControlCharactersSurviveARoundTrip) {
  for (const std::string& name :
       std::vector<std::string>{"\n", " ", "\t\r", "\x01\x7F", "\\", "*?"}) {
    Make(name);
    EXPECT_EQ(HFSName(name), name);
    ExpectRoundTrip(name);
  }
}

TEST_F(NamesInAFolder, NamesOfEveryLengthSurviveARoundTrip) {
  for (std::size_t length = 1; length <= 255; ++length) Make(std::string(length, 'n'));
  for (std::size_t length = 1; length <= 255; ++length) ExpectRoundTrip(std::string(length, 'n'));
  EXPECT_EQ(HFSName(std::string(63, 'n')), std::string(63, 'n'));
  EXPECT_LE(HFSName(std::string(64, 'n')).size(), 31u);
}

TEST_F(NamesInAFolder, NamesThatDifferOnlyAfterByte63SurviveARoundTrip) {
  std::set<std::string> forms;
  for (const char* end : {"a", "b", ".aif", ".wav", "c.aif"}) Make(std::string(70, 'n') + end);
  for (const char* end : {"a", "b", ".aif", ".wav", "c.aif"}) {
    ExpectRoundTrip(std::string(70, 'n') + end);
    forms.insert(HFSName(std::string(70, 'n') + end));
  }
  EXPECT_EQ(forms.size(), 5u);
}

TEST_F(NamesInAFolder, AnAccentedNameBeyond255BytesInUtf8IsNotFound) {
  EXPECT_EQ(LookUp(std::string(63, '\x8E')), "(-43)");
  Str255Of name(std::string(255, '\x8E'));
  FSSpec spec{};
  EXPECT_EQ(FSMakeFSSpec(mInfo.volume, static_cast<SInt32>(mInfo.nodeID), name.bytes, &spec),
            bdNamErr);
}

TEST_F(NamesInAFolder, AnExtensionWithANumberSignSurvivesARoundTrip) {
  for (const char* name : {"\xFF.c#", "\xFF.#", "\xFF.a#B", "\xFF.#10", "\xFF#.10", "\xFF.#A#B"}) {
    Make(name);
    ExpectRoundTrip(name);
  }
}

TEST_F(NamesInAFolder, ANameThatReadsAsAShortFormIsItself) {
  for (const char* name :
       {"x#10", "x#10.aif", "#10", "#", "##10", "x#FFFFFFFFF", "x#1b", "?#10", "?#010", "?#2"}) {
    Make(name);
    EXPECT_EQ(HFSName(name), name);
    ExpectRoundTrip(name);
  }
}

TEST_F(NamesInAFolder, ALiteralNameCountsBeforeTheItemWhoseShortFormItIs) {
  const std::string longName = std::string(80, 'n') + ".aif";
  Make(longName);
  const std::string shortForm = HFSName(longName);
  Make(shortForm);
  EXPECT_EQ(LookUp(shortForm), PathTo(shortForm));
  EXPECT_NE(HFSName(longName), shortForm);
  ExpectRoundTrip(longName);
  ExpectRoundTrip(shortForm);
}

TEST_F(NamesInAFolder, ARecordWithMoreMarksStillFindsItsItemWhenTheLiteralNameIsGone) {
  const std::string longName = std::string(80, 'n') + ".aif";
  Make(longName);
  const std::string shortForm = HFSName(longName);
  Make(shortForm);
  const FSSpec record = SpecOf(PathTo(longName));
  std::filesystem::remove(PathTo(shortForm));
  EXPECT_EQ(ItemOf(record), PathTo(longName));
}

// Only items without a plain name have a short form. Otherwise a new file of that name would seem
// to exist already.
TEST_F(NamesInAFolder, AnItemWithANameOfItsOwnIsNotFoundByAShortForm) {
  for (const std::string& name : std::vector<std::string>{"report.txt", "what?", kDecomposed}) {
    Make(name);
    EXPECT_EQ(LookUp(ShortHFSName(name, IDOf(PathTo(name)))), "(-43)") << name;
  }
  // Beside a twin, the name is not plain.
  const std::string shortForm = ShortHFSName(kDecomposed, IDOf(PathTo(kDecomposed)));
  Make(kComposed);
  EXPECT_EQ(LookUp(shortForm), PathTo(kDecomposed));
}

TEST_F(NamesInAFolder, AShortFormIsLookedUpOnlyInItsOwnFolder) {
  const std::string longName = std::string(80, 'n');
  Make(longName);
  const std::string shortForm = HFSName(longName);
  const std::string other = mFolder.MakeFolder("other");
  const FSSpec record = MakeRecord(mInfo.volume, IDOf(other), shortForm);
  EXPECT_EQ(ItemOf(record), "(-43)");
  chmod(mFolder.Path().c_str(), 0755);
  EXPECT_TRUE(HoldsForNobody([&] { return ItemOf(record) == "(-43)"; }));
}

TEST_F(NamesInAFolder, HardLinksWithOneShortFormAreFoundAsOneItem) {
  const std::string first = std::string(80, 'n') + "1";
  const std::string second = std::string(80, 'n') + "2";
  Make(first);
  ASSERT_EQ(link(PathTo(first).c_str(), PathTo(second).c_str()), 0);
  ASSERT_EQ(HFSName(first), HFSName(second));
  EXPECT_TRUE(std::filesystem::equivalent(LookUp(HFSName(first)), PathTo(first)));
}

TEST_F(NamesInAFolder, ALiteralNameForEveryNumberOfMarksButOneLeavesThatOne) {
  const std::string name = "\xE6\x97\xA5.aif";
  const std::uint32_t id = IDOf(Make(name));
  for (std::size_t marks = 1; marks < names::kMostMarks; ++marks)
    Make(ShortHFSName(name, id, marks));
  EXPECT_EQ(HFSName(name), ShortHFSName(name, id, names::kMostMarks));
  ExpectRoundTrip(name);
}

TEST_F(NamesInAFolder, AShortFormWithTheIDOfAnotherItemIsNotFound) {
  const std::string longName = std::string(80, 'n');
  Make(longName);
  Make("other");
  EXPECT_EQ(LookUp(ShortHFSName(longName, IDOf(PathTo("other")))), "(-43)");
  EXPECT_EQ(LookUp(ShortHFSName(longName, IDOf(PathTo(longName)))), PathTo(longName));
}

TEST_F(NamesInAFolder, AShortFormOfAReplacedItemIsNotFound) {
  const std::string longName = std::string(80, 'n');
  Make(longName);
  const FSSpec record = SpecOf(PathTo(longName));
  std::filesystem::rename(PathTo(longName), mFolder.Path() / "kept");
  Make(longName);
  EXPECT_EQ(ItemOf(record), "(-43)");
}

TEST_F(NamesInAFolder, AShortFormOfAnInaccessibleItemIsNotTakenForANewName) {
  constexpr std::size_t kLongestPath = PATH_MAX - 1;
  const std::string longName(80, 'n');
  // The folder's path is so long that only the short form fits below it.
  const std::size_t length = kLongestPath - longName.size();
  std::string path = mFolder.Path();
  while (path.size() + 202 < length) path += "/" + std::string(200, 'f');
  path += "/" + std::string(length - path.size() - 1, 'f');
  std::filesystem::create_directories(path);
  const Descriptor folder(open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  const Descriptor file(
      openat(folder.Get(), longName.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644));
  struct stat about {};
  ASSERT_EQ(fstat(file.Get(), &about), 0);
  ASSERT_TRUE(about.st_ino >= 16 && about.st_ino <= 0x7FFFFFFF) << "the number is not the id";
  const std::string shortForm = ShortHFSName(longName, static_cast<std::uint32_t>(about.st_ino));
  EXPECT_EQ(ItemOf(MakeRecord(mInfo.volume, IDOf(path), shortForm)), "(-36)");
  unlinkat(folder.Get(), longName.c_str(), 0);
}

// In a sandbox that permits searching folders but not reading them.
TEST_F(NamesInAFolder, AnUnreadableFolderIsRefused) {
  ASSERT_EQ(LookUp("missing\x8E"), "(-43)");
  for (const int error : {EACCES, EPERM}) {
    EXPECT_TRUE(HoldsInChild([&] { return RefuseCall(SYS_openat, error); },
                             [&] { return LookUp("missing\x8E") == "(-5000)"; }))
        << error;
    EXPECT_TRUE(HoldsInChild([&] { return RefuseCall(SYS_getdents64, error); },
                             [&] { return LookUp("missing\x8E") == "(-5000)"; }))
        << error;
  }
  EXPECT_TRUE(HoldsInChild([] { return RefuseCall(SYS_getdents64, EIO); },
                           [&] { return LookUp("missing\x8E") == "(-36)"; }));
}

TEST_F(NamesInAFolder, NamesThatNoItemCanHaveAreNotFound) {
  for (const std::string& name : std::vector<std::string>{
           std::string(), std::string("."), std::string(".."), std::string("a\0b", 3),
           std::string("\0", 1), std::string(":"), std::string("a:b")}) {
    EXPECT_EQ(LookUp(name), "(-43)");
  }
}

TEST_F(NamesInAFolder, AnEscapeSequenceIsANameLikeOthers) {
  for (const char* const name : {"%2E", "%2e%2E", ".%2e", "%2E.", "%2F", "a%2Fb", "%", "%00"}) {
    Make(name);
    ExpectRoundTrip(name);
  }
}

TEST_F(NamesInAFolder, ALinkIsFoundItselfEvenADanglingOne) {
  ASSERT_EQ(symlink("nowhere", PathTo("link").c_str()), 0);
  ASSERT_EQ(symlink("/", PathTo("root").c_str()), 0);
  ExpectRoundTrip("link");
  ExpectRoundTrip("root");
}

TEST_F(NamesInAFolder, ManyHostileNamesSideBySideSurviveARoundTrip) {
  std::set<std::string> names;
  unsigned seed = 4711;
  const auto next = [&seed](unsigned limit) {
    seed = seed * 1103515245 + 12345;
    return seed / 65536 % limit;
  };
  const std::vector<std::string> pieces{"e",
                                        "\xCC\x81",
                                        "\xC3\xA9",
                                        "#",
                                        ".",
                                        ":",
                                        "%2E",
                                        "1A",
                                        "\xFF",
                                        "\xE6\x97\xA5",
                                        "\n",
                                        "?",
                                        "long long long long long"};
  while (names.size() < 500) {
    std::string name;
    for (unsigned count = 1 + next(8); count > 0; --count) {
      name += pieces[next(static_cast<unsigned>(pieces.size()))];
    }
    if (name != "." && name != ".." && names.insert(name).second) Make(name);
  }
  for (const std::string& name : names) ExpectRoundTrip(name);
}

}  // namespace
}  // namespace tallowmere::test
