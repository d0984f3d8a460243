// Alias records: arbitrary bytes, and written records with arbitrary fields.
#include <algorithm>
#include <string>

#include "aliases/Target.h"
#include "formats/AliasRecord.h"
#include "fuzz/Check.h"
#include "names/HFSNames.h"
#include "support/OldFormats.h"

namespace tallowmere::fuzz {
namespace {

using aliases::Way;

void CheckWay(const Way& way) {
  for (const std::string& name : way.components) {
    Check(way.spelling == Way::Spelling::kLinux ? names::CanBeLinuxName(name)
                                                : !names::SpellHFSName(name).precomposed.empty());
    for (const std::string& form : aliases::OtherFormsOf(name)) Check(form != name);
  }
}

void CheckTarget(const aliases::Target& target) {
  for (const Way& way : target.ways) {
    CheckWay(way);
    Check(!target.levels || way.components.size() >= target.levels->down);
  }
  for (const Way& name : target.names) {
    CheckWay(name);
    Check(name.components.size() == 1);
  }
  Check(!target.levels || (target.levels->up >= 1 && target.levels->down >= 1));
  for (const auto& name : target.volumeNames) Check(!name.empty());
}

void CheckBytes(std::string_view bytes) {
  const auto record = formats::ReadAliasRecord(bytes);
  if (!record) return;
  Check(record->version == 2 || record->version == 3);
  Check(record->shortVolumeName.size() <= 27 && record->shortTargetName.size() <= 63);
  Check(!record->hfsPath || record->hfsPath->find('\0') == std::string::npos);
  CheckTarget(aliases::TargetOf(*record));
  // Bytes beyond the stated size are not read.
  const auto size = static_cast<std::size_t>(static_cast<unsigned char>(bytes[4]) << 8 |
                                             static_cast<unsigned char>(bytes[5]));
  Check(formats::ReadAliasRecord(bytes.substr(0, size)).has_value());
  Check(!formats::ReadAliasRecord(bytes.substr(0, size - 1)));
}

// A record is read back as it was written.
void CheckWritten(Input& input) {
  test::RecordToWrite record;
  record.version = input.TakeByte() % 2 == 0 ? 2 : 3;
  record.kind = static_cast<std::uint16_t>(input.TakeByte() % 2);
  record.parentID = input.TakeTwoBytes();
  record.targetID = input.TakeTwoBytes();
  record.levelsUp = static_cast<std::int16_t>(input.TakeTwoBytes());
  record.levelsDown = static_cast<std::int16_t>(input.TakeTwoBytes());
  const std::size_t volumeLength = input.TakeByte() % 28;
  const std::size_t nameLength = input.TakeByte() % 64;
  const auto tag = static_cast<std::uint16_t>(input.TakeByte() % 2 == 0 ? 2 : 18);
  const std::string rest(input.Rest());
  record.volumeName = rest.substr(0, volumeLength);
  record.name = rest.substr(std::min(rest.size(), volumeLength), nameLength);
  record.tags = {{tag, rest}};
  const auto read = formats::ReadAliasRecord(test::Write(record));
  Check(read.has_value());
  Check(read->isFolder == (record.kind == 1) && read->parentID == record.parentID);
  Check(read->targetID == record.targetID);
  if (tag == 18) Check(read->posixPath == rest);
  if (record.version == 2) {
    Check(read->shortVolumeName == record.volumeName && read->shortTargetName == record.name);
    Check(read->levelsUp == record.levelsUp && read->levelsDown == record.levelsDown);
  }
  CheckTarget(aliases::TargetOf(*read));
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: a kind, then a record, or the fields of one and a path.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  Input input(data, size);
  if (input.TakeByte() % 2 == 0) {
    CheckBytes(input.Rest());
  } else {
    CheckWritten(input);
  }
  return 0;
}
