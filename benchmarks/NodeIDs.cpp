#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstring>

#include "BigTree.h"
#include "Contest.h"
#include "InAProcess.h"
#include "Measure.h"
#include "Questions.h"
#include "Server.h"
#include "files/Catalog.h"
#include "files/FolderIndex.h"
#include "files/MountTable.h"
#include "files/NodeID.h"
#include "support/Wire.h"

namespace tallowmere::benchmark {
namespace {

constexpr double kMicrosecondsInAMillisecond = 1000;

// --- Warm ---------------------------------------------------------------------------------------

std::vector<Figure> Warm(const Settings& settings) {
  const Item item = AskAbout(settings.service, SettledFile(settings, 6));
  Server service(settings.service, {std::to_string(getpid())});
  const Question there = QuestionOf(protocol::kRequestGetFSSpec, item);
  const Question back = QuestionOf(protocol::kRequestSetFileRefFromFSSpec, item);
  std::vector<double> codes7;
  std::vector<double> codes9;
  for (int run = 0; run < settings.runs; ++run) {
    const auto costs = Compete(
        {{&service, there.request, there.answerSize}, {&service, back.request, back.answerSize}},
        settings.requests);
    codes7.push_back(costs[0].roundTrip);
    codes9.push_back(costs[1].roundTrip);
  }
  return {AtMost(1.5, RatioOf("node id, warm (code 9) / code 7", codes9, codes7, "µs"))};
}

// --- Cold, without privilege --------------------------------------------------------------------

struct Entry {  // struct linux_dirent64 of getdents(2)
  std::uint64_t inode;
  std::int64_t offset;
  std::uint16_t size;
  std::uint8_t type;
  char name[1];
};

// The floor of a pass: one open, one read to the end and one close for every folder.
long WalkBare(int parent, const char* name) {
  const int folder = openat(parent, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (folder < 0) return 0;
  long seen = 0;
  std::vector<std::string> folders;
  alignas(Entry) std::array<char, 32768> buffer;
  for (ssize_t got; (got = getdents64(folder, buffer.data(), buffer.size())) > 0;) {
    for (ssize_t at = 0; at < got;) {
      const auto* const entry = reinterpret_cast<const Entry*>(buffer.data() + at);
      const char* const entryName = buffer.data() + at + offsetof(Entry, name);
      at += entry->size;
      if (!std::strcmp(entryName, ".") || !std::strcmp(entryName, "..")) continue;
      ++seen;
      if (entry->type == DT_DIR) folders.emplace_back(entryName);
    }
  }
  for (const std::string& child : folders) seen += WalkBare(folder, child.c_str());
  close(folder);
  return seen;
}

// How many folders a first pass opens until it has found this one.
std::uint64_t FoldersOpenedFor(const files::VolumePointer& volume, const std::string& path) {
  const auto item = files::ReadItem(AT_FDCWD, path.c_str());
  if (!item) Fail(path);
  files::FolderIndex index(volume);
  const std::uint32_t id = files::NodeIDOf(*item, *volume->Root());
  if (index.Find({id, nullptr, true}, volume->MountPoint()) != path) Fail("a pass for " + path);
  return index.OpenedFolders();
}

std::vector<std::filesystem::path> FoldersIn(const std::filesystem::path& folder) {
  std::vector<std::filesystem::path> folders;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) {
    if (entry.is_directory()) folders.push_back(entry.path());
  }
  return folders;
}

// The folder that a first pass comes upon last: down from the top, always into the folder whose own
// folders are found last.
std::filesystem::path LastFolder(const files::VolumePointer& volume) {
  std::filesystem::path last = volume->MountPoint();
  for (;;) {
    const auto folders = FoldersIn(last);
    if (folders.empty()) return last;
    std::filesystem::path next = folders.front();
    std::uint64_t most = 0;
    for (const auto& folder : folders) {
      const auto inner = FoldersIn(folder);
      if (inner.empty()) continue;
      const std::uint64_t opened = FoldersOpenedFor(volume, inner.front());
      if (opened > most) {
        most = opened;
        next = folder;
      }
    }
    last = next;
  }
}

bool MayRunWithoutPrivilege(const std::string& program) {
  return InAProcess([&]() -> std::vector<double> {
           DropPrivilege();
           return {access(program.c_str(), X_OK) == 0 ? 1.0 : 0.0};
         })[0] == 1.0;
}

// In milliseconds: the answer about the item; in MiB: what the service has more behind it.
std::vector<double> FindCold(const Settings& settings, const Item& item) {
  DropPrivilege();
  Server service(settings.service, {std::to_string(getpid())});
  const Question volume = QuestionOf(protocol::kRequestGetHFSVolumeName, item);
  service.Ask(volume.request, volume.answerSize);
  const Question question = QuestionOf(protocol::kRequestSetFileRefFromFSSpec, item);
  const double memoryBefore = service.Memory("VmRSS");
  const double begin = Now();
  const std::string answer(service.Ask(question.request, question.answerSize));
  const double end = Now();
  if (answer[0] != 1 || answer.find(item.path) == std::string::npos) Fail("a cold node id");
  return {(end - begin) / kMicrosecondsInAMillisecond,
          (service.Memory("VmRSS") - memoryBefore) / 1024};
}

std::vector<double> WalkCold(const std::filesystem::path& top, long entries) {
  DropPrivilege();
  const double begin = Now();
  const long seen = WalkBare(AT_FDCWD, top.c_str());
  const double end = Now();
  if (seen != entries) Fail("a walk");
  return {(end - begin) / kMicrosecondsInAMillisecond};
}

std::vector<double> Search(const std::string& program, const std::filesystem::path& top,
                           std::uint64_t inode) {
  DropPrivilege();
  const double time = TimeOf({program, top, "-xdev", "-inum", std::to_string(inode)});
  return {time / kMicrosecondsInAMillisecond};
}

std::vector<Figure> Cold(const Settings& settings) {
  const std::string what = "node id, cold, no privilege";
  if (!MayRunWithoutPrivilege(settings.service)) {
    return {Skipped(what, "not everybody may run " + settings.service)};
  }
  const BigTree& big = TheBigTree(settings.entries);
  if (!big.volume.IsMounted()) return {Skipped(what, "mounting is not permitted")};
  const auto& top = big.volume.Path();
  const auto volume = files::MountTable::OfThisProcess().OfPath(top.string());
  const auto last = LastFolder(volume);
  const std::string file = std::filesystem::directory_iterator(last)->path();
  const Item item = AskAbout(settings.service, file);
  const auto folder = files::ReadItem(AT_FDCWD, last.c_str());

  std::vector<double> cold;
  std::vector<double> memory;
  std::vector<double> walks;
  struct Peer {
    std::string program;
    std::vector<double> times;
  };
  std::vector<Peer> peers{{"find", {}}, {"bfs", {}}};
  for (int run = 0; run < settings.runs; ++run) {
    const auto found = InAProcess([&] { return FindCold(settings, item); });
    cold.push_back(found[0]);
    memory.push_back(found[1]);
    walks.push_back(InAProcess([&] { return WalkCold(top, settings.entries); })[0]);
    for (Peer& peer : peers) {
      if (!IsOnPath(peer.program)) continue;
      const auto search = [&] { return Search(peer.program, top, folder->inode); };
      peer.times.push_back(InAProcess(search)[0]);
    }
  }

  std::vector<Figure> figures{AtMost(1.2, RatioOf(what + " / bare walk", cold, walks, "ms"))};
  for (const auto& [program, times] : peers) {
    std::string name = what;
    name.append(" / ").append(program).append(" -inum");
    figures.push_back(times.empty() ? Skipped(name, program + " is not installed")
                                    : AtMost(0.7, RatioOf(name, cold, times, "ms")));
  }
  figures.push_back(AtMost(16, {"memory left behind by that pass", Median(memory), "MiB", "", {}}));
  return figures;
}

// --- Cold, privileged, ext4 ---------------------------------------------------------------------

// The way back from the record of a file in each of some folders, spread over the tree of a volume.
std::vector<Question> QuestionsAbout(const Tree& tree, const Item& item,
                                     const files::ItemReference& root) {
  constexpr std::size_t kMost = 1000;
  const std::size_t step = std::max<std::size_t>(tree.files.size() / kMost, 1);
  std::vector<Question> questions;
  std::filesystem::path asked;
  for (std::size_t i = 0; i < tree.files.size(); i += step) {
    const auto& path = tree.files[i];
    if (path.parent_path() == asked) continue;
    asked = path.parent_path();
    const auto folder = files::ReadItem(AT_FDCWD, asked.c_str());
    if (!folder) Fail(asked);
    Item other = item;
    other.path = path;
    const auto id = static_cast<std::int32_t>(files::NodeIDOf(*folder, root));
    other.record = test::Record(item.volume, id, path.filename().string());
    questions.push_back(QuestionOf(protocol::kRequestSetFileRefFromFSSpec, other));
  }
  return questions;
}

double MedianRoundTrip(Server& service, const std::vector<Question>& questions) {
  std::vector<double> times;
  for (const auto& [request, answerSize] : questions) {
    const double begin = Now();
    const std::string_view answer = service.Ask(request, answerSize);
    times.push_back(Now() - begin);
    if (answer[0] != 1 || !answer.ends_with(protocol::kTrailer)) Fail("an answer about a node id");
  }
  return Median(times);
}

std::vector<Figure> Privileged(const Settings& settings) {
  const std::string what = "node id, cold, privileged, ext4 / warm";
  if (!test::EnterOwnMountNamespace()) return {Skipped(what, "mounting is not permitted")};
  // As many inodes as there are entries, with room for the blocks of their folders; sparse.
  const auto inodes = static_cast<std::uintmax_t>(settings.entries) + 10'000;
  test::FileSystemImage image("ext4", {"mkfs.ext4", "-q", "-F", "-N", std::to_string(inodes)},
                              (std::uintmax_t{64} << 20) + inodes * 2048);
  if (!image.IsMade()) return {Skipped(what, "mkfs.ext4 is not installed")};
  if (!image.Mount("noatime")) return {Skipped(what, "no loop device")};
  const Tree tree = MakeTree(image.Path(), settings.entries);
  const Item item = AskAbout(settings.service, tree.files.front());
  const auto root = files::ReadItem(AT_FDCWD, image.Path().c_str());
  const auto questions = QuestionsAbout(tree, item, *root);

  std::vector<double> cold;
  std::vector<double> warm;
  for (int run = 0; run < settings.runs; ++run) {
    Server service(settings.service, {std::to_string(getpid())});
    const Question volume = QuestionOf(protocol::kRequestGetHFSVolumeName, item);
    service.Ask(volume.request, volume.answerSize);
    cold.push_back(MedianRoundTrip(service, questions));
    warm.push_back(MedianRoundTrip(service, questions));
  }
  return {AtMost(3, RatioOf(what, cold, warm, "µs"))};
}

}  // namespace

std::vector<Measure> NodeIDMeasures() {
  return {{"warm", Warm}, {"cold", Cold}, {"privileged", Privileged}};
}

}  // namespace tallowmere::benchmark
