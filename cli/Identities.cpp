#include <sys/stat.h>

#include <filesystem>
#include <iostream>
#include <utility>

#include "cli/Commands.h"
#include "cli/Output.h"
#include "cli/Table.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

bool IsFolder(const std::string& path) {
  struct stat about {};
  return lstat(path.c_str(), &about) == 0 && S_ISDIR(about.st_mode);
}

struct Identity {
  FSSpec spec;
  std::string hfsPath;
  std::optional<std::string> wayBack;  // where the record leads
};

// None for what has no record.
Result<std::optional<Identity>> Identify(Client& client, const std::string& path) {
  auto spec = client.GetFSSpec(path);
  if (!spec) return spec.Failure();
  if (!*spec) return std::optional<Identity>{};
  auto folders = client.MakeFullPath(path);
  if (!folders) return folders.Failure();
  auto wayBack = client.SetFileRefFromFSSpec(**spec, false);
  if (!wayBack) return wayBack.Failure();
  Identity identity{**std::move(spec), *std::move(folders), *std::move(wayBack)};
  if (!IsFolder(path)) identity.hfsPath += identity.spec.name;
  return std::optional(std::move(identity));
}

}  // namespace

int PrintIdentities(const ClientOptions& options, const std::vector<std::string>& paths) {
  Client client(options);
  Table table({{"vRefNum", Table::Align::kRight},
               {"parent id", Table::Align::kRight},
               {"HFS name"},
               {"HFS path"},
               {"way back"}});
  int status = 0;
  for (const std::string& given : paths) {
    const auto identity = Identify(client, std::filesystem::absolute(given));
    if (!identity) return Complain(identity.Failure().message);
    if (!*identity) {
      status = Complain(given + ": there is no such folder on any volume");
      continue;
    }
    const auto& [spec, hfsPath, wayBack] = **identity;
    table.Add({std::to_string(spec.vRefNum), std::to_string(spec.parID),
               Printable(Utf8OfHFSName(spec.name)), Printable(Utf8OfHFSName(hfsPath)),
               wayBack ? Printable(*wayBack) : "none"});
  }
  table.Print(std::cout);
  return FinishOutput(status);
}

}  // namespace tallowmere::cli
