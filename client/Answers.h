// How the answer to each request reads, up to the trailer. Pure functions of the bytes that have
// arrived: what they give counts only when the reader says that it was whole.
#pragma once

#include <tallowmere/Types.h>

#include <cstdint>
#include <optional>
#include <string>

#include "client/AnswerReader.h"

namespace tallowmere::answer {

// A full path in a buffer, and the length that it has when it is not shortened.
struct FullPath {
  std::uint16_t wholeLength;
  std::string text;
};
FullPath ReadFullPath(AnswerReader& answer, std::uint16_t size);

// A result code and a string; none unless the code is 0.
std::optional<std::string> ReadPathByResult(AnswerReader& answer);

// A flag and a string; none when the flag is 0 or the string is empty.
std::optional<std::string> ReadStringByFlag(AnswerReader& answer);

std::optional<std::int16_t> ReadVolumeNumber(AnswerReader& answer);
std::optional<FSSpec> ReadSpec(AnswerReader& answer);
ExportSettings ReadExportSettings(AnswerReader& answer);

}  // namespace tallowmere::answer
