// MacBinary files: arbitrary bytes, the same with a correct checksum, and files with any content.
#include <string>

#include "formats/MacBinary.h"
#include "fuzz/Check.h"
#include "fuzz/Within.h"
#include "support/OldFormats.h"

namespace tallowmere::fuzz {
namespace {

void CheckBytes(std::string_view bytes) {
  const auto file = formats::ReadMacBinary(bytes);
  if (!file) return;
  Check(!file->name.empty() && file->name.size() <= 63);
  CheckPiece(file->name, bytes);
  CheckPiece(file->dataFork, bytes);
  CheckPiece(file->resourceFork, bytes);
}

void CheckWithChecksum(std::string bytes) {
  constexpr std::size_t kHeader = 128;
  constexpr std::size_t kChecksumAt = 124;
  bytes.resize(std::max(bytes.size(), kHeader));
  for (const std::size_t zeroAt : {0U, 74U, 82U}) bytes[zeroAt] = 0;
  bytes.replace(kChecksumAt, 2, test::Big(test::Checksum(bytes.substr(0, kChecksumAt)), 2));
  CheckBytes(bytes);
}

void CheckWritten(Input& input) {
  test::MacBinaryToWrite file;
  file.name = std::string(input.TakeByte() % 63 + 1, 'n');
  file.finderFlags = static_cast<std::uint16_t>(input.TakeTwoBytes());
  file.secondHeader = static_cast<std::uint16_t>(input.TakeTwoBytes() % 1024);
  file.version = input.TakeByte() % 2 == 0 ? 129 : 130;
  const std::size_t cut = input.TakeByte();
  file.dataFork = input.Rest().substr(0, cut);
  file.resourceFork = input.Rest();
  const auto bytes = test::Write(file);
  const auto read = formats::ReadMacBinary(bytes);
  Check(read.has_value());
  Check(read->name == file.name && read->finderFlags == file.finderFlags);
  Check(read->dataFork == file.dataFork && read->resourceFork == file.resourceFork);
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: a kind, then a file or its fields.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  Input input(data, size);
  switch (input.TakeByte() % 3) {
    case 0:
      CheckBytes(input.Rest());
      break;
    case 1:
      CheckWithChecksum(std::string(input.Rest()));
      break;
    default:
      CheckWritten(input);
  }
  return 0;
}
