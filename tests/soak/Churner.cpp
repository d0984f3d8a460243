#include "Churner.h"

#include <fcntl.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <utility>

namespace tallowmere::soak {
namespace {

// The service makes up ids for items with smaller inode numbers; the tree uses none of them.
constexpr int kFirstInodes = 20;

constexpr std::size_t kMostFolders = 6;

[[noreturn]] void StopFor(const std::string& what) {
  std::fprintf(stderr, "soak: %s: %s\n", what.c_str(), std::strerror(errno));
  std::abort();
}

std::uint64_t InodeOf(const std::string& path) {
  struct stat about {};
  if (lstat(path.c_str(), &about) != 0) StopFor(path);
  return about.st_ino;
}

// Returns the volume's number: the negated mount id.
int NumberOf(const std::string& place) {
  struct statx about {};
  if (statx(AT_FDCWD, place.c_str(), 0, STATX_MNT_ID, &about) != 0) StopFor(place);
  return -static_cast<int>(about.stx_mnt_id);
}

int MakeFileAt(const std::string& path) {
  const int descriptor = open(path.c_str(), O_CREAT | O_EXCL | O_WRONLY | O_CLOEXEC, 0644);
  return descriptor < 0 ? -1 : close(descriptor);
}

// Files that use up the inode numbers that cannot be node ids.
std::string UsedUp(const std::string& folder, int number) {
  return folder + "/used up " + std::to_string(number);
}
void UseUpFirstInodes(const std::string& folder) {
  for (int i = 0; i < kFirstInodes; ++i) MakeFileAt(UsedUp(folder, i));
}

int Exchange(const std::string& first, const std::string& second) {
  return renameat2(AT_FDCWD, first.c_str(), AT_FDCWD, second.c_str(), RENAME_EXCHANGE);
}

// A server in user space can lose sight of an item for a moment, as fuse-overlayfs did once.
bool IsDone(const std::function<int()>& call) {
  constexpr int kMostTries = 10;
  for (int i = 0; i < kMostTries; ++i) {
    if (call() == 0) return true;
    if (errno != ENOENT) return false;
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  return false;
}

void Remove(State& state, const Entry& entry) {
  Entry* const found = std::find(state.entries.data(), state.entries.data() + state.count, entry);
  *found = state.entries[--state.count];
}
void Add(State& state, const Entry& entry) {
  state.entries.at(state.count++) = entry;
}

bool IsSlot(NameIndex name) {
  return name >= kFirstSlot && name < kEndOfSlots;
}
bool IsOuter(const Entry& entry) {
  return entry.folder == kMainRoot && IsSlot(entry.name);
}

}  // namespace

// --- Life -------------------------------------------------------------------------------------

Churner::Churner(std::string folder, std::uint64_t seed, unsigned pause)
    : mFolder(std::move(folder)),
      mRandom(seed),
      mPause(pause),
      mHistory(FirstState()),
      mCounts(Kinds().size()) {
  for (NameIndex slot = kFirstSlot; slot < kFirstSlot + 4; ++slot) MakeFolder();
  for (int i = 0; i < 30; ++i) MakeFile();
}

Churner::~Churner() {
  Stop();
}

State Churner::FirstState() {
  UseUpFirstInodes(mFolder);
  mCanExchange = Exchange(UsedUp(mFolder, 0), UsedUp(mFolder, 1)) == 0;
  State state;
  state.main = {kMainRoot, NumberOf(mFolder)};
  const std::string place = mFolder + "/" + NameAt(kVolumePlace).linuxName;
  if (mkdir(place.c_str(), 0755) != 0) StopFor(place);
  Add(state, {kMainRoot, mNextNode++, InodeOf(place), Kind::kFolder, kVolumePlace, 0, kNoName});
  return state;
}

void Churner::Start() {
  mThread = std::thread([this] { Run(); });
}

void Churner::Stop() {
  mIsToStop = true;
  if (mThread.joinable()) mThread.join();
}

const std::vector<const char*>& Churner::Kinds() {
  static const std::vector<const char*> kinds{"file made",
                                              "file removed",
                                              "file moved or replaced",
                                              "file linked",
                                              "link made",
                                              "folder moved",
                                              "folders exchanged",
                                              "folder replaced by a link",
                                              "outer link",
                                              "link removed",
                                              "subfolder moved",
                                              "folder made",
                                              "folder removed",
                                              "volume mounted or unmounted"};
  return kinds;
}

void Churner::Run() {
  while (!mIsToStop) {
    const std::size_t kind = Below(Kinds().size());
    if (!ChangeSomething(kind)) continue;
    ++mCounts[kind];
    if (mPause != 0) std::this_thread::sleep_for(std::chrono::microseconds(Below(2 * mPause)));
  }
}

bool Churner::ChangeSomething(std::size_t kind) {
  using Step = bool (Churner::*)();
  static constexpr Step kSteps[] = {
      &Churner::MakeFile,        &Churner::RemoveFile,          &Churner::MoveFile,
      &Churner::LinkFile,        &Churner::MakeInnerLink,       &Churner::MoveFolder,
      &Churner::ExchangeFolders, &Churner::ReplaceFolderByLink, &Churner::MakeOuterLink,
      &Churner::RemoveLink,      &Churner::MoveSubfolder,       &Churner::MakeFolder,
      &Churner::RemoveFolder,    &Churner::MountOrUnmount};
  return (this->*kSteps[kind])();
}

void Churner::Change(const State& next, const std::function<int()>& call) {
  mHistory.Begin(next);
  if (!IsDone(call)) StopFor("a change failed");
  mHistory.Reach();
}

// Records the inode number before the state counts as reached. REQUIRES: the new entry is last.
void Churner::Make(const State& next, const std::string& path, const std::function<int()>& call) {
  State& state = mHistory.Begin(next);
  if (!IsDone(call)) StopFor(path);
  state.entries[state.count - 1].inode = InodeOf(path);
  mHistory.Reach();
}

// --- Looking ----------------------------------------------------------------------------------

const Entry& Churner::EntryOf(Node folder) const {
  return *std::find_if(Now().begin(), Now().end(),
                       [&](const Entry& e) { return e.node == folder; });
}

bool Churner::IsOnOther(Node folder) const {
  while (folder != kMainRoot && folder != Now().other.root) folder = EntryOf(folder).folder;
  return folder != kMainRoot;
}

std::string Churner::PathOf(Node folder) const {
  std::string path;
  for (; folder != kMainRoot && folder != Now().other.root; folder = EntryOf(folder).folder) {
    path = std::string("/").append(NameAt(EntryOf(folder).name).linuxName).append(path);
  }
  if (folder != kMainRoot) path = std::string("/").append(NameAt(kVolumePlace).linuxName) + path;
  return mFolder + path;
}

std::string Churner::PathOf(Node folder, NameIndex name) const {
  return PathOf(folder) + "/" + NameAt(name).linuxName;
}

const Entry* Churner::AnyEntry(const std::function<bool(const Entry&)>& isWanted) {
  const State& now = Now();
  const std::size_t start = Below(now.count);
  for (std::size_t i = 0; i < now.count; ++i) {
    const Entry& entry = now.entries[(start + i) % now.count];
    if (isWanted(entry)) return &entry;
  }
  return nullptr;
}

NameIndex Churner::AnyFileName() {
  return static_cast<NameIndex>(kFirstFile + Below(kEndOfFiles - kFirstFile));
}

// --- Changes: each is false when there is nothing that it could change -------------------------

bool Churner::MakeFile() {
  if (!HasRoom()) return false;
  const State& now = Now();
  Node folder = kMainRoot;
  const std::size_t which = Below(8);
  if (which == 0 && now.other.root != kNoNode) {
    folder = now.other.root;
  } else if (which > 1) {
    const Entry* const entry =
        AnyEntry([](const Entry& e) { return e.kind == Kind::kFolder && e.name != kVolumePlace; });
    if (entry == nullptr) return false;
    folder = entry->node;
  }
  const NameIndex name = AnyFileName();
  if (now.Find(folder, name) != nullptr) return false;
  State next = now;
  const Node node = mNextNode++;
  Add(next, {folder, node, 0, Kind::kFile, name, 0, kNoName});
  const std::string path = PathOf(folder, name);
  Make(next, path, [&] { return MakeFileAt(path); });
  return true;
}

bool Churner::RemoveAny(Kind kind) {
  const Entry* const entry = AnyEntry([kind](const Entry& e) { return e.kind == kind; });
  if (entry == nullptr) return false;
  const std::string path = PathOf(entry->folder, entry->name);
  State next = Now();
  Remove(next, *entry);
  Change(next, [&] { return unlink(path.c_str()); });
  return true;
}

bool Churner::RemoveFile() {
  if (Now().count < 40 && Below(3) != 0) return false;
  return RemoveAny(Kind::kFile);
}

// A rename between two names of the same item has no effect.
bool Churner::MoveFile() {
  const State& now = Now();
  const Entry* const entry = AnyEntry([](const Entry& e) { return e.kind == Kind::kFile; });
  if (entry == nullptr) return false;
  Node folder = kMainRoot;
  const Entry* const into = AnyEntry([](const Entry& e) { return e.kind == Kind::kFolder; });
  if (Below(6) != 0) folder = into->node;
  if (folder != kMainRoot && into->name == kVolumePlace) folder = now.other.root;
  if (folder == kNoNode || IsOnOther(entry->folder) != IsOnOther(folder)) return false;
  const NameIndex name = AnyFileName();
  const Entry* const replaced = now.Find(folder, name);
  if (replaced != nullptr && replaced->node == entry->node) return false;
  State next = now;
  if (replaced != nullptr) Remove(next, *replaced);
  Entry moved = *entry;
  Remove(next, *entry);
  moved.folder = folder;
  moved.name = name;
  Add(next, moved);
  const std::string from = PathOf(entry->folder, entry->name);
  const std::string to = PathOf(folder, name);
  Change(next, [&] { return rename(from.c_str(), to.c_str()); });
  return true;
}

bool Churner::LinkFile() {
  if (!HasRoom()) return false;
  const Entry* const entry =
      AnyEntry([&](const Entry& e) { return e.kind == Kind::kFile && !IsOnOther(e.folder); });
  const Entry* const into = AnyEntry([&](const Entry& e) {
    return e.kind == Kind::kFolder && e.name != kVolumePlace && !IsOnOther(e.folder);
  });
  if (entry == nullptr || into == nullptr) return false;
  const NameIndex name = AnyFileName();
  if (Now().Find(into->node, name) != nullptr) return false;
  State next = Now();
  Entry linked = *entry;
  linked.folder = into->node;
  linked.name = name;
  Add(next, linked);
  const std::string from = PathOf(entry->folder, entry->name);
  const std::string to = PathOf(into->node, name);
  Change(next, [&] { return link(from.c_str(), to.c_str()); });
  return true;
}

// Like a file, a link has no inode number before it exists.
bool Churner::MakeInnerLink() {
  if (!HasRoom()) return false;
  const Entry* const into =
      AnyEntry([](const Entry& e) { return e.kind == Kind::kFolder && e.name != kVolumePlace; });
  if (into == nullptr || Now().Find(into->node, kInnerLink) != nullptr) return false;
  State next = Now();
  const auto target = static_cast<NameIndex>(Below(kEndOfSlots));
  const NameIndex inner = Below(2) == 0 ? kNoName : AnyFileName();
  Add(next, {into->node, mNextNode++, 0, Kind::kLink, kInnerLink, target, inner});
  std::string text = PathOf(kMainRoot, target);
  if (inner != kNoName) text += std::string("/") + NameAt(inner).linuxName;
  const std::string path = PathOf(into->node, kInnerLink);
  Make(next, path, [&] { return symlink(text.c_str(), path.c_str()); });
  return true;
}

bool Churner::MoveFolder() {
  const Entry* const entry =
      AnyEntry([](const Entry& e) { return IsOuter(e) && e.kind == Kind::kFolder; });
  const auto slot = static_cast<NameIndex>(kFirstSlot + Below(kEndOfSlots - kFirstSlot));
  if (entry == nullptr || Now().Find(kMainRoot, slot) != nullptr) return false;
  State next = Now();
  Entry moved = *entry;
  Remove(next, *entry);
  moved.name = slot;
  Add(next, moved);
  const std::string from = PathOf(kMainRoot, entry->name);
  const std::string to = PathOf(kMainRoot, slot);
  Change(next, [&] { return rename(from.c_str(), to.c_str()); });
  return true;
}

// May also exchange a folder and a link, if the link's target still precedes it.
bool Churner::ExchangeFolders() {
  if (!mCanExchange) return false;
  const Entry* const first = AnyEntry([](const Entry& e) { return IsOuter(e); });
  if (first == nullptr) return false;
  const Entry* const second =
      AnyEntry([&](const Entry& e) { return IsOuter(e) && e.name != first->name; });
  if (second == nullptr) return false;
  const auto fits = [](const Entry& entry, NameIndex slot) {
    return entry.kind != Kind::kLink || entry.target < slot;
  };
  if (!fits(*first, second->name) || !fits(*second, first->name)) return false;
  State next = Now();
  Entry movedFirst = *first;
  Entry movedSecond = *second;
  Remove(next, *first);
  Remove(next, *second);
  std::swap(movedFirst.name, movedSecond.name);
  Add(next, movedFirst);
  Add(next, movedSecond);
  const std::string one = PathOf(kMainRoot, movedFirst.name);
  const std::string two = PathOf(kMainRoot, movedSecond.name);
  Change(next, [&] { return Exchange(one, two); });
  return true;
}

// Moves the folder to an earlier slot and leaves a link to it.
bool Churner::ReplaceFolderByLink() {
  if (!HasRoom()) return false;
  const Entry* const found =
      AnyEntry([](const Entry& e) { return IsOuter(e) && e.kind == Kind::kFolder; });
  if (found == nullptr || found->name == kFirstSlot) return false;
  const auto slot = static_cast<NameIndex>(kFirstSlot + Below(found->name - kFirstSlot));
  if (Now().Find(kMainRoot, slot) != nullptr) return false;
  const Entry folder = *found;
  State next = Now();
  Remove(next, folder);
  Entry moved = folder;
  moved.name = slot;
  Add(next, moved);
  const std::string from = PathOf(kMainRoot, folder.name);
  const std::string to = PathOf(kMainRoot, slot);
  Change(next, [&] { return rename(from.c_str(), to.c_str()); });
  next = Now();
  Add(next, {kMainRoot, mNextNode++, 0, Kind::kLink, folder.name, slot, kNoName});
  Make(next, from, [&] { return symlink(to.c_str(), from.c_str()); });
  return true;
}

bool Churner::MakeOuterLink() {
  if (!HasRoom()) return false;
  const auto slot = static_cast<NameIndex>(kFirstSlot + Below(kEndOfSlots - kFirstSlot));
  if (Now().Find(kMainRoot, slot) != nullptr) return false;
  State next = Now();
  const auto target = static_cast<NameIndex>(Below(slot));
  Add(next, {kMainRoot, mNextNode++, 0, Kind::kLink, slot, target, kNoName});
  const std::string text = PathOf(kMainRoot, target);
  const std::string path = PathOf(kMainRoot, slot);
  Make(next, path, [&] { return symlink(text.c_str(), path.c_str()); });
  return true;
}

bool Churner::RemoveLink() {
  return RemoveAny(Kind::kLink);
}

bool Churner::MoveSubfolder() {
  const Entry* const entry = AnyEntry(
      [&](const Entry& e) { return e.name == kSubfolder && e.folder != Now().other.root; });
  const Entry* const into =
      AnyEntry([](const Entry& e) { return IsOuter(e) && e.kind == Kind::kFolder; });
  if (entry == nullptr || into == nullptr) return false;
  if (Now().Find(into->node, kSubfolder) != nullptr) return false;
  State next = Now();
  Entry moved = *entry;
  Remove(next, *entry);
  moved.folder = into->node;
  Add(next, moved);
  const std::string from = PathOf(entry->folder, entry->name);
  const std::string to = PathOf(into->node, kSubfolder);
  Change(next, [&] { return rename(from.c_str(), to.c_str()); });
  return true;
}

bool Churner::MakeFolder() {
  if (!HasRoom()) return false;
  const State& now = Now();
  const auto folders = static_cast<std::size_t>(std::count_if(
      now.begin(), now.end(), [](const Entry& e) { return e.kind == Kind::kFolder; }));
  if (folders > kMostFolders) return false;
  Node folder = kMainRoot;
  auto name = static_cast<NameIndex>(kFirstSlot + Below(kEndOfSlots - kFirstSlot));
  const Entry* const outer =
      AnyEntry([](const Entry& e) { return IsOuter(e) && e.kind == Kind::kFolder; });
  if (outer != nullptr && Below(3) == 0) {
    folder = outer->node;
    name = kSubfolder;
  }
  if (now.Find(folder, name) != nullptr) return false;
  State next = now;
  Add(next, {folder, mNextNode++, 0, Kind::kFolder, name, 0, kNoName});
  const std::string path = PathOf(folder, name);
  Make(next, path, [&] { return mkdir(path.c_str(), 0755); });
  return true;
}

// Empties the folder first.
bool Churner::RemoveFolder() {
  if (Below(8) != 0) return false;
  const Entry* const found = AnyEntry([&](const Entry& e) {
    if (e.kind != Kind::kFolder || e.name == kVolumePlace) return false;
    if (e.folder == Now().other.root) return false;
    return std::none_of(Now().begin(), Now().end(), [&](const Entry& inner) {
      return inner.folder == e.node && inner.kind == Kind::kFolder;
    });
  });
  if (found == nullptr) return false;
  const Entry folder = *found;
  const std::string path = PathOf(folder.folder, folder.name);
  for (bool isEmpty = false; !isEmpty;) {
    const Entry* const inner = AnyEntry([&](const Entry& e) { return e.folder == folder.node; });
    isEmpty = inner == nullptr;
    if (isEmpty) break;
    const std::string innerPath = PathOf(inner->folder, inner->name);
    State next = Now();
    Remove(next, *inner);
    Change(next, [&] { return unlink(innerPath.c_str()); });
  }
  State next = Now();
  Remove(next, folder);
  Change(next, [&] { return rmdir(path.c_str()); });
  return true;
}

bool Churner::MountOrUnmount() {
  if (Below(4) != 0) return false;
  return Now().other.root == kNoNode ? Mount() : Unmount();
}

bool Churner::Mount() {
  const std::string place = PathOf(kMainRoot, kVolumePlace);
  State next = Now();
  next.other.root = mNextNode++;
  State& state = mHistory.Begin(next);
  if (mount("none", place.c_str(), "tmpfs", 0, "") != 0) StopFor(place);
  state.other.number = NumberOf(place);
  mHistory.Reach();
  UseUpFirstInodes(place);
  next = Now();
  Add(next, {next.other.root, mNextNode++, 0, Kind::kFolder, kSubfolder, 0, kNoName});
  const std::string path = place + "/" + NameAt(kSubfolder).linuxName;
  Make(next, path, [&] { return mkdir(path.c_str(), 0755); });
  return true;
}

bool Churner::Unmount() {
  State next = Now();
  std::size_t kept = 0;
  std::vector<Node> gone{next.other.root};
  for (const Entry& entry : Now()) {
    if (entry.folder == next.other.root && entry.kind == Kind::kFolder) gone.push_back(entry.node);
  }
  for (const Entry& entry : Now()) {
    if (std::find(gone.begin(), gone.end(), entry.folder) == gone.end())
      next.entries[kept++] = entry;
  }
  next.count = kept;
  next.other.root = kNoNode;
  const std::string place = PathOf(kMainRoot, kVolumePlace);
  Change(next, [&] { return umount2(place.c_str(), MNT_DETACH); });
  return true;
}

}  // namespace tallowmere::soak
