// What kind of record or file some bytes are: any bytes, and a record or bookmark in any container.
#include <array>
#include <string>

#include "formats/Recognition.h"
#include "fuzz/Check.h"
#include "support/OldFormats.h"

namespace tallowmere::fuzz {
namespace {

using formats::Container;

void CheckBytes(std::string_view bytes) {
  const auto found = formats::RecognizeAlias(bytes);
  const auto inFork = formats::RecognizeAliasInFork(bytes);
  Check(!inFork || inFork->container == Container::kResourceFork);
  Check((found && found->container == Container::kBookmarkFile) ==
        formats::BeginsBookmarkFile(bytes));
  if (!found) {
    Check(!inFork && !formats::ReadAliasRecord(bytes) && !formats::ReadBookmark(bytes));
  } else if (found->container == Container::kNone) {
    Check(found->content.has_value() && !inFork);
  } else if (found->container == Container::kResourceFork) {
    Check(inFork && inFork->content.has_value() == found->content.has_value());
  }
}

// The same in each kind of file, whatever data that has beside it.
void CheckContained(const std::string& alias, bool isWhole, const std::string& data) {
  const std::string fork = test::WriteResourceFork({{"icns", 1, data}, {"alis", 0, alias}});
  const std::string twoForks =
      test::WriteAppleDouble({{1, data}, {9, test::FinderInfo(0)}, {2, fork}}, 0x00051600);
  test::MacBinaryToWrite file;
  file.dataFork = data;
  file.resourceFork = fork;
  const std::array<std::pair<std::string, Container>, 4> files = {
      {{fork, Container::kResourceFork},
       {test::WriteAppleDouble({{2, fork}}), Container::kAppleDouble},
       {twoForks, Container::kAppleDouble},
       {test::Write(file), Container::kMacBinary}}};
  for (const auto& [bytes, container] : files) {
    const auto found = formats::RecognizeAlias(bytes);
    Check(found && found->container == container);
    const bool canBeOther = formats::BeginsBookmarkFile(data);
    Check(canBeOther || found->content.has_value() == isWhole);
  }
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: a kind, then bytes to recognize; a record and the length of the data beside it; or the
// length of the name in a record that is read, and the data beside that.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere;
  fuzz::Input input(data, size);
  const unsigned kind = input.TakeByte() % 4;
  if (kind < 2) {
    fuzz::CheckBytes(input.Rest());
    return 0;
  }
  const unsigned length = input.TakeByte();
  const std::string rest(input.Rest());
  if (kind == 2) {
    const std::string record = rest.substr(0, length);
    fuzz::CheckContained(record, formats::ReadAliasRecord(record).has_value(),
                         rest.substr(record.size()));
  } else {
    test::RecordToWrite record;
    record.name = std::string(length % 64, 'n');
    fuzz::CheckContained(test::Write(record), true, rest);
  }
  return 0;
}
