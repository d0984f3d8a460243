#include <functional>
#include <iostream>
#include <string>
#include <vector>

#include "cli/Commands.h"
#include "cli/Finding.h"
#include "cli/Output.h"
#include "cli/Table.h"

namespace tallowmere::cli {
namespace {

constexpr const char* kRoot = "/";
constexpr std::int16_t kVolumeOfRoot = 0;

// What earlier checks have found out, for later ones.
struct Learnt {
  std::string volumeName;
  std::int16_t volume = 0;
  FSSpec record{};
  std::string fullPath;
};

// A request, and a check of its answer that returns what is wrong with it, or an empty text.
struct Check {
  int code;
  const char* what;
  std::function<std::string(Client&, Learnt&)> run;
};

// Keeps the answer in `found`; returns what is wrong when there is none.
template <class Value>
std::string Keep(const Result<std::optional<Value>>& answer, Value& found) {
  if (!answer) return answer.Failure().message;
  if (!*answer) return "the service knows none";
  found = **answer;
  return {};
}

// Returns what is wrong unless the answer is `wanted`.
template <class Value>
std::string Compare(const Result<std::optional<Value>>& answer, const Value& wanted) {
  Value found{};
  const std::string wrong = Keep(answer, found);
  return !wrong.empty() || found == wanted ? wrong : "the answer does not fit the others";
}

const std::vector<Check>& Checks() {
  static const std::vector<Check> checks = {
      {4, "the name of the volume of \"/\"",
       [](Client& client, Learnt& found) {
         return Keep(client.GetHFSVolumeName(kVolumeOfRoot), found.volumeName);
       }},
      {3, "the number of a volume with that name",
       [](Client& client, Learnt& found) {
         return Keep(client.GetVolRefnumByHFSName(found.volumeName), found.volume);
       }},
      {7, "the record of \"/\"",
       [](Client& client, Learnt& found) { return Keep(client.GetFSSpec(kRoot), found.record); }},
      {9, "the path of that record",
       [](Client& client, Learnt& found) {
         return Compare(client.SetFileRefFromFSSpec(found.record, false), std::string(kRoot));
       }},
      {8, "the path of its parts",
       [](Client& client, Learnt& found) {
         return Compare(client.SetFileRefFromFSSpecData(found.record), std::string(kRoot));
       }},
      {5, "the HFS name of \"/\"",
       [](Client& client, Learnt& found) {
         return Compare(client.GetHFSName(kRoot), found.volumeName);
       }},
      {1, "the full HFS path of \"/\"",
       [](Client& client, Learnt& found) -> std::string {
         const auto path = client.MakeFullPath(kRoot);
         if (!path) return path.Failure().message;
         found.fullPath = *path;
         return *path == found.volumeName + ":" ? "" : "the answer does not fit the others";
       }},
      {2, "the path of that full HFS path",
       [](Client& client, Learnt& found) {
         return Compare(client.MakeFileRefFromPath(found.fullPath), std::string(kRoot));
       }},
      {6, "the path of a name in \"/\"",
       [](Client& client, Learnt&) -> std::string {
         std::string path;
         const std::string wrong = Keep(client.AddHFSName(kRoot, "a/b"), path);
         return !wrong.empty() || path.ends_with("/a:b") ? wrong : "the answer is no such path";
       }},
      {10, "the settings of a sound", [](Client& client, Learnt&) -> std::string {
         const auto settings = client.GetAIFFExportSettings(FormatOf({}));
         if (!settings) return settings.Failure().message;
         return settings->result == 0 ? "" : "result " + std::to_string(settings->result);
       }}};
  return checks;
}

void PrintAsJson(const Check& check, const std::string& wrong) {
  Json json;
  json["code"] = check.code;
  json["request"] = check.what;
  json["ok"] = wrong.empty();
  if (!wrong.empty()) Put(json, "error", wrong);
  std::cout << json.dump() << '\n';
}

}  // namespace

int CheckService(const ClientOptions& options, bool isJson) {
  Client client(options);
  Learnt found;
  int status = 0;
  Table table({{"code", Table::Align::kRight}, {"request"}, {"result"}});
  for (const Check& check : Checks()) {
    const std::string wrong = check.run(client, found);
    if (isJson) {
      PrintAsJson(check, wrong);
    } else {
      table.Add({std::to_string(check.code), check.what, wrong.empty() ? "ok" : wrong});
    }
    if (!wrong.empty()) {
      status = kFailed;
      break;  // later checks depend on it
    }
  }
  if (!isJson) table.Print(std::cout);
  return FinishOutput(status);
}

}  // namespace tallowmere::cli
