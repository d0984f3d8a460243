// What conversions between paths, records and HFS paths take and give.
//
// A conversion resolves the way to an item, looks once whether the item exists, and gives an error
// instead of an answer that would not lead back:
//
// | Asked about                                             | Outcome of the error |
// |---------------------------------------------------------|----------------------|
// | what has neither an item nor a folder for one           | kNothing             |
// | what is below a file, or a link that leads nowhere      | kNothing             |
// | what is in a kernel interface such as /proc             | kNotAVolume          |
// | a new name outside Mac Roman, above 63 of its bytes, or |                      |
// | in a spelling that comes back as another one            | kInvalid             |
// | the same where the other one exists                     | kAmbiguous           |
// | an HFS name that is empty, "." or "..", or has ':'      | kInvalid             |
// | an HFS path above 511 bytes, or to convert, above 255   | kInvalid             |
// | an HFS path that names no volume                        | kInvalid             |
#pragma once

#include <tallowmere/Outcome.h>
#include <tallowmere/Result.h>

namespace tallowmere {

template <class T>
struct Converted {
  T value;
  Outcome outcome;  // kFound or kNew

  bool operator==(const Converted&) const = default;
};

template <class T>
using Conversion = Result<Converted<T>>;

struct ConvertOptions {
  // With it, a path may be relative to the current folder, and links, "." and ".." in front of its
  // last name are followed; the last name itself, a link or not, is the item. Slashes at the end do
  // not count, and '~' is a plain character. Without it a path must be absolute and is sent as it
  // is; nothing is there where a link is in the place of the item's folder.
  bool resolve = true;
};

}  // namespace tallowmere
