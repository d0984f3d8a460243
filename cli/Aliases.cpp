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

#include "cli/Items.h"
#include "cli/Output.h"
#include "cli/Text.h"

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

std::string_view ReasonOf(OSErr result, bool isAlias) {
  switch (result) {
    case nsvErr:
      return "its volume is not mounted";
    case fnfErr:
      return isAlias ? "its target is not there, or not certain" : "there is no such file";
    case dirNFErr:
      return isAlias ? "a folder on the way to its target is missing" : "there is no such folder";
    case afpAccessDenied:
      return "permission denied";
    case paramErr:
      return "no alias, or a broken one";
    default:
      return "it cannot be read";
  }
}

Outcome OutcomeOf(OSErr result) {
  switch (result) {
    case noErr:
      return Outcome::kFound;
    case nsvErr:
      return Outcome::kNotAVolume;
    case fnfErr:
    case dirNFErr:
      return Outcome::kNothing;
    case paramErr:
      return Outcome::kInvalid;
    default:
      return Outcome::kRefused;
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
    if (!text.empty()) Add(key, words, Utf8OfAnyBytes(text));
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

void PrintAsJson(const std::string& item, const Answer& answer) {
  nlohmann::ordered_json json;
  json["alias"] = Utf8OfAnyBytes(item);
  if (answer.description) {
    const Fields fields(*answer.description);
    for (const Field& field : fields.All()) json[field.key] = field.value;
  }
  json["status"] = Name(OutcomeOf(answer.result));
  json["exists"] = answer.result == noErr;
  if (answer.result == noErr) {
    json["target"] = Utf8OfAnyBytes(answer.path);
    json["is_folder"] = answer.isFolder;
    json["by"] = NameOf(answer.found);
  } else {
    json["error"] = ReasonOf(answer.result, answer.description.has_value());
  }
  std::cout << json.dump() << '\n';
}

void PrintLine(std::string_view words, const std::string& value) {
  constexpr std::size_t kWidth = 18;
  std::cout << "  " << words << std::string(kWidth - words.size(), ' ') << value << '\n';
}

void PrintAsText(const std::string& item, const Answer& answer) {
  std::cout << Printable(item) << '\n';
  const Fields fields(*answer.description);
  for (const Field& field : fields.All()) {
    PrintLine(field.words, field.value.is_string()
                               ? Printable(field.value.get_ref<const std::string&>())
                               : field.value.dump());
  }
  if (answer.result == noErr) {
    PrintLine("leads to",
              Printable(answer.path) + " (by " + std::string(NameOf(answer.found)) + ")");
  } else {
    PrintLine("leads to", "nothing: " + std::string(ReasonOf(answer.result, true)));
  }
}

// --- Items --------------------------------------------------------------------------------------

std::optional<std::string> BytesOfHex(const std::string& digits) {
  std::string bytes;
  for (std::size_t at = 0; (at = digits.find_first_not_of(kBlanks, at)) != std::string::npos;) {
    unsigned byte = 0;
    const char* const begin = digits.data() + at;
    const bool isPair =
        at + 2 <= digits.size() && std::from_chars(begin, begin + 2, byte, 16).ptr == begin + 2;
    if (!isPair) return std::nullopt;
    bytes.push_back(static_cast<char>(byte));
    at += 2;
  }
  return bytes;
}

Answer AnswerTo(const std::string& item, bool isHex) {
  if (isHex) {
    const auto bytes = BytesOfHex(item);
    return alias::LookAtBytes(bytes.value_or(""));
  }
  std::error_code ignored;
  auto path = std::filesystem::absolute(item, ignored);
  const auto name = path.filename();
  if (name.empty() || name == "." || name == "..") {
    path = std::filesystem::canonical(path, ignored);
  }
  return alias::LookAtFile(path.string());
}

bool Print(const std::string& item, bool isHex, bool isJson) {
  const Answer answer = AnswerTo(item, isHex);
  if (isJson) {
    PrintAsJson(item, answer);
  } else if (answer.description) {
    PrintAsText(item, answer);
  } else {
    Complain(item + ": " + std::string(ReasonOf(answer.result, false)));
  }
  return answer.result == noErr;
}

}  // namespace

int PrintAliases(const std::vector<std::string>& arguments, const Format& format, bool areHex) {
  Items items(arguments, format.InputEnd());
  std::size_t count = 0;
  std::size_t found = 0;
  while (const auto item = items.Next([] { std::cout.flush(); })) {
    ++count;
    found += Print(*item, areHex, format.isJson) ? 1U : 0U;
  }
  if (items.ReadError() != 0) {
    Complain("standard input: " + std::generic_category().message(items.ReadError()));
    return kFailed;
  }
  if (count > 1 && !format.isQuiet) std::cerr << found << " of " << count << " lead to an item\n";
  return FinishOutput(found == count ? 0 : kFailed);
}

}  // namespace tallowmere::cli
