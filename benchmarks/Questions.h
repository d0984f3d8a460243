// The requests about one real item, and the sizes of their answers.
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

// The path of an empty file in the settings' folder with this many components, or the fewest
// possible. Makes the file unless it exists, and waits until it is treated as any old file.
std::filesystem::path SettledFile(const Settings& settings, int components);

// Asks the service at `program` about an existing item. Fails when the answers are not those for an
// item with a plain name.
Item AskAbout(const std::string& program, const std::filesystem::path& path);

// Existing items with only their paths and records, as told by the service at `program`.
std::vector<Item> RecordsOf(const std::string& program,
                            const std::vector<std::filesystem::path>& paths);

struct Question {
  std::string request;
  std::size_t answerSize;  // in bytes
};

// REQUIRES: the code is not kRequestQuit.
Question QuestionOf(protocol::RequestCode code, const Item& item);

}  // namespace tallowmere::benchmark
