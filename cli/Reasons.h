// Why there is no answer, in a few words for a person. Looked into only when there is none.
#pragma once

#include <tallowmere/Client.h>

#include <string>

namespace tallowmere::cli {

inline constexpr const char* kEmptyItem = "an empty text names nothing";

// Of an item that has no record.
std::string WhyNoRecord(const std::string& path);

// Of an item that has no HFS name or HFS path.
std::string WhyNoName(const std::string& path);

// Of a record that leads nowhere. `client` is not one whose answer is awaited.
std::string WhyNoPath(Client& client, const FSSpec& spec);

// Of an HFS path, in Mac Roman, that leads nowhere.
std::string WhyNoPath(Client& client, const std::string& hfsPath);

}  // namespace tallowmere::cli
