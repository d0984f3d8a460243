// Tests the soak's judge on hand-made histories.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "Judge.h"
#include "support/Wire.h"

namespace tallowmere::soak {
namespace {

using namespace tallowmere::test;

constexpr NameIndex kSoakB = 2;
constexpr NameIndex kSoakC = 3;
constexpr NameIndex kTrack1 = kFirstFile;
constexpr NameIndex kTrack2 = kFirstFile + 1;

constexpr Node kPlaceFolder = 2;
constexpr Node kF2 = 3;
constexpr Node kX = 4;
constexpr Node kZ = 5;
constexpr Node kSub = 6;
constexpr Node kSubOfRoot = 7;
constexpr Node kOtherRoot = 8;
constexpr Node kSubOfOther = 9;

constexpr int kMainNumber = -40;
constexpr int kOtherNumber = -41;
constexpr std::uint32_t kMadeUpID = 0x80001234;

Entry EntryIn(Node folder, NameIndex name, Node node, Kind kind) {
  constexpr std::uint64_t kFirstInode = 100;
  return {folder, node, kFirstInode + node, kind, name, 0, kNoName};
}

State StateOf(const std::vector<Entry>& entries, Volume other = {kNoNode, kOtherNumber}) {
  State state;
  state.main.number = kMainNumber;
  state.other = other;
  for (const Entry& entry : entries) state.entries.at(state.count++) = entry;
  return state;
}

const Entry kPlaceEntry = EntryIn(kMainRoot, kVolumePlace, kPlaceFolder, Kind::kFolder);

// F2 moves from B to C, then X takes the name of Z in it.
std::vector<State> FolderAndThenFileMoved() {
  const Entry x = EntryIn(kF2, kTrack1, kX, Kind::kFile);
  const Entry z = EntryIn(kF2, kTrack2, kZ, Kind::kFile);
  const Entry atC = EntryIn(kMainRoot, kSoakC, kF2, Kind::kFolder);
  return {StateOf({kPlaceEntry, EntryIn(kMainRoot, kSoakB, kF2, Kind::kFolder), x, z}),
          StateOf({kPlaceEntry, atC, x, z}),
          StateOf({kPlaceEntry, atC, EntryIn(kF2, kTrack2, kX, Kind::kFile)})};
}

// The volume is unmounted, together with its only folder.
std::vector<State> VolumeUnmounted() {
  const Entry sub = EntryIn(kOtherRoot, kSubfolder, kSubOfOther, Kind::kFolder);
  return {StateOf({kPlaceEntry, sub}, {kOtherRoot, kOtherNumber}), StateOf({kPlaceEntry})};
}

// The folder that holds "sub" moves from B to C.
std::vector<State> OuterFolderMoved(bool rootHasSub) {
  std::vector<State> states;
  for (const NameIndex slot : {kSoakB, kSoakC}) {
    states.push_back(StateOf({kPlaceEntry, EntryIn(kMainRoot, slot, kF2, Kind::kFolder),
                              EntryIn(kF2, kSubfolder, kSub, Kind::kFolder)}));
    if (!rootHasSub) continue;
    State& state = states.back();
    state.entries.at(state.count++) = EntryIn(kMainRoot, kSubfolder, kSubOfRoot, Kind::kFolder);
  }
  return states;
}

Verdict VerdictOn(const std::vector<State>& states, const Request& request,
                  const std::string& response, Numbers numbers = Numbers::kTrusted) {
  History history(states.front());
  for (std::size_t i = 1; i < states.size(); ++i) {
    history.Begin(states[i]);
    history.Reach();
  }
  return Judge(history, {"/soaked", "soaked"}, numbers).Of(request, response, 0, history.Reached());
}

Request RequestAbout(unsigned code, const std::vector<NameIndex>& names) {
  Request request{};
  request.code = code;
  for (const NameIndex name : names) request.path.names.at(request.path.count++) = name;
  request.flag = code == 1;
  return request;
}

Request RequestAboutRecordOfX() {
  Request request{};
  request.code = 9;
  request.volume = kMainNumber;
  request.folder = static_cast<std::uint32_t>(EntryIn(kMainRoot, kSoakB, kF2, Kind::kFolder).inode);
  request.hfsName = NameAt(kTrack1).hfsName;
  return request;
}

std::string FullPathResponse(const std::string& path, char filler = '\0') {
  std::string text = path + '\0';
  text.resize(kMostRoom, filler);
  return U16(static_cast<unsigned>(path.size())) + text.append(kTrailer);
}

std::string MadeUpRecord(int volume, std::uint32_t id, const std::string& name) {
  return RecordResponse(1, Record(volume, static_cast<std::int32_t>(id), name));
}

// --- Each class -------------------------------------------------------------------------------

TEST(Judge, PathOfOneStateIsExact) {
  const auto states = FolderAndThenFileMoved();
  for (const char* const path : {"/soaked/soak B/track 1.aif", "/soaked/soak C/track 1.aif"}) {
    EXPECT_EQ(VerdictOn(states, RequestAboutRecordOfX(), PathResponse(path)), Verdict::kExact);
  }
}

TEST(Judge, PathToTheItemAfterItMovedIsMoved) {
  EXPECT_EQ(VerdictOn(FolderAndThenFileMoved(), RequestAboutRecordOfX(),
                      PathResponse("/soaked/soak C/track 2.aif")),
            Verdict::kMoved);
}

TEST(Judge, ErrorAboutAChangedItemIsHonest) {
  EXPECT_EQ(VerdictOn(FolderAndThenFileMoved(), RequestAboutRecordOfX(), kNoPathResponse),
            Verdict::kHonestError);
  EXPECT_EQ(
      VerdictOn(FolderAndThenFileMoved(), RequestAbout(2, {kSoakB, kTrack1}), ResultResponse(0)),
      Verdict::kHonestError);
}

TEST(Judge, NameOfTheVolumeOfAFolderThatWasReplacedIsAnHonestError) {
  const Entry replacing = EntryIn(kMainRoot, kSoakB, kX, Kind::kFolder);
  const std::vector<State> states{
      OuterFolderMoved(false).front(),
      StateOf({kPlaceEntry, replacing, EntryIn(kX, kSubfolder, kZ, Kind::kFolder)})};
  EXPECT_EQ(VerdictOn(states, RequestAbout(1, {kSoakB, kSubfolder}), FullPathResponse("soaked:")),
            Verdict::kHonestError);
}

TEST(Judge, NameOfAnUnmountedVolumeIsAnHonestError) {
  EXPECT_EQ(VerdictOn(VolumeUnmounted(), RequestAbout(1, {kVolumePlace, kSubfolder}),
                      FullPathResponse("soak volume:")),
            Verdict::kHonestError);
}

TEST(Judge, RecordOfTheItemByAMadeUpIDIsNowhere) {
  EXPECT_EQ(VerdictOn(FolderAndThenFileMoved(), RequestAbout(7, {kSoakB, kTrack1}),
                      MadeUpRecord(kMainNumber, kMadeUpID, "track 1.aif")),
            Verdict::kNowhere);
}

TEST(Judge, RecordOfANewItemByAMadeUpIDIsNowhere) {
  EXPECT_EQ(VerdictOn(VolumeUnmounted(), RequestAbout(7, {kVolumePlace, kTrack1}),
                      MadeUpRecord(kMainNumber, kMadeUpID, "track 1.aif")),
            Verdict::kNowhere);
}

TEST(Judge, FullPathWithoutOuterFoldersIsNowhere) {
  EXPECT_EQ(VerdictOn(OuterFolderMoved(false), RequestAbout(1, {kSoakB, kSubfolder}),
                      FullPathResponse("soaked:sub:")),
            Verdict::kNowhere);
}

TEST(Judge, FullPathOnAnUnmountedVolumeIsNowhere) {
  EXPECT_EQ(VerdictOn(VolumeUnmounted(), RequestAbout(1, {kVolumePlace, kSubfolder}),
                      FullPathResponse(":sub:")),
            Verdict::kNowhere);
}

TEST(Judge, ItemReachedByLookingUpNamesInTurnIsMeant) {
  // F2 is at B until another folder takes the place; then its file gets the requested name.
  const Entry file = EntryIn(kF2, kTrack1, kX, Kind::kFile);
  Entry renamed = file;
  renamed.name = kTrack2;
  const Entry atC = EntryIn(kMainRoot, kSoakC, kF2, Kind::kFolder);
  const Entry another = EntryIn(kMainRoot, kSoakB, kSub, Kind::kFolder);
  const std::vector<State> states{
      StateOf({kPlaceEntry, EntryIn(kMainRoot, kSoakB, kF2, Kind::kFolder), file}),
      StateOf({kPlaceEntry, another, atC, file}), StateOf({kPlaceEntry, another, atC, renamed})};
  const std::string response = ResultResponse(0, "/soaked/soak C/track 2.aif");
  EXPECT_EQ(VerdictOn(states, RequestAbout(2, {kSoakB, kTrack2}), response), Verdict::kMoved);
  const std::vector<State> backwards(states.rbegin(), states.rend());
  EXPECT_EQ(VerdictOn(backwards, RequestAbout(2, {kSoakB, kTrack2}), response), Verdict::kWrong);
}

// --- Shortened full paths -----------------------------------------------------------------------

TEST(Judge, FullPathWithoutRoomIsExactOnlyWhenShortened) {
  const auto states = OuterFolderMoved(false);
  Request request = RequestAbout(1, {kSoakB, kSubfolder});
  request.room = kLeastRoom;
  const auto response = [](const std::string& path) {
    std::string text = path;
    text.resize(kLeastRoom);
    constexpr unsigned kWholeLength = 18;  // of "soaked:soak B:sub:"
    return U16(kWholeLength) + text.append(kTrailer);
  };
  EXPECT_EQ(VerdictOn(states, request, response("soaked:...:sub:")), Verdict::kExact);
  EXPECT_EQ(VerdictOn(states, request, response("soaked:...:")), Verdict::kWrong);
  request.flag = false;
  EXPECT_EQ(VerdictOn(states, request, response("soaked")), Verdict::kExact);
  EXPECT_EQ(VerdictOn(states, request, response("soaked:")), Verdict::kWrong);
}

// Between two steps, code 8 finds its record and then searches the other volumes for it.
TEST(Judge, ItemOfAnotherVolumeIsMeantOnlyIfOtherVolumesAreSearched) {
  const Entry ofMain = EntryIn(kMainRoot, kTrack1, kX, Kind::kFile);
  const Entry ofOther = EntryIn(kOtherRoot, kTrack1, kZ, Kind::kFile);
  const std::vector<State> states{
      StateOf({kPlaceEntry, ofMain, ofOther}, {kOtherRoot, kOtherNumber}),
      StateOf({kPlaceEntry, ofMain})};
  Request request = RequestAboutRecordOfX();
  request.volume = kOtherNumber;
  request.folder = kRootID;
  const std::string response = PathResponse("/soaked/track 1.aif");
  EXPECT_EQ(VerdictOn(states, request, response), Verdict::kWrong);
  request.code = 8;
  EXPECT_EQ(VerdictOn(states, request, response), Verdict::kMoved);
}

// --- Wrong answers ----------------------------------------------------------------------------

TEST(Judge, PathThatOnlyLedToAnotherItemIsWrong) {
  EXPECT_EQ(VerdictOn(FolderAndThenFileMoved(), RequestAboutRecordOfX(),
                      PathResponse("/soaked/soak B/track 2.aif")),
            Verdict::kWrong);
}

TEST(Judge, ErrorAboutAnUnchangedItemIsWrong) {
  const State state = FolderAndThenFileMoved().front();
  State another = state;
  another.entries.at(another.count++) = EntryIn(kMainRoot, kTrack1, kSub, Kind::kFile);
  EXPECT_EQ(VerdictOn({state}, RequestAboutRecordOfX(), kNoPathResponse), Verdict::kWrong);
  EXPECT_EQ(VerdictOn({state, another}, RequestAboutRecordOfX(), kNoPathResponse), Verdict::kWrong);
}

TEST(Judge, RecordByAMadeUpIDIsWrongWithAnotherNameVolumeOrFlag) {
  const auto states = FolderAndThenFileMoved();
  const Request request = RequestAbout(7, {kSoakB, kTrack1});
  constexpr int kNoNumber = -7777;
  for (const std::string& response :
       {MadeUpRecord(kNoNumber, kMadeUpID, "no such thing"),
        MadeUpRecord(kNoNumber, kMadeUpID, "track 1.aif"),
        MadeUpRecord(kOtherNumber, kMadeUpID, "track 1.aif"),
        MadeUpRecord(kMainNumber, kMadeUpID, "no such thing"),
        RecordResponse(0,
                       Record(kMainNumber, static_cast<std::int32_t>(kMadeUpID), "track 1.aif"))}) {
    EXPECT_EQ(VerdictOn(states, request, response), Verdict::kWrong);
  }
}

TEST(Judge, UsableRecordWithoutAFolderIsWrong) {
  const Request request = RequestAbout(7, {kSoakB, kTrack1});
  constexpr std::uint32_t kNoID = 0xFFFFFFFF;
  for (const char* const name : {"junk", "track 1.aif"}) {
    EXPECT_EQ(VerdictOn(FolderAndThenFileMoved(), request, MadeUpRecord(kMainNumber, kNoID, name)),
              Verdict::kWrong);
  }
}

TEST(Judge, FullPathWithoutAVolumeIsWrongUnlessItWasUnmounted) {
  const auto states = OuterFolderMoved(false);
  const Request request = RequestAbout(1, {kSoakB, kSubfolder});
  for (const char* const path : {":any thing at all:", ":soak B:sub:", ":sub:"}) {
    EXPECT_EQ(VerdictOn(states, request, FullPathResponse(path)), Verdict::kWrong) << path;
  }
}

TEST(Judge, FullPathWithoutAVolumeIsWrongWithOtherFoldersLengthOrPadding) {
  const Request request = RequestAbout(1, {kVolumePlace, kSubfolder});
  constexpr unsigned kAnotherLength = 7;
  std::string withAnotherLength = FullPathResponse(":sub:");
  withAnotherLength.replace(0, sizeof(std::uint16_t), U16(kAnotherLength));
  std::string junk = ":x:";
  junk.resize(kMostRoom, 'z');
  for (const std::string& response :
       {FullPathResponse(":any thing at all:"), FullPathResponse(":sub:", 'z'), withAnotherLength,
        U16(kAnotherLength) + junk.append(kTrailer)}) {
    EXPECT_EQ(VerdictOn(VolumeUnmounted(), request, response), Verdict::kWrong);
  }
}

TEST(Judge, NameOfAVolumeThatIsNotMountedIsWrong) {
  EXPECT_EQ(VerdictOn(OuterFolderMoved(false), RequestAbout(1, {kSoakB, kSubfolder}),
                      FullPathResponse("soak volume:")),
            Verdict::kWrong);
}

TEST(Judge, NameOfAVolumeOffThePathIsWrong) {
  auto states = OuterFolderMoved(false);
  for (State& state : states) state.other.root = kOtherRoot;
  EXPECT_EQ(
      VerdictOn(states, RequestAbout(1, {kSoakB, kSubfolder}), FullPathResponse("soak volume:")),
      Verdict::kWrong);
}

TEST(Judge, FullPathWithoutOuterFoldersThatLeadsElsewhereIsWrong) {
  EXPECT_EQ(VerdictOn(OuterFolderMoved(true), RequestAbout(1, {kSoakB, kSubfolder}),
                      FullPathResponse("soaked:sub:")),
            Verdict::kWrong);
}

// --- Untrusted numbers --------------------------------------------------------------------------

// Two folders with the same number; the first holds X.
State TwoFoldersWithOneNumber() {
  Entry second = EntryIn(kMainRoot, kSoakC, kZ, Kind::kFolder);
  const Entry first = EntryIn(kMainRoot, kSoakB, kF2, Kind::kFolder);
  second.inode = first.inode;
  return StateOf({kPlaceEntry, first, second, EntryIn(kF2, kTrack1, kX, Kind::kFile)});
}

TEST(JudgeOfAnUntrustedVolume, AcceptsAnErrorWhenSomethingElseHasChanged) {
  State before = FolderAndThenFileMoved().front();
  State after = before;
  after.entries.at(after.count++) = EntryIn(kMainRoot, kTrack1, kSub, Kind::kFile);
  EXPECT_EQ(VerdictOn({before, after}, RequestAboutRecordOfX(), kNoItemResponse), Verdict::kWrong);
  EXPECT_EQ(
      VerdictOn({before, after}, RequestAboutRecordOfX(), kNoItemResponse, Numbers::kUntrusted),
      Verdict::kHonestError);
}

TEST(JudgeOfAnUntrustedVolume, AcceptsNoErrorWhenNothingHasChanged) {
  const State state = FolderAndThenFileMoved().front();
  EXPECT_EQ(VerdictOn({state}, RequestAboutRecordOfX(), kNoItemResponse, Numbers::kUntrusted),
            Verdict::kWrong);
}

TEST(JudgeOfAnUntrustedVolume, AcceptsOnlyAnErrorAboutANumberOfTwoFolders) {
  const State state = TwoFoldersWithOneNumber();
  EXPECT_EQ(VerdictOn({state}, RequestAboutRecordOfX(), kNoItemResponse, Numbers::kUntrusted),
            Verdict::kExact);
  EXPECT_EQ(VerdictOn({state}, RequestAboutRecordOfX(), PathResponse("/soaked/soak B/track 1.aif"),
                      Numbers::kUntrusted),
            Verdict::kWrong);
}

TEST(JudgeOfAnUntrustedVolume, AcceptsNoOtherItem) {
  const State state = FolderAndThenFileMoved().front();
  State after = state;
  after.entries.at(after.count++) = EntryIn(kMainRoot, kTrack1, kSub, Kind::kFile);
  EXPECT_EQ(VerdictOn({state, after}, RequestAboutRecordOfX(),
                      PathResponse("/soaked/soak B/track 2.aif"), Numbers::kUntrusted),
            Verdict::kWrong);
}

TEST(JudgeOfAServedVolume, AcceptsAServersErrorAboutAChangedItem) {
  const Request request = RequestAbout(2, {kSoakB, kTrack1});
  const std::string error = ResultResponse(kResultSystemError);
  EXPECT_EQ(VerdictOn(FolderAndThenFileMoved(), request, error), Verdict::kWrong);
  EXPECT_EQ(VerdictOn(FolderAndThenFileMoved(), request, error, Numbers::kServed),
            Verdict::kHonestError);
}

TEST(History, KnowsWhenAStateIsNoLongerKept) {
  State state{};
  History history(state);
  for (History::Version version = 1; version < History::kKept - 1; ++version) {
    state.main.number = -static_cast<int>(version);
    history.Begin(state);
    history.Reach();
  }
  EXPECT_TRUE(history.Keeps(0));
  state.main.number = 1;
  history.Begin(state);
  EXPECT_FALSE(history.Keeps(0)) << "the next state may already overwrite it";
  EXPECT_TRUE(history.Keeps(1));
  EXPECT_EQ(history.At(1).main.number, -1);
}

}  // namespace
}  // namespace tallowmere::soak
