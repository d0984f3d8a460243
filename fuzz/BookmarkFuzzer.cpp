// Bookmarks: arbitrary bytes, as they are and as the data after a well-formed header.
#include <string>

#include "aliases/Target.h"
#include "formats/Bookmark.h"
#include "fuzz/Check.h"
#include "names/HFSNames.h"
#include "support/OldFormats.h"

namespace tallowmere::fuzz {
namespace {

void CheckBookmark(const formats::Bookmark& bookmark) {
  const auto target = aliases::TargetOf(bookmark);
  Check(target.ways.size() <= 1 && target.volumeNames.size() <= 1);
  Check(!target.levels && !target.ids);
  for (const auto& way : target.ways) {
    Check(way.components.size() <= bookmark.components->size());
    for (const std::string& name : way.components) Check(names::CanBeLinuxName(name));
  }
}

// The same data under both kinds of header give the same bookmark.
void CheckData(std::string_view bytes) {
  const std::string data(bytes);
  const std::string zeros(32, '\0');
  const auto file = formats::ReadBookmarkFile(
      std::string("book\0\0\0\0mark\0\0\0\0", 16) + test::Little(0x38, 4) + test::Little(0x38, 4) +
      test::Little(data.size(), 4) + test::Little(0x10040000, 4) + zeros.substr(0, 24) + data);
  const auto bare =
      formats::ReadBookmark("book" + test::Little(0x30 + data.size(), 4) +
                            test::Little(0x10040000, 4) + test::Little(0x30, 4) + zeros + data);
  Check(file.has_value() == bare.has_value());
  if (!file) return;
  Check(file->components == bare->components && file->volumeName == bare->volumeName);
  CheckBookmark(*file);
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: a kind, then a bookmark, the data of an alias file, or the data after a header.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  using namespace tallowmere::formats;
  Input input(data, size);
  switch (input.TakeByte() % 4) {
    case 0:
      if (const auto bookmark = ReadBookmark(input.Rest())) CheckBookmark(*bookmark);
      break;
    case 1:
      if (const auto bookmark = ReadBookmarkFile(input.Rest())) CheckBookmark(*bookmark);
      break;
    default:
      CheckData(input.Rest());
  }
  return 0;
}
