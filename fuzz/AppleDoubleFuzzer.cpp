// AppleDouble files: arbitrary bytes, as a whole file and as the beginning of a longer one.
#include <algorithm>

#include "formats/AppleDouble.h"
#include "fuzz/Check.h"
#include "fuzz/Within.h"

// The input: a factor for the file's size, then its beginning.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere;
  fuzz::Input input(data, size);
  const std::size_t factor = input.TakeByte() % 4 + 1;
  const std::string_view bytes = input.Rest();
  const std::uint64_t fileSize = bytes.size() * std::uint64_t{factor};
  const auto file = formats::ReadAppleDouble(bytes, fileSize);
  if (!file) return 0;
  fuzz::Check(file->entries.size() * 12 + 26 <= bytes.size());
  for (const auto& entry : file->entries) {
    fuzz::Check(entry.length > 0 && entry.offset + entry.length <= fileSize);
    fuzz::Check(file->Find(entry.id) != nullptr);
    if (factor == 1) fuzz::CheckPiece(bytes.substr(entry.offset, entry.length), bytes);
  }
  return 0;
}
