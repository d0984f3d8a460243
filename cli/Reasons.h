// Why there is no answer, in a few words for a person. Looked into only when there is none.
#pragma once

#include <tallowmere/Client.h>

#include <string>

namespace tallowmere::cli {

inline constexpr const char* kEmptyItem = "an empty text names nothing";

// Why an item has no record.
std::string WhyNoRecord(const std::string& path);

// Why an item has no HFS name or HFS path.
std::string WhyNoName(const std::string& path);

// Why a record leads nowhere. REQUIRES: no answer of `client` is awaited.
std::string WhyNoPath(Client& client, const FSSpec& spec);

// Why an HFS path, in Mac Roman, leads nowhere.
std::string WhyNoPath(Client& client, const std::string& hfsPath);

}  // namespace tallowmere::cli
