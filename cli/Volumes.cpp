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
  std::string name;  // as UTF-8
  std::string mountPoint;
  std::optional<std::int16_t> numberByName;  // what the service answers for the name

  bool Answers() const { return !numberByName || *numberByName == number; }
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
    rows.push_back({volume->Number(), Utf8OfHFSName(**name), volume->MountPoint(), *number});
  }
  return rows;
}

void PrintAsJson(const Row& row) {
  Json json;
  json["volume"] = row.number;
  json["name"] = row.name;
  Put(json, "mount_point", row.mountPoint);
  json["answers_to_its_name"] = row.Answers();
  std::cout << json.dump() << '\n';
}

}  // namespace

int PrintVolumes(const ClientOptions& options, bool isJson) {
  const auto rows = AskForVolumes(options);
  if (!rows) return Complain(rows.Failure().message);
  Table table({{"vRefNum", Table::Align::kRight}, {"name"}, {"mount point"}});
  for (const Row& row : *rows) {
    if (isJson) {
      PrintAsJson(row);
    } else {
      table.Add({std::to_string(row.number), Printable(row.name),
                 Printable(row.mountPoint) +
                     (row.Answers() ? "" : "  (the first volume of this name answers to it)")});
    }
  }
  if (!isJson) table.Print(std::cout);
  return FinishOutput();
}

}  // namespace tallowmere::cli
