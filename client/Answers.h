// Reads the answer to each request, up to the trailer. Pure functions of the bytes that have
// arrived: a result counts only when the reader reports that it is whole.
#pragma once

#include <tallowmere/Types.h>

#include <cstdint>
#include <optional>
#include <string>

#include "client/AnswerReader.h"

namespace tallowmere::answer {

// A full path in a buffer, and its length before shortening.
struct FullPath {
  std::uint16_t wholeLength;
  std::string text;
};
FullPath ReadFullPath(AnswerReader& answer, std::uint16_t size);

// A result code and a string. Nullopt unless the code is 0.
std::optional<std::string> ReadPathByResult(AnswerReader& answer);

// The same with the code, and an empty path where there is none.
struct PathByResult {
  std::int16_t code;
  std::string path;
};
PathByResult ReadPathAndResult(AnswerReader& answer);

// A flag and a string. Nullopt when the flag is 0 or the string is empty.
std::optional<std::string> ReadStringByFlag(AnswerReader& answer);

std::optional<std::int16_t> ReadVolumeNumber(AnswerReader& answer);
std::optional<FSSpec> ReadSpec(AnswerReader& answer);
ExportSettings ReadExportSettings(AnswerReader& answer);

}  // namespace tallowmere::answer
