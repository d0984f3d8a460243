#include "catalog/HandleLookup.h"

#include <optional>

#include "kernel/FileHandle.h"
#include "kernel/Paths.h"
#include "kernel/Xfs.h"
#include "names/NodeIDs.h"

namespace tallowmere::catalog {
namespace {

// The file system's answer about one handle.
enum class Reply { kOpened, kGone, kUnknown };

// Asks one file system, through its root folder.
class Questions {
 public:
  explicit Questions(const volumes::Volume& volume)
      : mVolume(volume),
        mSpot(kernel::AtPath(volume.MountPoint().c_str())),
        mRoot(kernel::OpenForReading(mSpot)) {}

  // An item outside the mount is refused, which does not mean that it is gone.
  bool CanBeComplete() const { return mVolume.Listed().MountPoints().size() == 1; }

  Reply Open(const kernel::FileHandle& handle, std::vector<Sighting>& opened) const {
    if (!mRoot) return Reply::kUnknown;
    const auto item = kernel::OpenByHandle(mRoot->Get(), handle);
    if (!item) return item.Error().number == ESTALE ? Reply::kGone : Reply::kUnknown;
    const auto status = kernel::ReadStatus(kernel::AtOpen(item->Get()));
    if (!status) return Reply::kUnknown;
    // It has no name any more, and keeps its number for as long as somebody has it open.
    if (status->links == 0) return Reply::kGone;
    const auto path = kernel::PathOfDescriptor(*item);
    if (!path) return Reply::kUnknown;
    opened.push_back({*path, status->item});
    return Reply::kOpened;
  }

  Reply OpenByNumber(const names::Candidate& candidate, std::vector<Sighting>& opened) {
    kernel::HandleNumbers numbers{candidate.inode, SubvolumeOf(candidate), 0};
    if (mVolume.Kind().byNumber == kernel::ByNumber::kInodeAndGeneration) {
      if (!mRoot) return Reply::kUnknown;
      const auto generation = kernel::ReadXfsGeneration(mRoot->Get(), candidate.inode);
      if (!generation) {
        return generation.Error() == kernel::kNotThere ? Reply::kGone : Reply::kUnknown;
      }
      numbers.generation = *generation;
    }
    const auto handle = HandleOf(numbers);
    return handle ? Open(*handle, opened) : Reply::kUnknown;
  }

 private:
  std::uint64_t SubvolumeOf(const names::Candidate& candidate) const {
    return candidate.subvolume != 0 ? candidate.subvolume : mVolume.IDRule().root.subvolume;
  }

  std::optional<kernel::FileHandle> HandleOf(const kernel::HandleNumbers& numbers) {
    if (mRootHandle.size == 0) mRootHandle = kernel::HandleAt(mSpot);
    return kernel::HandleOf(numbers, mRootHandle, mVolume.Root().inode);
  }

  const volumes::Volume& mVolume;
  kernel::Spot mSpot;
  kernel::Result<kernel::Descriptor> mRoot;
  kernel::FileHandle mRootHandle{};
};

}  // namespace

HandleAnswer AskForReference(const volumes::Volume& volume, const kernel::Item& reference) {
  HandleAnswer answer{};
  if (IsProvedByPlace(reference)) return answer;
  Questions questions(volume);
  Reply reply = Reply::kUnknown;
  if (reference.handle.size != 0) {
    reply = questions.Open(reference.handle, answer.opened);
    answer.isComplete = volume.Kind().findsAllByHandle;
  } else if (volume.Kind().byNumber != kernel::ByNumber::kNone &&
             reference.device == volume.Root().device) {
    reply = questions.OpenByNumber({reference.inode, 0}, answer.opened);
    answer.isComplete = true;
  }
  answer.isComplete = answer.isComplete && reply != Reply::kUnknown && questions.CanBeComplete();
  return answer;
}

HandleAnswer AskForID(const volumes::Volume& volume, std::uint32_t id) {
  HandleAnswer answer{};
  if (volume.Kind().byNumber == kernel::ByNumber::kNone) return answer;
  const auto candidates = names::CandidatesOf(id, volume.IDRule(), volume.HighestInode());
  if (!candidates) return answer;
  Questions questions(volume);
  answer.isComplete = volume.NumbersIdentifyItems() && questions.CanBeComplete();
  for (const names::Candidate& candidate : *candidates) {
    if (questions.OpenByNumber(candidate, answer.opened) == Reply::kUnknown) {
      answer.isComplete = false;
      break;
    }
  }
  return answer;
}

}  // namespace tallowmere::catalog
