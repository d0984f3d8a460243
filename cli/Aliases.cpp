#include "cli/Aliases.h"

#include <Tallowmere/Aliases.h>
#include <tallowmere/Outcome.h>

#include <array>
#include <cerrno>
#include <charconv>
#include <ctime>
#include <filesystem>
#include <iostream>
#include <nlohmann/json.hpp>
#include <optional>
#include <string_view>
#include <system_error>

#include "cli/CopiedVolumes.h"
#include "cli/Finding.h"
#include "cli/Items.h"
#include "cli/Output.h"
#include "cli/Report.h"
#include "cli/Text.h"
#include "client/Places.h"
#include "client/Quoted.h"

namespace tallowmere::cli {
namespace {

using alias::Answer;
using alias::Container;
using alias::Description;
using alias::Form;
using alias::Found;

constexpr std::string_view kBlanks = " \t\r\n";

// --- Words --------------------------------------------------------------------------------------

std::string_view NameOf(Form form) {
  switch (form) {
    case Form::kRecordOfVersion2:
      return "alias record, version 2";
    case Form::kRecordOfVersion3:
      return "alias record, version 3";
    default:
      return "bookmark";
  }
}

std::string_view NameOf(Container container) {
  switch (container) {
    case Container::kAliasFile:
      return "alias file";
    case Container::kResourceFork:
      return "resource fork";
    case Container::kAppleDouble:
      return "AppleDouble file";
    case Container::kMacBinary:
      return "MacBinary file";
    default:
      return "";
  }
}

std::string_view NameOf(Found found) {
  switch (found) {
    case Found::kByLevels:
      return "levels";
    case Found::kByPath:
      return "path";
    default:
      return "id";
  }
}

// Why no alias could be read, by its result code.
Error WhyNotRead(OSErr result) {
  switch (result) {
    case nsvErr:
      return {Outcome::kNotAVolume, "it is on no volume"};
    case fnfErr:
      return {Outcome::kNothing, "there is no such file"};
    case dirNFErr:
      return {Outcome::kNothing, "there is no such folder"};
    case afpAccessDenied:
      return {Outcome::kRefused, "permission denied"};
    case paramErr:
      return {Outcome::kInvalid, "no alias, or a broken one"};
    default:
      return {Outcome::kRefused, "it cannot be read"};
  }
}

// Why an alias leads nowhere.
Error WhyNoTarget(OSErr result, const Description& d) {
  const std::string name = d.name.empty() ? "" : " " + Quoted(d.name);
  switch (result) {
    case nsvErr:
      if (d.volumeName.empty()) return {Outcome::kNotAVolume, "it names no volume"};
      return {Outcome::kNotAVolume, "its volume " + Quoted(d.volumeName) + " is not mounted"};
    case fnfErr:
      return {Outcome::kNothing, "its target" + name + " is not there, or not certain"};
    case dirNFErr:
      return {Outcome::kNothing, "a folder on the way to its target" + name + " is missing"};
    case afpAccessDenied:
      return {Outcome::kRefused, "the way to its target" + name + " is not permitted"};
    case paramErr:
      return {Outcome::kInvalid, "it is broken"};
    default:
      return {Outcome::kRefused, "the system fails on the way to its target" + name};
  }
}

// ISO 8601; with a Z where the time zone is known.
std::string TextOf(const alias::Date& date) {
  const auto seconds = static_cast<std::time_t>(date.seconds);
  std::tm parts{};
  if (gmtime_r(&seconds, &parts) == nullptr) return std::to_string(date.seconds);
  std::array<char, 64> text{};
  const std::size_t length = std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%S", &parts);
  return std::string(text.data(), length) + (date.isInUTC ? "Z" : "");
}

// --- Fields -------------------------------------------------------------------------------------

// What is known of an alias, in its order: the key in JSON, the words before it in text, the value.
struct Field {
  const char* key;
  const char* words;
  nlohmann::ordered_json value;
};

class Fields {
 public:
  explicit Fields(const Description& d) {
    AddText("form", "form", std::string(NameOf(d.form)));
    AddText("container", "in", std::string(NameOf(d.container)));
    AddText("kind", "kind", d.isFolder ? "folder" : "file");
    AddText("name", "name", d.name);
    AddText("volume", "volume", d.volumeName);
    AddText("file_system", "file system", d.fileSystem);
    AddDate("volume_created", "volume created", d.volumeCreation);
    AddText("mount_point_there", "mounted there at", d.mountPoint);
    if (d.isOnDiskImage) Add("on_disk_image", "on a disk image", true);
    AddNumber("id", "id", d.id);
    AddNumber("parent_id", "parent id", d.parentID);
    AddDate("created", "created", d.creation);
    AddText("type", "type", d.type);
    AddText("creator", "creator", d.creator);
    AddNumber("levels_up", "levels up", d.levelsUp);
    AddNumber("levels_down", "levels down", d.levelsDown);
    AddText("posix_path", "path", d.posixPath);
    AddText("hfs_path", "HFS path", d.hfsPath);
    AddText("server", "server", d.server);
    AddText("user", "user", d.user);
  }

  const std::vector<Field>& All() const { return mFields; }

 private:
  void Add(const char* key, const char* words, nlohmann::ordered_json value) {
    mFields.push_back({key, words, std::move(value)});
  }
  void AddText(const char* key, const char* words, const std::string& text) {
    if (!text.empty()) Add(key, words, text);
  }
  void AddDate(const char* key, const char* words, const std::optional<alias::Date>& date) {
    if (date) Add(key, words, TextOf(*date));
  }
  template <class Number>
  void AddNumber(const char* key, const char* words, const std::optional<Number>& number) {
    if (number) Add(key, words, *number);
  }

  std::vector<Field> mFields;
};

// --- Where it leads -----------------------------------------------------------------------------

struct Target {
  std::string path;
  bool isFolder;
  std::string_view by;
};

Result<Target> CheckKind(const Description& d, const std::string& path) {
  const auto looked = LookAt(path);
  if (!looked) return looked.Failure();
  if (!looked->exists) {
    return Error{Outcome::kNothing, "there is no file or folder " + Quoted(path)};
  }
  if (looked->isFolder != d.isFolder) {
    const std::string kind = d.isFolder ? " is no folder" : " is a folder";
    return Error{Outcome::kNothing, Quoted(path) + kind + ", unlike its target"};
  }
  return Target{path, looked->isFolder, "map"};
}

// The target in a copy of its volume. All readings of its path that lead to an item lead to one.
Result<Target> TargetInCopy(const Description& d, const std::string& copy) {
  Result<Target> found(Error{Outcome::kNothing, "it tells no path on its volume"});
  for (const auto& way : d.waysOnVolume) {
    const auto path = PathInCopy(copy, way);
    auto target = path ? CheckKind(d, path->value) : Result<Target>(path.Failure());
    if (target && found && !IsSameItem(found->path, target->path)) {
      return Error{Outcome::kAmbiguous,
                   "its path leads to " + Quoted(found->path) + " and to " + Quoted(target->path)};
    }
    if (!found) found = std::move(target);
  }
  return found;
}

// An alias that leads to a neighbour is followed there; otherwise a copy of its volume counts as
// the volume.
Result<Target> TargetOf(const Answer& answer, const CopiedVolumes& copies) {
  const bool isNeighbour = answer.result == noErr && answer.found == Found::kByLevels;
  const auto copy = copies.FolderOf(answer.description->volumeName);
  if (copy && !isNeighbour) {
    return *copy ? TargetInCopy(*answer.description, **copy) : copy->Failure();
  }
  if (answer.result != noErr) return WhyNoTarget(answer.result, *answer.description);
  return Target{answer.path, answer.isFolder, NameOf(answer.found)};
}

// --- Items --------------------------------------------------------------------------------------

// Digits may have blanks between them.
Result<std::string> BytesOfHex(const std::string& digits) {
  std::string bytes;
  for (std::size_t at = 0; (at = digits.find_first_not_of(kBlanks, at)) != std::string::npos;) {
    unsigned byte = 0;
    const char* const begin = digits.data() + at;
    const bool isPair =
        at + 2 <= digits.size() && std::from_chars(begin, begin + 2, byte, 16).ptr == begin + 2;
    if (!isPair) return Error{Outcome::kInvalid, "it is not in hexadecimal, two digits a byte"};
    bytes.push_back(static_cast<char>(byte));
    at += 2;
  }
  if (bytes.empty()) return Error{Outcome::kInvalid, "it has no hexadecimal digits"};
  return bytes;
}

// The path of the file that an item names, without links.
Result<std::string> FileAt(const std::string& item) {
  const auto place = Places(true).Find(item);
  if (!place) return place.Failure();
  if (!place->exists) return WhyNotRead(fnfErr);
  std::error_code error;
  const auto path = std::filesystem::canonical(place->path, error);
  if (error == std::errc::permission_denied) return WhyNotRead(afpAccessDenied);
  if (error) return Error{Outcome::kNothing, "it is a link that leads nowhere"};
  const auto kind = std::filesystem::status(path, error).type();
  if (kind == std::filesystem::file_type::directory) {
    return Error{Outcome::kInvalid, "it is a folder, not a file"};
  }
  if (kind != std::filesystem::file_type::regular) {
    return Error{Outcome::kInvalid, "it is no regular file"};
  }
  return path.string();
}

// What an item says. Fails for one that is no alias.
Result<Answer> AnswerTo(const std::string& item, bool isHex) {
  const auto read = isHex ? BytesOfHex(item) : FileAt(item);
  if (!read) return read.Failure();
  Answer answer = isHex ? alias::LookAtBytes(*read) : alias::LookAtFile(*read);
  if (!answer.description) return WhyNotRead(answer.result);
  return answer;
}

// --- Printing -----------------------------------------------------------------------------------

void PrintLine(std::string_view words, const std::string& value) {
  constexpr std::size_t kWidth = 18;
  std::cout << "  " << words << std::string(kWidth - words.size(), ' ') << value << '\n';
}

void PrintAsText(const std::string& item, const Description& description,
                 const Result<Target>& target) {
  std::cout << Printable(item) << '\n';
  const Fields fields(description);
  for (const Field& field : fields.All()) {
    PrintLine(field.words, field.value.is_string()
                               ? Printable(field.value.get_ref<const std::string&>())
                               : field.value.dump());
  }
  PrintLine("leads to", target ? Printable(target->path) + " (by " + std::string(target->by) + ")"
                               : "nothing: " + Printable(target.Failure().message));
}

void Fill(Json& json, const Description& description) {
  const Fields fields(description);
  for (const Field& field : fields.All()) {
    if (field.value.is_string()) {
      Put(json, field.key, field.value.get_ref<const std::string&>());
    } else {
      json[field.key] = field.value;
    }
  }
}

class Aliases {
 public:
  Aliases(const Format& format, const AliasOptions& options, const CopiedVolumes& copies)
      : mFormat(format), mOptions(options), mCopies(copies), mFindings(format, "alias") {}

  void Take(Report& report, const std::string& item) const {
    const auto answer = AnswerTo(item, mOptions.areHex);
    if (!answer) return report.Print(mFindings.Failure(item, answer.Failure()));
    const Description& description = *answer->description;
    const auto target = TargetOf(*answer, mCopies);
    const Finding finding = FindingOf(item, description, target);
    if (mFormat.isJson || mOptions.targetsOnly) return report.Print(finding);
    report.Count(finding);
    PrintAsText(item, description, target);
  }

 private:
  Finding FindingOf(const std::string& item, const Description& description,
                    const Result<Target>& target) const {
    if (!target) {
      return mFindings.Failure(item, target.Failure(), [&](Json& json) {
        Fill(json, description);
        json["exists"] = false;
      });
    }
    const std::string text = mOptions.targetsOnly ? target->path : "";
    return mFindings.Answer(item, Outcome::kFound, text, [&](Json& json) {
      Fill(json, description);
      json["exists"] = true;
      Put(json, "target", target->path);
      json["is_folder"] = target->isFolder;
      json["by"] = target->by;
    });
  }

  const Format& mFormat;
  const AliasOptions& mOptions;
  const CopiedVolumes& mCopies;
  Findings mFindings;
};

}  // namespace

int PrintAliases(const std::vector<std::string>& arguments, const Format& format,
                 const AliasOptions& options) {
  const auto copies = CopiedVolumes::Read(options.places);
  if (!copies) return Complain(copies.Failure().message);
  Report report(format);
  const Aliases aliases(format, options, *copies);
  Items items(arguments, format.InputEnd());
  while (report.GoesOn()) {
    const auto item = items.Next([] { std::cout.flush(); });
    if (!item) break;
    aliases.Take(report, *item);
    report.ShowProgress(items.Done());
  }
  return report.Finish(items);
}

}  // namespace tallowmere::cli
