// Which files are alias files, and what they say.
//
// A regular file is one when its data begin as those of a bookmark; or when its Finder flags say
// so, its resource fork has a resource of type 'alis', and its data are empty: a fork that outlived
// its alias must not redirect the file that took the name. Where both hold the bookmark counts, and
// the record only if that is broken.
#pragma once

#include <optional>

#include "catalog/Moment.h"
#include "formats/Recognition.h"
#include "kernel/Result.h"

namespace tallowmere::aliases {

// The alias is there, and what it says does not fit together.
inline constexpr kernel::Error kBroken{-5};

struct AliasFile {
  bool isAlias = false;
  // kBroken where it is none, too; the kernel's error where what counts may not be read.
  kernel::Result<formats::AliasContent> content = kBroken;
};

// What a file is; the kernel's error where it may not be read. Of a file that is no alias, mostly
// its beginning is read and nothing else.
kernel::Result<AliasFile> ReadAliasFile(const catalog::Look& file);

}  // namespace tallowmere::aliases
