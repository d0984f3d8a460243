// old_items make FOLDER COUNT hfs|hfsplus: fills an old volume with folders, files, and where it
// can have them links, whose names are hard to bring back.
//
// old_items records SERVICE FOLDER OUTPUT: asks for the record of every item and writes, into the
// folder OUTPUT, the paths with a NUL behind each and the records of 70 bytes as other machines
// stored them, in the order of the paths:
//
//   paths       what the records stand for
//   big, little both byte orders, with the volume number of another machine
//   other-case  big, each letter of a name in the other case where the name is the item's own
//   own         with the number that the volume has here, in this machine's byte order

#include <fcntl.h>
#include <sys/stat.h>
#include <tallowmere/Client.h>
#include <unistd.h>

#include <bit>
#include <cctype>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

constexpr int kItemsInAFolder = 100;
constexpr std::int16_t kForeignNumber = -3000;  // of no volume here
constexpr std::size_t kNameLength = 63;

void Require(bool isDone, const std::string& what) {
  if (!isDone) throw std::runtime_error(what + ": " + std::strerror(errno));
}

void MakeFile(const std::string& path) {
  const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644);
  Require(file >= 0, path);
  close(file);
}

// `text` so often that `number` and it have `characters` characters, each of `bytes` bytes.
std::string Filled(const std::string& number, const std::string& text, std::size_t characters) {
  std::string name = number;
  for (std::size_t at = number.size(); at < characters; ++at) name += text;
  return name;
}

std::vector<std::string> Names(const std::string& number, bool isPlus) {
  std::vector<std::string> names{
      "Read Me " + number,
      "caf\xC3\xA9 " + number,                       // precomposed
      "a:b " + number + ".aif",                      // '/' on the disk
      "na\xC3\xAFve#1F " + number + ".aif",          // reads nearly as a short form
      Filled(number + " ", "n", 31),                 // the longest of a classic volume
      "\xE2\x88\x9A\xC2\xA9\xE2\x82\xAC " + number,  // √©€
  };
  if (!isPlus) return names;
  names.insert(names.end(),
               {"re\xCC\x81sume\xCC\x81 " + number,                // decomposed
                "\xE6\x97\xA5\xE6\x9C\xAC\xE8\xAA\x9E " + number,  // Japanese
                Filled(number + " ", "N", 255), Filled(number, "\xE3\x81\x82", 255),
                "A name of more than 31 characters " + number + ".aif"});
  return names;
}

void MakeLinks(const std::string& folder, const std::string& number) {
  const std::string target = folder + "/Read Me " + number;
  const std::string hard = folder + "/Hard Link " + number;
  Require(link(target.c_str(), hard.c_str()) == 0, hard);
  for (const char* const leadsTo : {"nowhere", "/"}) {
    const std::string soft = folder + "/Link to " + (leadsTo[0] == '/' ? "Root " : "") + number;
    Require(symlink(leadsTo, soft.c_str()) == 0, soft);
  }
}

int Make(const std::string& top, int count, bool isPlus) {
  std::string folder;
  int made = 0;
  for (int number = 0; made < count; ++number) {
    const std::string digits = std::to_string(number);
    if (folder.empty() || made % (10 * kItemsInAFolder) < 12) folder = top;
    if (made / kItemsInAFolder != (made - 14) / kItemsInAFolder || folder == top) {
      folder += "/Folder \xC3\xA9 " + digits;
      Require(mkdir(folder.c_str(), 0755) == 0, folder);
      ++made;
    }
    const auto names = Names(digits, isPlus);
    for (const std::string& name : names) MakeFile(folder + "/" + name);
    if (isPlus) MakeLinks(folder, digits);
    made += static_cast<int>(names.size()) + (isPlus ? 3 : 0);
  }
  sync();
  return 0;
}

void AppendNumber(std::string& bytes, std::uint32_t number, int size, std::endian order) {
  for (int at = 0; at < size; ++at) {
    const int shift = 8 * (order == std::endian::big ? size - 1 - at : at);
    bytes.push_back(static_cast<char>(number >> shift));
  }
}

std::string Stored(const tallowmere::FSSpec& spec, std::int16_t volume, std::endian order) {
  std::string bytes;
  AppendNumber(bytes, static_cast<std::uint16_t>(volume), 2, order);
  AppendNumber(bytes, static_cast<std::uint32_t>(spec.parID), 4, order);
  bytes.push_back(static_cast<char>(spec.name.size()));
  bytes += spec.name;
  // What old programs left behind a name is anything.
  return bytes.append(kNameLength - spec.name.size(), '\xAA');
}

// Short forms have the id in capitals.
std::string InOtherCase(std::string name) {
  if (name.find('#') != std::string::npos) return name;
  for (char& letter : name) {
    const auto byte = static_cast<unsigned char>(letter);
    if (byte < 0x80)
      letter = static_cast<char>(std::isupper(byte) ? std::tolower(byte) : std::toupper(byte));
  }
  return name;
}

int WriteRecords(const std::string& service, const std::string& top, const std::string& output) {
  tallowmere::Client client({.service = service, .deadline = std::chrono::minutes(5)});
  std::ofstream paths(output + "/paths");
  std::ofstream big(output + "/big");
  std::ofstream little(output + "/little");
  std::ofstream otherCase(output + "/other-case");
  std::ofstream own(output + "/own");
  for (const auto& item : std::filesystem::recursive_directory_iterator(top)) {
    const auto answer = client.GetFSSpec(item.path().string());
    if (!answer || !*answer) throw std::runtime_error(item.path().string() + " has no record");
    tallowmere::FSSpec spec = **answer;
    paths << item.path().string() << '\0';
    big << Stored(spec, kForeignNumber, std::endian::big);
    little << Stored(spec, kForeignNumber, std::endian::little);
    own << Stored(spec, spec.vRefNum, std::endian::native);
    spec.name = InOtherCase(spec.name);
    otherCase << Stored(spec, kForeignNumber, std::endian::big);
  }
  return paths && big && little && otherCase && own ? 0 : 1;
}

}  // namespace

int main(int count, char** arguments) {
  const std::vector<std::string> given(arguments + 1, arguments + count);
  try {
    if (given.size() == 4 && given[0] == "make") {
      return Make(given[1], std::atoi(given[2].c_str()), given[3] == "hfsplus");
    }
    if (given.size() == 4 && given[0] == "records")
      return WriteRecords(given[1], given[2], given[3]);
  } catch (const std::exception& error) {
    std::cerr << error.what() << '\n';
    return 1;
  }
  return 2;
}
