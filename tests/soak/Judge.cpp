#include "Judge.h"

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <vector>

#include "Answers.h"

namespace tallowmere::soak {
namespace {

constexpr std::size_t kGraphsKept = 256;

// With other bytes than printable ones in hexadecimal, and no more zeros at the end than one.
std::string Readable(std::string bytes) {
  std::string text;
  for (std::size_t i = 0; i < bytes.size(); ++i) {
    const auto byte = static_cast<unsigned char>(bytes[i]);
    if (byte == 0 && bytes.find_first_not_of('\0', i) > i + 8) {
      text += "[zeros]";
      i = std::min(bytes.find_first_not_of('\0', i), bytes.size()) - 1;
    } else if (std::isprint(byte) != 0) {
      text += bytes[i];
    } else {
      char hexadecimal[8];
      std::snprintf(hexadecimal, sizeof hexadecimal, "<%02X>", byte);
      text += hexadecimal;
    }
  }
  return text;
}

// What was taken away in mid-question has the id of an item that is not on the volume that is
// named. The tree has no such ids: they begin with a bit that its inode numbers do not have.
bool IsRecordByMadeUpID(const Request& request, const std::string& response) {
  constexpr std::size_t kHighestByteOfID = 1 + 2 + 3;
  return request.code == 7 && (static_cast<unsigned char>(response[kHighestByteOfID]) & 0x80) != 0;
}

bool Has(const State& state, const Entry& entry) {
  return std::find(state.begin(), state.end(), entry) != state.end();
}

// The volume of a folder was unmounted before its name was asked for.
bool IsFullPathWithoutVolume(const Request& request, const std::string& response) {
  constexpr std::size_t kTextStart = sizeof(std::uint16_t);
  return request.code == 1 && response.size() > kTextStart && response[kTextStart] == ':';
}

}  // namespace

const Graph& Judge::GraphOf(History::Version version) {
  const auto found = mGraphs.find(version);
  if (found != mGraphs.end()) return found->second;
  if (mGraphs.size() > kGraphsKept) mGraphs.clear();
  return mGraphs.emplace(version, Graph({&mHistory.At(version)})).first->second;
}

Verdict Judge::Of(const Request& request, const std::string& response, History::Version first,
                  History::Version last) {
  bool hasChanged = false;
  Truth before;
  for (History::Version version = first; version <= last; ++version) {
    Truth truth = Answers(GraphOf(version), mPlace, request);
    if (truth.responses.contains(response)) return Verdict::kExact;
    if (version > first) {
      hasChanged |= truth.responses != before.responses || truth.trace != before.trace;
    }
    before = std::move(truth);
  }
  if (!hasChanged) return Verdict::kWrong;
  if (HonestErrors(mPlace, request).contains(response)) return Verdict::kHonestError;
  std::vector<const State*> states;
  for (History::Version version = first; version <= last; ++version) {
    states.push_back(&mHistory.At(version));
  }
  const Truth inSteps = Answers(Graph(states), mPlace, request);
  if (inSteps.responses.contains(response)) return Verdict::kMoved;
  if (IsRecordByMadeUpID(request, response)) return Verdict::kNowhere;
  if (IsFullPathWithoutVolume(request, response)) return Verdict::kNowhere;
  return inSteps.nowhere.contains(response) ? Verdict::kNowhere : Verdict::kWrong;
}

std::string Judge::Report(const Request& request, const std::string& response,
                          History::Version first, History::Version last) {
  std::string text = "request   " + TextOf(request) + "\nbytes     " +
                     Readable(BytesOf(request, mPlace)) + "\nresponse  " + Readable(response) +
                     "\n";
  for (History::Version version = first; version <= last; ++version) {
    const State& state = mHistory.At(version);
    const Truth truth = Answers(GraphOf(version), mPlace, request);
    text += "state " + std::to_string(version) + ", to be answered:";
    for (const std::string& expected : truth.responses) text += "\n          " + Readable(expected);
    text += "\n";
    static const State kNothing{};
    const State& before = version == first ? kNothing : mHistory.At(version - 1);
    if (state.other != before.other) text += "  other volume: " + TextOf(state.other) + "\n";
    for (const Entry& entry : before) {
      if (!Has(state, entry)) text += "  no more: " + TextOf(entry) + "\n";
    }
    for (const Entry& entry : state) {
      if (!Has(before, entry)) text += "  " + TextOf(entry) + "\n";
    }
  }
  return text;
}

}  // namespace tallowmere::soak
