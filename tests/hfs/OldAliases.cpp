// old_aliases write FOLDER COUNT hfs|hfsplus OUTPUT: writes, into the folder OUTPUT, alias records
// to COUNT items of an old volume, spread evenly over it:
//
//   records  in hexadecimal, one a line
//   targets  for each line of those its form, its fate, whether the kernel tells when the item was
//            created, the item's number, its path
//
//   form     what the record has                                found
//   ------------------------------------------------------------------------------------------
//   posix    version 2, path within the volume, ids             by path, else by id
//   hfs      version 2, HFS path, ids, dates in local time      likewise
//   units    version 3, path within the volume, ids             likewise
//   case     version 2, the path in another letter case, ids    likewise
//   id       version 2, id                                      by id
//   parent   version 2, name and id of the folder, local time   by id, while it is there
//   other    version 3, id; the item with it is another's       never
//
// old_aliases move FOLDER TARGETS: lets each item meet its fate: "moves", to another folder and
// name; "goes"; or "stays", whereby the folder above all is renamed, so that its path is another
// one.
//
// old_aliases check TARGETS ANSWERS FOLDER here|moved|nothing|no-volume: whether the answers, in
// JSON, lead where they must, and none to another item; FOLDER is the volume's. By id an item is
// found only if the kernel tells when it was created: not of classic volumes, not of links.

#include <fcntl.h>
#include <sys/stat.h>

#include <array>
#include <cctype>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <map>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <string>
#include <vector>

#include "support/OldFormats.h"

namespace {

namespace fs = std::filesystem;
using tallowmere::test::RecordToWrite;

constexpr std::array<const char*, 7> kForms = {"posix", "hfs",    "units", "case",
                                               "id",    "parent", "other"};
constexpr std::int64_t k1904 = -2'082'844'800;  // in seconds since 1970
constexpr unsigned kFractionBits = 16;
constexpr std::int64_t kTimeZone = -std::int64_t{8} * 60 * 60;  // of the writer

void Require(bool isDone, const std::string& what) {
  if (!isDone) throw std::runtime_error(what + ": " + std::strerror(errno));
}

struct statx StatusOf(const fs::path& path) {
  struct statx status {};
  const int flags = AT_SYMLINK_NOFOLLOW | AT_NO_AUTOMOUNT;
  Require(statx(AT_FDCWD, path.c_str(), flags, STATX_BASIC_STATS | STATX_BTIME, &status) == 0,
          path.string());
  return status;
}

// --- Records ------------------------------------------------------------------------------------

std::string Exchanged(std::string path) {
  for (char& character : path) {
    if (character == '/' || character == ':') character = character == '/' ? ':' : '/';
  }
  return path;
}

std::string UnitsOf(const std::string& hfsName) {
  return tallowmere::test::Units(fs::path(hfsName).u16string());
}

std::string InOtherCase(std::string path) {
  for (char& letter : path) {
    const auto byte = static_cast<unsigned char>(letter);
    if (byte < 0x80) {
      letter = static_cast<char>(std::isupper(byte) ? std::tolower(byte) : std::toupper(byte));
    }
  }
  return path;
}

std::string HFSPath(const std::string& volume, const std::string& path) {
  return volume + ':' + Exchanged(path);
}

std::uint64_t Precise(std::int64_t seconds) {
  return static_cast<std::uint64_t>(seconds - k1904) << kFractionBits;
}

bool IsCreationTold(const struct statx& status) {
  return (status.stx_mask & STATX_BTIME) != 0;
}

// Where none is told, another date shows that it is not taken for it.
std::int64_t CreationOf(const struct statx& status) {
  return IsCreationTold(status) ? status.stx_btime.tv_sec : status.stx_mtime.tv_sec;
}

std::string RecordOf(const std::string& form, const fs::path& top, const fs::path& item,
                     bool isPlus) {
  const struct statx status = StatusOf(item);
  const std::int64_t creation = CreationOf(status);
  const std::string path = item.lexically_relative(top).string();
  const std::string volume = top.filename().string();
  const std::string name = Exchanged(item.filename().string());
  RecordToWrite record;
  record.version = form == "units" || form == "other" ? 3 : 2;
  record.kind = S_ISDIR(status.stx_mode) ? 1 : 0;
  record.signature = isPlus ? "H+" : "BD";
  record.volumeName = volume;
  record.name = name.substr(0, 63);
  record.parentID = static_cast<std::uint32_t>(StatusOf(item.parent_path()).stx_ino);
  record.targetID = static_cast<std::uint32_t>(status.stx_ino);
  record.targetCreation = record.version == 3
                              ? Precise(creation)
                              : static_cast<std::uint64_t>(creation + kTimeZone - k1904);
  if (form == "other") record.targetCreation = Precise(creation + 1);
  if (form == "parent") record.targetID = 0;
  if (form == "id" || form == "other") record.parentID = 0;
  record.tags = {{15, UnitsOf(volume)}};
  if (form != "hfs") record.tags.push_back({14, UnitsOf(name)});
  if (form == "hfs") record.tags = {{2, HFSPath(volume, path)}};
  if (form == "posix" || form == "id") {
    record.tags.push_back({17, tallowmere::test::Big(Precise(creation), 8)});
  }
  if (form == "posix") record.tags.push_back({18, path});
  if (form == "case") record.tags.push_back({18, InOtherCase(path)});
  if (form == "units") record.tags.push_back({18, '/' + path});
  return Write(record);
}

std::string Hex(const std::string& bytes) {
  constexpr const char* kDigits = "0123456789ABCDEF";
  std::string digits;
  for (const char byte : bytes) {
    digits += kDigits[static_cast<unsigned char>(byte) >> 4U];
    digits += kDigits[static_cast<unsigned char>(byte) & 15U];
  }
  return digits;
}

// --- Fates --------------------------------------------------------------------------------------

// A folder above all others moves, as all below it need its id.
std::string FateOf(std::size_t number, const fs::path& top, const fs::path& item) {
  const struct statx status = StatusOf(item);
  if (item.parent_path() == top) return "moves";
  if (S_ISDIR(status.stx_mode)) return "stays";
  constexpr std::array<const char*, 4> kFates = {"stays", "moves", "goes", "moves"};
  const std::string fate = kFates[number / kForms.size() % kFates.size()];
  return fate == "goes" && status.stx_nlink > 1 ? "stays" : fate;
}

struct Target {
  std::string form;
  std::string fate;
  bool isCreationTold;
  std::uint64_t number;
  std::string path;
};

std::vector<Target> ReadTargets(const std::string& file) {
  std::ifstream stream(file);
  std::vector<Target> targets;
  for (Target target;
       stream >> target.form >> target.fate >> target.isCreationTold >> target.number;) {
    std::getline(stream >> std::ws, target.path);
    targets.push_back(target);
  }
  if (targets.empty()) throw std::runtime_error(file + ": no targets");
  return targets;
}

int WriteRecords(const fs::path& top, std::size_t count, bool isPlus, const std::string& output) {
  std::vector<fs::path> items;
  for (const auto& item : fs::recursive_directory_iterator(top)) items.push_back(item.path());
  if (items.size() < count) throw std::runtime_error("the volume has too few items");
  std::ofstream records(output + "/records");
  std::ofstream targets(output + "/targets");
  for (std::size_t number = 0; number < count; ++number) {
    const fs::path& item = items[number * items.size() / count];
    const std::string form = kForms[number % kForms.size()];
    records << Hex(RecordOf(form, top, item, isPlus)) << '\n';
    const struct statx status = StatusOf(item);
    targets << form << ' ' << FateOf(number, top, item) << ' ' << IsCreationTold(status) << ' '
            << status.stx_ino << ' ' << item.string() << '\n';
  }
  return records.flush() && targets.flush() ? 0 : 1;
}

int Move(const fs::path& top, const std::vector<Target>& targets) {
  const fs::path elsewhere = top / "Elsewhere";
  fs::create_directory(elsewhere);
  std::size_t number = 0;
  for (const Target& target : targets) {
    const fs::path item = target.path;
    ++number;
    if (item.parent_path() == top) continue;  // below
    if (target.fate == "goes") Require(fs::remove(item), target.path);
    if (target.fate == "moves")
      fs::rename(item, elsewhere / ("New Name " + std::to_string(number)));
  }
  const std::vector<fs::path> uppermost{fs::directory_iterator(top), {}};
  for (const fs::path& folder : uppermost) {
    if (folder != elsewhere) fs::rename(folder, top / ("New " + std::to_string(++number)));
  }
  return 0;
}

// --- Answers ------------------------------------------------------------------------------------

constexpr const char* kNothing = "nothing";
constexpr const char* kNoVolume = "not-a-volume";

// By what an item must be found, or the status of the answer.
std::string Expected(const Target& target, const std::string& where) {
  if (where == "no-volume") return kNoVolume;
  if (where == "nothing" || target.form == "other") return kNothing;
  const bool hasPath = target.form != "id" && target.form != "parent";
  if (where == "here" && hasPath) return "path";
  if (!target.isCreationTold) return kNothing;
  const bool hasMoved = where == "moved" && target.fate == "moves";
  const bool isGone = where == "moved" && target.fate == "goes";
  return isGone || (hasMoved && target.form == "parent") ? kNothing : "id";
}

// As Expected; "wrong" for another item than the target, "half" for one that is not all told,
// "misspelled" for a path that is not the stored one.
std::string Told(const Target& target, const nlohmann::json& answer, const struct statx& volume) {
  const bool isFound = answer.at("exists").get<bool>();
  for (const char* const key : {"target", "is_folder", "by"}) {
    if (answer.contains(key) != isFound) return "half";
  }
  if (answer.contains("error") == isFound) return "half";
  if (!isFound) return answer.at("status");
  const struct statx found = StatusOf(answer.at("target").get<std::string>());
  const bool isOnVolume =
      found.stx_dev_major == volume.stx_dev_major && found.stx_dev_minor == volume.stx_dev_minor;
  if (!isOnVolume || found.stx_ino != target.number) return "wrong";
  const std::string by = answer.at("by");
  return by == "path" && answer.at("target") != target.path ? "misspelled" : by;
}

int Check(const std::vector<Target>& targets, const std::string& answers, const fs::path& top,
          const std::string& where) {
  const struct statx volume = StatusOf(top);
  std::ifstream stream(answers);
  std::map<std::string, std::size_t> counts;
  std::size_t unexpected = 0;
  std::string line;
  for (const Target& target : targets) {
    if (!std::getline(stream, line)) throw std::runtime_error("an answer is missing");
    const nlohmann::json answer = nlohmann::json::parse(line);
    const std::string expected = Expected(target, where);
    const std::string told = Told(target, answer, volume);
    ++counts[told];
    if (told == expected || ++unexpected > 10) continue;
    std::cout << target.form << ' ' << target.fate << ' ' << target.number << ' ' << target.path
              << ": " << told << " instead of " << expected << ": " << answer.value("target", "")
              << '\n';
  }
  std::cout << targets.size() << " records:";
  for (const auto& [told, count] : counts) std::cout << ' ' << count << ' ' << told;
  std::cout << ", " << unexpected << " unexpected\n";
  return unexpected == 0 && !std::getline(stream, line) ? 0 : 1;
}

int Run(const std::vector<std::string>& given) {
  const std::string command = given.empty() ? "" : given[0];
  if (command == "write" && given.size() == 5) {
    return WriteRecords(given[1], std::stoul(given[2]), given[3] == "hfsplus", given[4]);
  }
  if (command == "move" && given.size() == 3) return Move(given[1], ReadTargets(given[2]));
  if (command == "check" && given.size() == 5) {
    return Check(ReadTargets(given[1]), given[2], given[3], given[4]);
  }
  return 2;
}

}  // namespace

int main(int count, char** arguments) {
  try {
    return Run({arguments + 1, arguments + count});
  } catch (const std::exception& error) {
    std::cerr << error.what() << '\n';
    return 1;
  }
}
