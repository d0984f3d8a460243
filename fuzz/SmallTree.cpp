#include "fuzz/SmallTree.h"

#include <CoreServices/CoreServices.h>
#include <fcntl.h>
#include <sys/mount.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>

#include "fuzz/Check.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::fuzz {
namespace {

// Inode numbers below 16 are not used as ids.
constexpr int kSpentInodes = 20;

constexpr int kDepth = 12;
constexpr std::size_t kDeepNameLength = 60;

// The directories to return to, and the tree's root. They stay open for the process's lifetime.
struct Folders {
  int outside;
  int current;
  int tree;
};
Folders gFolders;

int OpenFolder(const char* path) {
  const int folder = open(path, O_PATH | O_DIRECTORY | O_CLOEXEC);
  Check(folder >= 0);
  return folder;
}

void ChangeRoot(int root, int current) {
  Check(fchdir(root) == 0 && chroot(".") == 0 && fchdir(current) == 0);
}

// Leaves the tree, because findings are stored outside.
void LeaveSmallTree() {
  if (fchdir(gFolders.outside) != 0 || chroot(".") != 0 || fchdir(gFolders.current) != 0) {
    std::fputs("cannot leave the tree to store the finding\n", stderr);
  }
}

void SpendInodes(const test::TemporaryFolder& tree, const std::string& folder) {
  for (int i = 0; i < kSpentInodes; ++i) unlink(tree.MakeFile(folder + "spent").c_str());
}

void MakeItems(const test::TemporaryFolder& tree) {
  SpendInodes(tree, "");
  tree.MakeFolder("folder/below");
  tree.MakeFile("folder/file");
  tree.MakeFile("folder/" + std::string(80, 'n') + ".aif");
  tree.MakeFile("folder/\xE6\x97\xA5\xE6\x9C\xAC.txt");
  tree.MakeFile("folder/\xFFnot UTF-8\xC3");
  tree.MakeFile("folder/a:b");
  tree.MakeFile("folder/name#1F.aif");
  tree.MakeFolder("accents");
  tree.MakeFile("accents/\xC3\xA9");   // precomposed
  tree.MakeFile("accents/e\xCC\x81");  // and decomposed
  tree.MakeFolder("accents/Ko\xCC\x88ln");
  tree.MakeFile("accents/Ko\xCC\x88ln/inside");
  tree.MakeLink("link", "folder");
  tree.MakeLink("folder/up", "..");
  tree.MakeLink("dangling", "missing");
  tree.MakeLink("loop", "loop");
  tree.MakeFile("...");
  tree.MakeFile(" \n~");
  std::string deep;
  for (int i = 0; i < kDepth; ++i) {
    deep += std::string(kDeepNameLength, static_cast<char>('a' + i));
    tree.MakeFolder(deep);
    deep.push_back('/');
  }
  tree.MakeFile(deep + "item");
  tree.MakeFolder("etc");
  tree.MakeFile("etc/passwd", "root:x:0:0::/folder:/bin/sh\nann:x:9:9::/accents:/bin/sh\n");
}

void MakeSecondVolume(const test::TemporaryFolder& tree) {
  SpendInodes(tree, "Second/");
  tree.MakeFolder("Second/folder");
  tree.MakeFile("Second/folder/file");
  tree.MakeFile("Second/only here");
  tree.MakeLink("Second/out", "/folder");
}

// Makes only the mount table of /proc available in the tree; the rest of /proc is never the same.
bool ShowMountTable(const test::TemporaryFolder& tree) {
  tree.MakeFolder("proc/self");
  const std::string table = tree.MakeFile("proc/self/mountinfo");
  return mount("/proc/self/mountinfo", table.c_str(), nullptr, MS_BIND, nullptr) == 0;
}

std::int16_t NumberAtIndex(std::uint32_t index) {
  FSVolumeInfoParam volume{};
  volume.volumeIndex = index;
  Check(PBGetVolumeInfoSync(&volume) == noErr);
  return volume.ioVRefNum;
}

}  // namespace

void MakeSmallTree() {
  static const test::TemporaryFolder place;
  const bool isOurs = test::EnterOwnMountNamespace();
  static const test::ScopedMount root("none", place.Path(), "tmpfs");
  if (!isOurs || !root.IsMounted()) {
    std::fputs("Skipped: this user may not mount.\n", stderr);
    std::exit(kSkipped);
  }
  MakeItems(place);
  static const test::ScopedMount second("none", place.MakeFolder("Second"), "tmpfs");
  MakeSecondVolume(place);
  Check(ShowMountTable(place));
  gBeforeFinding = LeaveSmallTree;
  gFolders = {OpenFolder("/"), OpenFolder("."), OpenFolder(place.Path().c_str())};
}

InsideSmallTree::InsideSmallTree() {
  ChangeRoot(gFolders.tree, gFolders.tree);
}

InsideSmallTree::~InsideSmallTree() {
  ChangeRoot(gFolders.outside, gFolders.current);
}

std::int16_t VolumeNumberHere(std::int16_t number) {
  if (number != -1 && number != -2) return number;
  static const std::int16_t numbers[] = {NumberAtIndex(1), NumberAtIndex(2)};
  return numbers[-1 - number];
}

}  // namespace tallowmere::fuzz

// The sanitizers call this before they end the program.
extern "C" void __asan_on_error() {
  tallowmere::fuzz::gBeforeFinding();
}
extern "C" void __ubsan_on_report() {
  tallowmere::fuzz::gBeforeFinding();
}
