// Answers as a client reads them: arbitrary bytes, cut off anywhere.
#include <algorithm>
#include <memory>
#include <optional>
#include <string>

#include "client/Answers.h"
#include "fuzz/Check.h"
#include "service/Protocol.h"

namespace tallowmere::fuzz {
namespace {

constexpr std::size_t kLongestInput = 4096;

enum Kind { kFullPath, kPathByResult, kStringByFlag, kVolumeNumber, kSpec, kSettings, kKinds };

// The bytes at the very end of a block that is never reallocated, so that reading one byte too far
// leaves the block.
std::string_view AtTheEndOfABlock(std::string_view bytes) {
  static const auto block = std::make_unique<char[]>(kLongestInput);
  char* const begin = block.get() + kLongestInput - bytes.size();
  std::copy(bytes.begin(), bytes.end(), begin);
  return {begin, bytes.size()};
}

// The number in two bytes at an offset, the low byte first.
std::uint16_t NumberAt(std::string_view bytes, std::size_t at) {
  const auto low = static_cast<unsigned char>(bytes[at]);
  const auto high = static_cast<unsigned char>(bytes[at + 1]);
  return static_cast<std::uint16_t>(low | high << 8);
}

// Checks that the text is the string at this place of the answer, without its count and NUL. An
// absent or empty string must give no text.
void CheckString(std::string_view answer, std::size_t at, bool isThere,
                 const std::optional<std::string>& text) {
  const std::uint16_t count = NumberAt(answer, at);
  Check(text.has_value() == (isThere && count > 1));
  if (!text) return;
  Check(!text->empty() && count == text->size() + 1);
  Check(text->find('\0') == std::string::npos);
  Check(answer.substr(at + 2, count) == std::string_view(text->c_str(), text->size() + 1));
}

// Reads an answer of a kind and compares the results with the bytes.
void ReadAndCompare(AnswerReader& answer, std::string_view bytes, unsigned kind,
                    std::uint16_t size) {
  const auto isWhole = [&answer] {
    answer.TakeTrailer();
    return answer.IsWhole();
  };
  switch (kind) {
    case kFullPath: {
      const auto path = answer::ReadFullPath(answer, size);
      if (!isWhole()) return;
      Check(answer.Size() == sizeof path.wholeLength + size + protocol::kTrailer.size());
      Check(path.wholeLength == NumberAt(bytes, 0));
      Check(path.text.size() < size && bytes.substr(2, path.text.size()) == path.text);
      Check(bytes.find('\0', 2) == 2 + path.text.size());
      return;
    }
    case kPathByResult: {
      const auto path = answer::ReadPathByResult(answer);
      if (isWhole()) CheckString(bytes, sizeof(std::int16_t), NumberAt(bytes, 0) == 0, path);
      return;
    }
    case kStringByFlag: {
      const auto text = answer::ReadStringByFlag(answer);
      if (isWhole()) CheckString(bytes, 1, bytes[0] == 1, text);
      return;
    }
    case kVolumeNumber: {
      const auto number = answer::ReadVolumeNumber(answer);
      if (!isWhole()) return;
      const auto told = static_cast<std::int16_t>(NumberAt(bytes, 0));
      Check(number.has_value() == (told != protocol::kNoVolume));
      Check(!number || *number == told);
      return;
    }
    case kSpec: {
      const auto spec = answer::ReadSpec(answer);
      if (!isWhole()) return;
      Check(spec.has_value() == (bytes[0] == 1));
      if (!spec) return;
      Check(spec->name.size() <= protocol::kLongestSpecName);
      const std::string record = EncodeFSSpec(*spec);
      Check(DecodeFSSpec(record) == spec);
      const std::size_t used = record.size() - protocol::kLongestSpecName + spec->name.size();
      Check(bytes.substr(1, used) == std::string_view(record).substr(0, used));
      return;
    }
    default: {
      const auto settings = answer::ReadExportSettings(answer);
      if (!isWhole()) return;
      Check(settings.result == static_cast<std::int16_t>(NumberAt(bytes, 0)));
      Check(answer.Size() == 6 + settings.bytes.size() + protocol::kTrailer.size());
      Check(bytes.substr(6, settings.bytes.size()) == settings.bytes);
    }
  }
}

// The result of reading some bytes.
struct Outcome {
  std::string_view fault;
  std::size_t size = 0;    // of a whole answer; otherwise 0
  std::size_t needed = 0;  // of an incomplete answer; otherwise 0
};

Outcome Read(std::string_view bytes, unsigned kind, std::uint16_t size) {
  AnswerReader answer(bytes);
  ReadAndCompare(answer, bytes, kind, size);
  if (!answer.Fault().empty()) return {answer.Fault(), 0, 0};
  if (!answer.IsWhole()) {
    Check(answer.Needed() > bytes.size());
    return {{}, 0, answer.Needed()};
  }
  Check(answer.Size() > 0 && answer.Size() <= bytes.size());
  Check(bytes.substr(0, answer.Size()).ends_with(protocol::kTrailer));
  return {{}, answer.Size(), 0};
}

// Checks that the outcome for the first `count` bytes does not contradict that for all of them.
void CheckBeginning(std::string_view all, const Outcome& outcome, std::size_t count, unsigned kind,
                    std::uint16_t size) {
  const Outcome beginning = Read(AtTheEndOfABlock(all.substr(0, count)), kind, size);
  if (!beginning.fault.empty()) {
    Check(beginning.fault == outcome.fault);
  } else if (beginning.size != 0) {
    Check(beginning.size == outcome.size);
  } else {
    Check(outcome.size == 0 || beginning.needed <= outcome.size);
    Check(outcome.needed == 0 || beginning.needed <= outcome.needed);
  }
  if (outcome.size != 0) Check((beginning.size != 0) == (count >= outcome.size));
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: the kind, the buffer's size for a full path, where to cut, then the answer.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t dataSize) {
  using namespace tallowmere::fuzz;
  if (dataSize > kLongestInput) return 0;
  Input input(data, dataSize);
  const unsigned kind = input.TakeByte() % kKinds;
  const auto size = static_cast<std::uint16_t>(input.TakeTwoBytes());
  const std::size_t cut = input.TakeTwoBytes();
  const std::string_view bytes = input.Rest();

  const Outcome outcome = Read(bytes, kind, size);
  CheckBeginning(bytes, outcome, cut % (bytes.size() + 1), kind, size);
  if (outcome.size != 0) {
    CheckBeginning(bytes, outcome, outcome.size, kind, size);
    CheckBeginning(bytes, outcome, outcome.size - 1, kind, size);
  }
  return 0;
}
