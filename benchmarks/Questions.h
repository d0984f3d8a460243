// The requests about one real item, and how long their answers are.
#pragma once

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <string>

#include "Measure.h"
#include "service/Protocol.h"

namespace tallowmere::benchmark {

// As the service under measurement knows it.
struct Item {
  std::string path;
  std::string folder;  // that holds it
  std::string name;    // which is its HFS name too
  std::string record;  // 70 bytes
  int volume;
  std::int32_t folderID;
  std::string volumeName;
  std::string fullPath;  // of the folder, in HFS form
};

// The path of an empty file in the settings' folder that has so many components, or the fewest that
// there can be; made unless it is there, and left alone until it is as any old file.
std::filesystem::path SettledFile(const Settings& settings, int components);

// Asks the service at `program` about an existing item. Fails where its answers are not those for
// an item with a plain name.
Item AskAbout(const std::string& program, const std::filesystem::path& path);

struct Question {
  std::string request;
  std::size_t answerSize;  // in bytes
};

// REQUIRES: any code but kRequestQuit.
Question QuestionOf(protocol::RequestCode code, const Item& item);

}  // namespace tallowmere::benchmark
