#include "Questions.h"

#include <unistd.h>

#include <cstring>
#include <iterator>
#include <thread>

#include "BigTree.h"
#include "Server.h"
#include "support/Wire.h"

namespace tallowmere::benchmark {
namespace {

using namespace tallowmere::test;

constexpr std::size_t kSettingsSize = 144;

// The answer of a new service to one question, without its trailer, which is checked.
std::string AnswerTo(Server& service, const Question& question) {
  std::string answer(service.Ask(question.request, question.answerSize));
  if (!answer.ends_with(kTrailer)) Fail("an answer of an unexpected size");
  answer.resize(answer.size() - kTrailer.size());
  return answer;
}

std::size_t SizeOfString(const std::string& text) {
  return sizeof(std::uint16_t) + text.size() + 1;
}

template <class Number>
Number NumberAt(const std::string& bytes, std::size_t offset) {
  Number number;
  std::memcpy(&number, bytes.data() + offset, sizeof number);
  return number;
}

// The answer tells the length of the name.
std::string NameOfVolume(Server& service, int number) {
  const std::size_t head = 1 + sizeof(std::uint16_t);
  const std::string size(service.Ask(VolumeNameRequest(number), head));
  const std::size_t length = NumberAt<std::uint16_t>(size, 1);
  return std::string(service.Ask({}, length + kTrailer.size()).substr(0, length - 1));
}

Item ItemWithRecord(Server& service, const std::filesystem::path& path) {
  Item item{};
  item.path = path;
  const std::string answer = AnswerTo(service, QuestionOf(protocol::kRequestGetFSSpec, item));
  if (answer[0] != 1) Fail("no record of " + item.path);
  item.record = answer.substr(1);
  return item;
}

// The size of an answer's fields in bytes.
std::size_t SizeOfAnswer(protocol::RequestCode code, const Item& item) {
  switch (code) {
    case protocol::kRequestQuit:
      break;
    case protocol::kRequestMakeFullPath:
      return sizeof(std::uint16_t) + kRoomForAFullPath;
    case protocol::kRequestMakeFileRefFromPath:
      return sizeof(std::int16_t) + SizeOfString(item.path);
    case protocol::kRequestGetVolRefnumByHFSName:
      return sizeof(std::int16_t);
    case protocol::kRequestGetHFSVolumeName:
      return 1 + SizeOfString(item.volumeName);
    case protocol::kRequestGetHFSName:
      return 1 + SizeOfString(item.name);
    case protocol::kRequestGetFSSpec:
      return 1 + protocol::kFileSpecSize;
    case protocol::kRequestAddHFSName:
    case protocol::kRequestSetFileRefFromFSSpecData:
    case protocol::kRequestSetFileRefFromFSSpec:
      return 1 + SizeOfString(item.path);
    case protocol::kRequestGetAIFFExportSettings:
      return sizeof(std::int16_t) + sizeof(std::uint32_t) + kSettingsSize;
  }
  Fail("no such request");
}

}  // namespace

std::filesystem::path SettledFile(const Settings& settings, int components) {
  std::filesystem::path path = settings.folder;
  // The root directory counts as a component here; the file does not yet.
  for (auto depth = std::distance(path.begin(), path.end()); depth < components; ++depth) {
    path /= "folder " + std::to_string(depth);
  }
  std::filesystem::create_directories(path);
  path /= "a track.aif";
  if (!std::filesystem::exists(path)) {
    MakeEmptyFile(path);
    std::this_thread::sleep_for(settings.settle);
  }
  return path;
}

Item AskAbout(const std::string& program, const std::filesystem::path& path) {
  Server service(program, {std::to_string(getpid())});
  Item item = ItemWithRecord(service, path);
  item.folder = path.parent_path();
  item.name = path.filename();
  item.volume = NumberAt<std::int16_t>(item.record, 0);
  item.folderID = NumberAt<std::int32_t>(item.record, sizeof(std::int16_t));
  item.volumeName = NameOfVolume(service, item.volume);
  const std::string full = AnswerTo(service, QuestionOf(protocol::kRequestMakeFullPath, item));
  item.fullPath = full.c_str() + sizeof(std::uint16_t);
  const std::string back =
      AnswerTo(service, QuestionOf(protocol::kRequestSetFileRefFromFSSpec, item));
  if (back.c_str() + 1 + sizeof(std::uint16_t) != item.path) Fail("no way back to " + item.path);
  return item;
}

std::vector<Item> RecordsOf(const std::string& program,
                            const std::vector<std::filesystem::path>& paths) {
  Server service(program, {std::to_string(getpid())});
  std::vector<Item> items;
  items.reserve(paths.size());
  for (const auto& path : paths) items.push_back(ItemWithRecord(service, path));
  return items;
}

Question QuestionOf(protocol::RequestCode code, const Item& item) {
  return {RequestAbout(item, code), SizeOfAnswer(code, item) + kTrailer.size()};
}

}  // namespace tallowmere::benchmark
