#include "cli/OldVolumes.h"

#include <tallowmere/Volumes.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <set>
#include <utility>

namespace tallowmere::cli {
namespace {

constexpr std::int32_t kParentOfRoots = 1;  // the parent id of a volume's root folder

}  // namespace

std::optional<OldPlace> ReadPlace(const std::string& text) {
  const std::size_t equals = text.find('=');
  if (equals == 0 || equals == text.npos || equals + 1 == text.size()) return std::nullopt;
  return OldPlace{text.substr(0, equals), text.substr(equals + 1)};
}

std::string KeyOfVolume(const std::string& old) {
  return HFSNameOfUtf8(old).value_or(old);
}

Result<std::vector<OldPlace>> ReadTable(const std::string& file) {
  std::ifstream input(file);
  std::vector<OldPlace> places;
  std::set<std::string> seen;
  std::size_t number = 0;
  for (std::string line; std::getline(input, line);) {
    ++number;
    if (line.ends_with('\r')) line.pop_back();
    if (line.empty() || line.front() == '#') continue;
    auto place = ReadPlace(line);
    const std::string where = file + ", line " + std::to_string(number) + ": ";
    if (!place) return Error{Outcome::kInvalid, where + "it is no OLD-NUMBER-OR-NAME=PLACE"};
    if (!seen.insert(KeyOfVolume(place->old)).second) {
      return Error{Outcome::kAmbiguous, where + '"' + place->old + "\" has a place already"};
    }
    places.push_back(*std::move(place));
  }
  if (!input.is_open() || input.bad()) {
    return Error{Outcome::kInvalid, file + ": " + std::strerror(errno)};
  }
  return places;
}

Result<OldNumbers> OldNumbers::Read(Client& client, const OldPlaces& places) {
  OldNumbers numbers;
  const auto find = [&client](const std::string& place) -> Result<Known> {
    auto volume = FindVolume(client, place);
    if (!volume) return volume.Failure();
    return Known{volume->number, std::move(volume->name)};
  };
  if (!places.volume.empty()) {
    const auto all = find(places.volume);
    if (!all) return all.Failure();
    numbers.mAll = *all;
  }
  if (places.table.empty()) return numbers;
  const auto table = ReadTable(places.table);
  if (!table) return table.Failure();
  numbers.mIsTable = true;
  for (const auto& [old, place] : *table) numbers.mKnown.emplace(KeyOfVolume(old), find(place));
  return numbers;
}

const Result<OldNumbers::Known>* OldNumbers::KnownOf(const FSSpec& record) const {
  auto found = mKnown.find(std::to_string(record.vRefNum));
  if (found == mKnown.end() && record.parID == kParentOfRoots) found = mKnown.find(record.name);
  return found == mKnown.end() ? nullptr : &found->second;
}

bool OldNumbers::AreToldFor(const FSSpec& record) const {
  return mAll || (mIsTable && KnownOf(record) != nullptr);
}

Result<FSSpec> OldNumbers::Here(FSSpec record) const {
  if (!mAll && !mIsTable) return record;
  if (!AreToldFor(record)) {
    return Error{Outcome::kNotAVolume, "the table has no volume " + std::to_string(record.vRefNum)};
  }
  const Result<Known> known = mAll ? Result<Known>(*mAll) : *KnownOf(record);
  if (!known) return known.Failure();
  record.vRefNum = known->number;
  if (record.parID == kParentOfRoots) record.name = known->name;
  return record;
}

}  // namespace tallowmere::cli
