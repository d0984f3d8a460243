// Alias files and where they lead.

#include <CoreServices/CoreServices.h>

#include <string>

#include "aliases/AliasFile.h"
#include "aliases/Resolution.h"
#include "calls/Process.h"
#include "calls/References.h"
#include "calls/ResultCodes.h"
#include "catalog/Finding.h"
#include "foundation/NoThrow.h"
#include "foundation/PathText.h"

using namespace tallowmere;
using namespace tallowmere::calls;

namespace {

// Of a chain: a longer one counts as a ring.
constexpr int kMostSteps = 64;

// The item of a reference in the folder that holds it now. kNoVolume for what is on none.
kernel::Result<catalog::Look> LookAt(catalog::Moment& moment, const kernel::Item& reference) {
  if (const catalog::Look* const look = moment.LookFor(reference)) return *look;
  const std::string last = catalog::LastPathOf(moment, reference);
  if (!last.empty()) {
    auto look = catalog::LookAgain(moment, reference, last);
    if (look || look.Error() == kernel::kNoVolume) return look;
  }
  const auto path = catalog::FindPathOf(moment, reference);
  if (!path) return path.Error();
  return catalog::LookAgain(moment, reference, *path);
}

// The same for an item that was just found.
kernel::Result<catalog::Look> LookAt(catalog::Moment& moment, const catalog::Sighting& seen) {
  const auto folder = moment.HoldParentOf(seen.path);
  if (!folder) return folder.Error();
  auto look = moment.LookUp(*folder, *foundation::LastComponent(seen.path));
  if (look && !kernel::HaveSameNumbers(look->Item(), seen.item)) return kernel::kNotThere;
  return look;
}

// Follows an alias file to its target, and as long as that is one too.
class Chain {
 public:
  explicit Chain(catalog::Moment& moment) : mMoment(moment) {}

  bool WasAliased() const { return mWasAliased; }

  // The last target, or with `isWhole` false the first; nullopt when the file is no alias.
  kernel::Result<std::optional<catalog::Sighting>> Follow(const catalog::Look& file, bool isWhole) {
    std::optional<catalog::Sighting> target;
    catalog::Look at = file;
    for (int step = 0; step <= kMostSteps; ++step) {
      const auto read = aliases::ReadAliasFile(at);
      if (!read) return read.Error();
      if (!read->isAlias) return target;
      mWasAliased = true;
      if (step == kMostSteps) break;
      if (!read->content) return read->content.Error();
      const auto resolved = aliases::Resolve(mMoment, &at, aliases::TargetOf(*read->content));
      if (!resolved) return resolved.Error();
      target = resolved->item;
      if (!isWhole || !kernel::IsRegularFile(target->item)) return target;
      const auto next = LookAt(mMoment, *target);
      if (!next) return next.Error();
      at = *next;
    }
    return kernel::kNotThere;  // too long, as a ring is
  }

 private:
  catalog::Moment& mMoment;
  bool mWasAliased = false;
};

struct Answer {
  OSErr code;
  bool targetIsFolder;
  bool wasAliased;
};

Answer Resolve(catalog::Moment& moment, FSRef& item, const kernel::Item& reference, bool isWhole) {
  const auto file = LookAt(moment, reference);
  // What is on no volume is no alias.
  if (!file && file.Error() == kernel::kNoVolume) return {noErr, false, false};
  if (!file) return {ResultCodeOf(file.Error()), false, false};
  Chain chain(moment);
  const auto target = chain.Follow(*file, isWhole);
  if (!target) return {ResultCodeOfAlias(target.Error()), false, chain.WasAliased()};
  if (!*target) return {noErr, false, false};
  item = ReferenceTo(moment, **target);
  return {noErr, kernel::IsFolder((*target)->item), true};
}

}  // namespace

OSErr FSResolveAliasFile(FSRef* item, Boolean resolveAliasChains, Boolean* targetIsFolder,
                         Boolean* wasAliased) {
  const auto reference = Unpack(item);
  if (!reference) return fnfErr;
  Answer answer{noErr, kernel::IsFolder(*reference), false};
  if (kernel::IsRegularFile(*reference)) {
    answer.code = foundation::OrError([&] {
      return InMoment([&](catalog::Moment& moment) {
        answer = Resolve(moment, *item, *reference, resolveAliasChains != 0);
        return answer.code;
      });
    });
  }
  if (targetIsFolder != nullptr) *targetIsFolder = answer.targetIsFolder;
  if (wasAliased != nullptr) *wasAliased = answer.wasAliased;
  return answer.code;
}

OSErr FSResolveAliasFileWithMountFlags(FSRef* item, Boolean resolveAliasChains,
                                       Boolean* targetIsFolder, Boolean* wasAliased,
                                       unsigned long) {
  return FSResolveAliasFile(item, resolveAliasChains, targetIsFolder, wasAliased);
}
