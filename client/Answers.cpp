#include "client/Answers.h"

#include <utility>

#include "service/Protocol.h"

namespace tallowmere::answer {
namespace {

// Far more than any settings need; a larger size is invalid.
constexpr std::uint32_t kMostSettings = 1 << 20;

std::optional<std::string> NoneIfEmpty(bool isThere, std::string text) {
  return isThere && !text.empty() ? std::optional(std::move(text)) : std::nullopt;
}

}  // namespace

FullPath ReadFullPath(AnswerReader& answer, std::uint16_t size) {
  const auto wholeLength = answer.Take<std::uint16_t>();
  return {wholeLength, answer.TakeBuffer(size)};
}

std::optional<std::string> ReadPathByResult(AnswerReader& answer) {
  auto [code, path] = ReadPathAndResult(answer);
  return NoneIfEmpty(code == 0, std::move(path));
}

PathByResult ReadPathAndResult(AnswerReader& answer) {
  const auto code = answer.Take<std::int16_t>();
  return {code, answer.TakeString()};
}

std::optional<std::string> ReadStringByFlag(AnswerReader& answer) {
  const bool isThere = answer.TakeFlag();
  return NoneIfEmpty(isThere, answer.TakeString());
}

std::optional<std::int16_t> ReadVolumeNumber(AnswerReader& answer) {
  const auto number = answer.Take<std::int16_t>();
  return number == protocol::kNoVolume ? std::nullopt : std::optional(number);
}

std::optional<FSSpec> ReadSpec(AnswerReader& answer) {
  const bool isUsable = answer.TakeFlag();
  FSSpec spec = answer.TakeSpec();
  return isUsable ? std::optional(std::move(spec)) : std::nullopt;
}

ExportSettings ReadExportSettings(AnswerReader& answer) {
  const auto result = answer.Take<std::int16_t>();
  const auto size = answer.Take<std::uint32_t>();
  if (size > kMostSettings) answer.Refuse();
  return {result, std::string(answer.TakeBytes(size))};
}

}  // namespace tallowmere::answer
