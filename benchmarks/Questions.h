// The requests about one real item, and how long their answers are.
#pragma once

#include <cstddef>
#include <filesystem>
#include <string>
#include <vector>

#include "Measure.h"
#include "service/Protocol.h"
#include "support/EveryRequest.h"

namespace tallowmere::benchmark {

using test::Item;

// The path of an empty file in the settings' folder that has so many components, or the fewest that
// there can be; made unless it is there, and left alone until it is as any old file.
std::filesystem::path SettledFile(const Settings& settings, int components);

// Asks the service at `program` about an existing item. Fails where its answers are not those for
// an item with a plain name.
Item AskAbout(const std::string& program, const std::filesystem::path& path);

// Existing items with their paths and records alone, told by the service at `program`.
std::vector<Item> RecordsOf(const std::string& program,
                            const std::vector<std::filesystem::path>& paths);

struct Question {
  std::string request;
  std::size_t answerSize;  // in bytes
};

// REQUIRES: any code but kRequestQuit.
Question QuestionOf(protocol::RequestCode code, const Item& item);

}  // namespace tallowmere::benchmark
