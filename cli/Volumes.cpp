#include <algorithm>
#include <iomanip>
#include <iostream>
#include <string_view>
#include <vector>

#include "cli/Commands.h"
#include "cli/Text.h"
#include "files/MountTable.h"

namespace tallowmere::cli {
namespace {

constexpr std::string_view kNumberTitle = "vRefNum";
constexpr std::string_view kNameTitle = "name";

struct Row {
  std::int16_t number;
  std::string name;                          // for a person
  std::string mountPoint;                    // for a person
  std::optional<std::int16_t> numberByName;  // what the service answers for the name
};

// The mount table says which numbers there are and where; the service says what they are called.
Result<std::vector<Row>> AskForVolumes(const ClientOptions& options) {
  auto client = Client::Start(options);
  if (!client) return client.Failure();
  std::vector<Row> rows;
  files::MountTable& table = files::MountTable::OfThisProcess();
  for (std::size_t i = 0; const files::VolumePointer volume = table.AtIndex(i); ++i) {
    const auto name = client->GetHFSVolumeName(volume->Number());
    if (!name) return name.Failure();
    if (!*name) continue;  // unmounted in between
    const auto number = client->GetVolRefnumByHFSName(**name);
    if (!number) return number.Failure();
    rows.push_back({volume->Number(), Printable(Utf8OfHFSName(**name)),
                    Printable(volume->MountPoint()), *number});
  }
  return rows;
}

}  // namespace

int PrintVolumes(const ClientOptions& options) {
  const auto rows = AskForVolumes(options);
  if (!rows) {
    std::cerr << "tallowmere-cli: " << rows.Failure().message << '\n';
    return 1;
  }
  std::size_t nameWidth = kNameTitle.size();
  for (const Row& row : *rows) nameWidth = std::max(nameWidth, CharacterCount(row.name));
  const auto padded = [nameWidth](std::string_view name) {
    return std::string(name).append(nameWidth - CharacterCount(name), ' ');
  };
  std::cout << kNumberTitle << "  " << padded(kNameTitle) << "  mount point\n";
  for (const Row& row : *rows) {
    std::cout << std::setw(kNumberTitle.size()) << row.number << "  " << padded(row.name) << "  "
              << row.mountPoint;
    if (row.numberByName && *row.numberByName != row.number) {
      std::cout << "  (the first volume of this name answers to it)";
    }
    std::cout << '\n';
  }
  if (std::cout.flush()) return 0;
  std::cerr << "tallowmere-cli: the output could not be written\n";
  return 1;
}

}  // namespace tallowmere::cli
