// Checks that a locked-in service gives the same answers as an open one.
#include <gtest/gtest.h>
#include <pwd.h>
#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "service/RightAnswers.h"
#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/SmallRoot.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using std::filesystem::path;

// A local user-database daemon, at the socket that the C library tries. It knows a user "ann" whose
// home folder is "/Home of ann". Its protocol is that of glibc's nscd-client.h.
class UserDaemon {
 public:
  static constexpr char kFolder[] = "/var/run/nscd";
  static constexpr char kHome[] = "/Home of ann";

  UserDaemon() : mSocket(socket(AF_UNIX, SOCK_STREAM, 0)) {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::strcpy(address.sun_path, "/var/run/nscd/socket");
    mListens = bind(mSocket, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0 &&
               listen(mSocket, 8) == 0;
    mThread = std::thread([this] { Serve(); });
  }
  UserDaemon(const UserDaemon&) = delete;
  UserDaemon& operator=(const UserDaemon&) = delete;
  ~UserDaemon() {
    shutdown(mSocket, SHUT_RDWR);
    mThread.join();
    close(mSocket);
  }

  bool Listens() const { return mListens; }
  int Asked() const { return mAsked; }

 private:
  static constexpr std::int32_t kVersion = 2;
  static constexpr std::int32_t kByName = 0;  // GETPWBYNAME

  void Serve() {
    for (int client = 0; (client = accept(mSocket, nullptr, nullptr)) >= 0; close(client)) {
      std::array<std::int32_t, 3> head{};  // version, question, size of the key
      std::array<char, 64> key{};
      if (read(client, head.data(), sizeof head) != sizeof head) continue;
      const auto size = std::min(static_cast<std::size_t>(head[2]), key.size());
      if (read(client, key.data(), size) <= 0 || head[1] != kByName) continue;
      if (std::strcmp(key.data(), "ann") == 0) ++mAsked;
      Answer(client, std::strcmp(key.data(), "ann") == 0);
    }
  }

  // Version, found, sizes of name and password, user, group, sizes of comment, folder and shell.
  static void Answer(int client, bool found) {
    const std::string texts = std::string("ann\0x\0\0", 7) + kHome + std::string("\0\0", 2);
    const std::array<std::int32_t, 9> head{kVersion, found ? 1 : 0, 4, 2, 1234, 1234,
                                           1,        sizeof kHome,  1};
    std::string answer(reinterpret_cast<const char*>(head.data()), sizeof head);
    if (found) answer += texts;
    if (write(client, answer.data(), answer.size()) < 0) return;
  }

  int mSocket;
  bool mListens = false;
  std::atomic<int> mAsked = 0;
  std::thread mThread;
};

// Returns the program's answers to the requests, up to its end.
std::string AnswersOf(const std::string& program, const std::string& requests) {
  ChildProgram service(program, {std::to_string(getpid())});
  std::thread writer([&] {
    service.Write(requests);
    service.CloseInput();
  });
  std::string answers = service.ReadToEnd();
  writer.join();
  EXPECT_EQ(service.Wait(), 0);
  return answers;
}

// Returns the requests of every code about an item.
std::string EveryRequestAbout(const std::string& item) {
  Service learns;
  Item known = LearnItem(learns, item);
  if (known.record.empty()) known.record = kEmptyRecord;
  std::string requests;
  for (unsigned code = 1; code <= 10; ++code) requests += RequestAbout(known, code);
  return requests + PathOfRecordRequest(known.record, 1, 0) + FullPathRequest(item, 1024, 0) +
         AddNameRequest(known.folder, "a new name", 0);
}

void ExpectSameAnswers(const std::string& requests) {
  const std::string answers = AnswersOf(TALLOWMERE_SERVICE, requests);
  EXPECT_FALSE(answers.empty());
  EXPECT_TRUE(answers == AnswersOf(TALLOWMERE_OPEN_SERVICE, requests));
}

TEST(LockedInAnswers, AreTheSameAboutItemsOfEveryKind) {
  const TemporaryFolder folder;
  std::string requests;
  for (const std::string& name :
       {std::string("INFO.aif"), std::string("\xC3\xA9t\xC3\xA9.aif"),
        std::string("e\xCC\x81t\xC3\xA9.aif"), std::string("\xE6\x97\xA5.aif"),
        std::string("\xFF:\x01.aif"), std::string(200, 'i') + ".aif"}) {
    requests += EveryRequestAbout(folder.MakeFile(name));
  }
  requests += EveryRequestAbout(folder.MakeFolder("a folder")) +
              EveryRequestAbout(folder.MakeLink("a link", "nowhere")) + EveryRequestAbout("/") +
              EveryRequestAbout("/missing/item") + EveryRequestAbout("/proc/self/mountinfo") +
              EveryRequestAbout("/dev/null");
  for (int volume = -1; volume > -64; --volume) requests += VolumeNameRequest(volume);
  ExpectSameAnswers(requests);
}

// The first request to a new service asks for an unknown id, so it reads every folder.
TEST(LockedInAnswers, AreTheSameAfterAPassOverAVolume) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const ScopedMount volume("none", folder.MakeFolder("Volume").string(), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  folder.MakeFolder("Volume/a/b/c");
  const std::string item = folder.MakeFile("Volume/a/b/c/a track.aif");
  Service learns;
  const Item known = LearnItem(learns, item);
  const std::string none = Record(known.volume, kSharedID, "none");
  ExpectSameAnswers(PathOfRecordRequest(none, 0, 0) + PathOfRecordRequest(known.record, 1, 0));
  EXPECT_TRUE(AnswersOf(TALLOWMERE_SERVICE, PathOfRecordRequest(known.record, 0, 0)) ==
              PathResponse(item));
}

TEST(LockedInAnswers, AreTheSameAboutHomeFolders) {
  std::string requests;
  for (const char* const home :
       {"~", "~/x", "~root/x", "~nobody/x", "~daemon", "~no such user/x"}) {
    requests += RecordRequest(home) + FullPathRequest(home, 1024, 1) + HFSNameRequest(home, 64) +
                AddNameRequest(home, "x", 0);
  }
  ExpectSameAnswers(requests);
  const passwd* const root = getpwnam("root");
  ASSERT_NE(root, nullptr);
  const std::string answer = AnswersOf(TALLOWMERE_SERVICE, RecordRequest("~root"));
  EXPECT_EQ(answer, AnswersOf(TALLOWMERE_SERVICE, RecordRequest(root->pw_dir)));
}

TEST(LockedInAnswers, AreTheSameAboutUsersOfALocalDaemon) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const std::string run = std::filesystem::canonical("/var/run");
  const ScopedMount runtime("none", run, "tmpfs");
  ASSERT_TRUE(runtime.IsMounted());
  std::filesystem::create_directory(UserDaemon::kFolder);
  const UserDaemon daemon;
  ASSERT_TRUE(daemon.Listens());
  const std::string requests = AddNameRequest("~ann", "x", 0) + FullPathRequest("~ann/x", 1024, 1);
  const std::string open = AnswersOf(TALLOWMERE_OPEN_SERVICE, requests);
  if (daemon.Asked() == 0) GTEST_SKIP() << "the C library asks no daemon here";
  EXPECT_NE(open.find(std::string(UserDaemon::kHome) + "/x"), std::string::npos);
  EXPECT_EQ(AnswersOf(TALLOWMERE_SERVICE, requests), open);
}

// The exception: Landlock hides what /proc shows of other processes.
TEST(LockedInAnswers, LeadThroughNoOtherProcess) {
  const TemporaryFolder folder;
  folder.MakeFile("item");
  const std::string here = "/proc/" + std::to_string(getpid()) + "/root";
  const std::string request = RecordRequest(here + folder.Path().string() + "/item");
  EXPECT_EQ(AnswersOf(TALLOWMERE_OPEN_SERVICE, request).at(0), '\1');
  EXPECT_EQ(AnswersOf(TALLOWMERE_SERVICE, request).at(0), '\0');
}

// The root folder is on a disk with a label, which names the volume.
TEST(LockedInAnswers, TellTheLabelOfTheRootVolume) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  FileSystemImage disk("ext4", {"mkfs.ext4", "-q", "-F", "-L", "Label"}, 64 << 20);
  if (!disk.IsMade() || !disk.Mount()) GTEST_SKIP() << "no ext4 images here";
  CopyPrograms({TALLOWMERE_SERVICE}, disk.Path());
  std::filesystem::create_directory(disk.Path() / "proc");
  const ScopedMount proc("none", (disk.Path() / "proc").string(), "proc");
  Service service(
      std::vector<std::string>{"unshare", "--mount", TALLOWMERE_ENTER_ROOT, disk.Path().string()});
  EXPECT_EQ(service.NameOf(0), "Label");
}

}  // namespace
}  // namespace tallowmere::test
