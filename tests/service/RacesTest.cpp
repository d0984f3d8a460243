// The file system changes mid-request, in front of each system call of the answer in turn. The
// answer must be the one from before, the one from after, "no item", or a path that leads nowhere.
// It never leads to another item. A change to something else changes no answer.
#include <gtest/gtest.h>
#include <sys/mount.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>
#include <tuple>

#include "RaceSupport.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

namespace fs = std::filesystem;

constexpr const char* kLongName =
    "an item with a name of more than the sixty-three bytes that there is room for.aif";

// --- Races ------------------------------------------------------------------------------------

enum class Race { kFolderBecomesLink, kItemIsReplaced, kFolderIsCovered };
const char* NameOf(Race race) {
  switch (race) {
    case Race::kFolderBecomesLink:
      return "AFolderOnTheWayBecomesALink";
    case Race::kItemIsReplaced:
      return "AnItemIsReplaced";
    default:
      return "AMountCoversAFolder";
  }
}

// Requests ask about "top/folder/inner/item". Wherever a change could mislead the service, there is
// another item of the same name.
class Tree {
 public:
  Tree(ChildProgram& before, std::string name) : mName(std::move(name)) {
    for (const char* const folder : {"top/folder/inner", "top/other/inner"}) {
      mFolder.MakeFolder(folder);
      std::ofstream(mFolder.Path() / folder / mName) << folder;
    }
    mItem = ItemAt(before, Path());
  }
  ~Tree() { umount2((Top() / "folder").c_str(), MNT_DETACH); }
  Tree(const Tree&) = delete;
  Tree& operator=(const Tree&) = delete;

  fs::path Top() const { return mFolder.Path() / "top"; }
  fs::path Path() const { return Top() / "folder/inner" / mName; }
  std::string Request(unsigned code) const { return RequestAbout(mItem, code); }

  void Change(Race race) const {
    const fs::path folder = Top() / "folder";
    switch (race) {
      case Race::kFolderBecomesLink:
        fs::rename(folder, Top() / "moved");
        fs::create_symlink(Top() / "other", folder);
        break;
      case Race::kItemIsReplaced:
        Exchange(Path(), Top() / "other/inner" / mName);
        break;
      case Race::kFolderIsCovered:
        ASSERT_EQ(mount("none", folder.c_str(), "tmpfs", 0, ""), 0);
        fs::create_directory(folder / "inner");
        std::ofstream(Path()) << "covering";
    }
  }

 private:
  TemporaryFolder mFolder;
  std::string mName;
  Item mItem{};
};

class Races
    : public InSmallRoot,
      public testing::WithParamInterface<std::tuple<Race, unsigned, Knowledge, const char*>> {};

TEST_P(Races, ChangeNoAnswerIntoThatOfAnotherItem) {
  const auto [race, code, knowledge, name] = GetParam();
  bool isChanged = true;
  int call = 0;
  for (; isChanged; ++call) {
    Bystander before;
    const Tree tree(before, name);
    const std::string request = tree.Request(code);
    StoppedService service(StoppedServices());
    if (!service.CanStop()) GTEST_SKIP() << "the kernel does not let us stop a process here";
    if (knowledge == Knowledge::kOfTheItem) Answer(service.Streams(), 7, tree.Request(7));
    Truth truth(tree.Path(), code);
    truth.Note(Answer(before, code, request));

    service.ChangeAt(call, [&, race = race] { tree.Change(race); });
    const std::string response = Answer(service.Streams(), code, request);
    isChanged = service.HasChanged();

    Bystander after;
    const std::string fromNowOn = Answer(after, code, request);
    truth.Note(fromNowOn);
    EXPECT_TRUE(truth.Admits(response, after))
        << "changed at call " << call << ": " << testing::PrintToString(response);
    EXPECT_EQ(Answer(service.Streams(), code, request), fromNowOn)
        << "changed at call " << call << ", and asked again";
  }
  EXPECT_GT(call, 1);
}

std::string NameOfCase(const testing::TestParamInfo<Races::ParamType>& info) {
  const auto [race, code, knowledge, name] = info.param;
  return std::string(NameOf(race)) + "Code" + std::to_string(code) + NameOf(knowledge) +
         (name == kLongName ? "LongName" : "");
}

INSTANTIATE_TEST_SUITE_P(AtEachCall, Races,
                         testing::Combine(testing::Values(Race::kFolderBecomesLink,
                                                          Race::kItemIsReplaced,
                                                          Race::kFolderIsCovered),
                                          testing::Values(1u, 2u, 5u, 6u, 7u, 8u, 9u),
                                          testing::Values(Knowledge::kNone, Knowledge::kOfTheItem),
                                          testing::Values(kName, kLongName)),
                         NameOfCase);

// --- HFS paths through folders ----------------------------------------------------------------

// A name that leads through other folders than the one asked about. "first" and "second" are
// exchanged mid-request.
struct Way {
  const char* text;      // for the test's name
  const char* asked;     // the folder whose id is in the request
  const char* name;      // an HFS path relative to it
  const char* expected;  // empty when there is no such item
};

class RacesOnAWay : public InSmallRoot, public testing::WithParamInterface<Way> {};

TEST_P(RacesOnAWay, LeadOnlyIntoFoldersThatWereOnIt) {
  const Way& way = GetParam();
  bool isChanged = true;
  int call = 0;
  for (; isChanged; ++call) {
    const TemporaryFolder top;
    for (const char* const folder :
         {"targets/1", "targets/2", "first/inner", "second/other", "second/inner"}) {
      std::ofstream(top.MakeFolder(folder) / kName) << folder;
    }
    fs::create_symlink(top.Path() / "targets/1", top.Path() / "first/link");
    fs::create_symlink(top.Path() / "targets/2", top.Path() / "second/link");
    StoppedService service(StoppedServices());
    if (!service.CanStop()) GTEST_SKIP() << "the kernel does not let us stop a process here";
    const Item asked = ItemAt(service.Streams(), top.Path() / way.asked / kName);
    const auto expected =
        *way.expected == '\0' ? std::nullopt : IdentityOf(top.Path() / way.expected);

    service.ChangeAt(call, [&] { Exchange(top.Path() / "first", top.Path() / "second"); });
    const std::string response =
        Answer(service.Streams(), 8, PathOfPartsRequest(asked.volume, asked.folderID, way.name, 0));
    isChanged = service.HasChanged();
    const auto found = IdentityOf(PathIn(8, response));
    EXPECT_TRUE(!found || found == expected)
        << "changed at call " << call << ": " << PathIn(8, response);
  }
  EXPECT_GT(call, 1);
}

std::string NameOfWay(const testing::TestParamInfo<Way>& info) {
  return info.param.text;
}

INSTANTIATE_TEST_SUITE_P(
    AtEachCall, RacesOnAWay,
    testing::Values(Way{"ThroughALink", "first", ":link:item.aif", "targets/1/item.aif"},
                    Way{"ThroughTheFolderAbove", "first/inner", "::other:item.aif", ""}),
    NameOfWay);

// A folder takes a file's place mid-request.
TEST_F(InSmallRoot, TheIdOfAFileIsNotTakenForTheFolderInItsPlace) {
  bool isChanged = true;
  for (int call = 0; isChanged; ++call) {
    const TemporaryFolder top;
    for (int i = 0; i < 20; ++i) fs::remove(top.MakeFile("for a number that is an id"));
    const fs::path file = top.MakeFile("file");
    const fs::path folder = top.MakeFolder("folder");
    StoppedService service(StoppedServices());
    if (!service.CanStop()) GTEST_SKIP() << "the kernel does not let us stop a process here";
    ItemAt(service.Streams(), file);
    Item asked = ItemAt(service.Streams(), folder / kName);
    const auto id = static_cast<std::int32_t>(IdentityOf(file)->second);
    std::memcpy(asked.record.data() + sizeof asked.volume, &id, sizeof id);

    service.ChangeAt(call, [&] { Exchange(file, folder); });
    const std::string response = Answer(service.Streams(), 9, RequestAbout(asked, 9));
    isChanged = service.HasChanged();
    EXPECT_EQ(PathIn(9, response), "") << "changed at call " << call;
  }
}

// --- Changes to something else ----------------------------------------------------------------

struct Names {
  const char* item;
  const char* asked;  // the same name, or that of a new item
};

class RacesBesideTheItem
    : public InSmallRoot,
      public testing::WithParamInterface<std::tuple<unsigned, Knowledge, Names>> {};

// Makes the service read the whole volume, by an id that no folder has.
void PassOver(ChildProgram& service, Item item) {
  constexpr std::int32_t kNoSuchFolder = 0x7FFFFFF;
  item.folderID = kNoSuchFolder;
  Answer(service, 8, RequestAbout(item, 8));
}

// The service learned the item's place before one of its folders moved and left a link: from the
// item's own record, or from a pass over the volume. The link goes away mid-request. The service
// must not answer with the item's other name then.
TEST_P(RacesBesideTheItem, ALinkToItsFolderVanishesAndNoAnswerChanges) {
  const auto [code, knowledge, names] = GetParam();
  bool isChanged = true;
  int call = 0;
  for (; isChanged; ++call) {
    const TemporaryFolder top;
    const fs::path folder = top.MakeFolder("folder");
    const fs::path first = top.MakeFolder("first");
    const fs::path moved = top.Path() / "moved";
    top.MakeFolder("first/inner");
    std::ofstream(first / "inner" / names.item) << "item";
    fs::create_hard_link(first / "inner" / names.item, top.Path() / "another name.aif");
    StoppedService service(StoppedServices());
    if (!service.CanStop()) GTEST_SKIP() << "the kernel does not let us stop a process here";
    const Item known = ItemAt(service.Streams(), first / "inner" / names.item);
    fs::rename(first / "inner", folder / "inner");
    if (knowledge == Knowledge::kOfTheItem) {
      Answer(service.Streams(), 9, RequestAbout(known, 9));
    } else {
      PassOver(service.Streams(), known);
    }
    fs::rename(folder, moved);
    fs::create_symlink(moved, folder);

    Bystander bystander;
    const std::string request =
        RequestAbout(ItemAt(bystander, moved / "inner" / names.asked), code);
    const std::string expected = Answer(bystander, code, request);
    service.ChangeAt(call, [&] { fs::remove(folder); });
    EXPECT_EQ(Answer(service.Streams(), code, request), expected) << "changed at call " << call;
    isChanged = service.HasChanged();
    EXPECT_EQ(Answer(bystander, code, request), expected) << "asked of another service afterwards";
  }
  EXPECT_GT(call, 1);
}

// The service knows the volume by a place at which the mount table never showed it.
TEST_P(RacesBesideTheItem, ALinkToItsVolumeVanishesAndNoAnswerChanges) {
  const auto [code, knowledge, names] = GetParam();
  bool isChanged = true;
  int call = 0;
  for (; isChanged; ++call) {
    const TemporaryFolder top;
    const fs::path folder = top.MakeFolder("folder");
    const fs::path moved = top.Path() / "moved";
    const fs::path inner = top.MakeFolder("folder/volume");
    const ScopedMount volume("none", inner, "tmpfs");
    ASSERT_TRUE(volume.IsMounted());
    for (int i = 0; i < 20; ++i) fs::remove(top.MakeFile("folder/volume/first"));
    top.MakeFolder("folder/volume/inner");
    std::ofstream(inner / "inner" / names.item) << "item";
    StoppedService service(StoppedServices());
    if (!service.CanStop()) GTEST_SKIP() << "the kernel does not let us stop a process here";
    const Item known = ItemAt(service.Streams(), inner / "inner" / names.item);
    if (knowledge == Knowledge::kOfAPass) PassOver(service.Streams(), known);
    fs::rename(folder, moved);
    fs::create_symlink(moved, folder);

    Bystander bystander;
    const Item asked = ItemAt(bystander, moved / "volume/inner" / names.asked);
    if (knowledge == Knowledge::kOfTheItem) {
      Answer(service.Streams(), 7, RecordRequest((moved / "volume/inner").string()));
    }
    const std::string request = RequestAbout(asked, code);
    const std::string expected = Answer(bystander, code, request);
    service.ChangeAt(call, [&] { fs::remove(folder); });
    EXPECT_EQ(Answer(service.Streams(), code, request), expected) << "changed at call " << call;
    isChanged = service.HasChanged();
    fs::remove(folder);
    fs::rename(moved, folder);  // so that the volume can be unmounted
  }
  EXPECT_GT(call, 1);
}

std::string NameOfCaseBeside(const testing::TestParamInfo<RacesBesideTheItem::ParamType>& info) {
  const auto [code, knowledge, names] = info.param;
  return "Code" + std::to_string(code) + NameOf(knowledge) +
         (names.item == kLongName ? "LongName" : "") + (names.item == names.asked ? "" : "NewItem");
}

INSTANTIATE_TEST_SUITE_P(
    AtEachCall, RacesBesideTheItem,
    testing::Combine(testing::Values(1u, 2u, 5u, 6u, 7u, 8u, 9u),
                     testing::Values(Knowledge::kOfTheItem, Knowledge::kOfAPass),
                     testing::Values(Names{kName, kName}, Names{kLongName, kLongName},
                                     Names{kName, "new.aif"})),
    NameOfCaseBeside);

}  // namespace
}  // namespace tallowmere::test
