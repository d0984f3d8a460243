#include <iostream>
#include <string>
#include <vector>

#include "cli/Commands.h"
#include "cli/Output.h"
#include "cli/Table.h"
#include "cli/Text.h"
#include "files/MountTable.h"

namespace tallowmere::cli {
namespace {

struct Row {
  std::int16_t number;
  std::string name;                          // for a person
  std::string mountPoint;                    // for a person
  std::optional<std::int16_t> numberByName;  // what the service answers for the name
};

// The mount table says which numbers there are and where; the service says what they are called.
Result<std::vector<Row>> AskForVolumes(const ClientOptions& options) {
  Client client(options);
  std::vector<Row> rows;
  files::MountTable& table = files::MountTable::OfThisProcess();
  for (std::size_t i = 0; const files::VolumePointer volume = table.AtIndex(i); ++i) {
    const auto name = client.GetHFSVolumeName(volume->Number());
    if (!name) return name.Failure();
    if (!*name) continue;  // unmounted in between
    const auto number = client.GetVolRefnumByHFSName(**name);
    if (!number) return number.Failure();
    rows.push_back({volume->Number(), Printable(Utf8OfHFSName(**name)),
                    Printable(volume->MountPoint()), *number});
  }
  return rows;
}

}  // namespace

int PrintVolumes(const ClientOptions& options) {
  const auto rows = AskForVolumes(options);
  if (!rows) return Complain(rows.Failure().message);
  Table table({{"vRefNum", Table::Align::kRight}, {"name"}, {"mount point"}});
  for (const Row& row : *rows) {
    const bool answers = !row.numberByName || *row.numberByName == row.number;
    table.Add(
        {std::to_string(row.number), row.name,
         row.mountPoint + (answers ? "" : "  (the first volume of this name answers to it)")});
  }
  table.Print(std::cout);
  return FinishOutput();
}

}  // namespace tallowmere::cli
