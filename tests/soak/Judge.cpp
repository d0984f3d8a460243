#include "Judge.h"

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <set>
#include <vector>

#include "Answers.h"
#include "Leads.h"
#include "support/Wire.h"

namespace tallowmere::soak {
namespace {

constexpr std::size_t kGraphsKept = 256;

// Shows unprintable bytes in hexadecimal and abbreviates runs of zeros.
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

// Returns the record with 0 in place of a made-up id, or an empty string when it has none. An item
// removed mid-request gets the made-up id of an item that is not on the named volume. No item of
// the tree has such an id.
std::string WithoutMadeUpID(std::string response) {
  constexpr std::size_t kIDStart = sizeof(std::uint8_t) + sizeof(std::int16_t);
  constexpr std::uint32_t kFirstMadeUpID = 0x80000000;
  constexpr std::uint32_t kLastMadeUpID = 0xFFFFFFEF;
  std::uint32_t id = 0;
  if (response.size() < kIDStart + sizeof id) return {};
  std::memcpy(&id, response.data() + kIDStart, sizeof id);
  if (id < kFirstMadeUpID || id > kLastMadeUpID) return {};
  std::memset(response.data() + kIDStart, 0, sizeof id);
  return response;
}

bool Has(const State& state, const Entry& entry) {
  return std::find(state.begin(), state.end(), entry) != state.end();
}

// Returns whether a folder cannot be identified by its number: it is covered, or shares the number.
bool HidesFolders(const State& state) {
  std::set<std::uint64_t> numbers;
  const auto isShared = [&](const Entry& entry) {
    return entry.kind == Kind::kFolder && !numbers.insert(entry.inode).second;
  };
  return state.other.root != kNoNode || std::any_of(state.begin(), state.end(), isShared);
}

// Returns the request and what it turns into: once code 8 has found a record, it continues as code
// 9 and searches the other volumes, which may have an item of that number and name.
std::vector<Request> StagesOf(const Request& request) {
  std::vector<Request> stages{request};
  if (request.code == 8 && request.hfsName.size() <= kLongestRecordName) {
    stages.push_back(request);
    stages.back().code = 9;
    stages.back().search = true;
  }
  return stages;
}

}  // namespace

const Graph& Judge::GraphOf(History::Version version) {
  const auto found = mGraphs.find(version);
  if (found != mGraphs.end()) return found->second;
  if (mGraphs.size() > kGraphsKept) mGraphs.clear();
  return mGraphs.emplace(version, Graph({&mHistory.At(version)})).first->second;
}

bool Judge::IsServersError(const Request& request, const std::string& response) const {
  return mNumbers != Numbers::kTrusted && request.code == 2 &&
         response == test::ResultResponse(test::kResultSystemError);
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
  const bool canBeUndetermined =
      mNumbers == Numbers::kUntrusted && (first < last || HidesFolders(mHistory.At(first)));
  if (!hasChanged && !canBeUndetermined) return Verdict::kWrong;
  std::vector<const State*> states;
  for (History::Version version = first; version <= last; ++version) {
    states.push_back(&mHistory.At(version));
  }
  // A second copy of the only state counts as several states, whose answers may be undetermined.
  if (first == last) states.push_back(states.front());
  const Truth inSteps = Answers(Graph(states), mPlace, request);
  if (inSteps.honestErrors.contains(response)) return Verdict::kHonestError;
  if (IsServersError(request, response)) return Verdict::kHonestError;
  switch (DestinationOf(states, request, response)) {
    case Destination::kMeant:
      return inSteps.responses.contains(response) ? Verdict::kMoved : Verdict::kWrong;
    case Destination::kNone:
      if (inSteps.responses.contains(response)) return Verdict::kMoved;
      return inSteps.nowhere.contains(response) ||
                     inSteps.byMadeUpID.contains(WithoutMadeUpID(response))
                 ? Verdict::kNowhere
                 : Verdict::kWrong;
    case Destination::kAnother:
      // A request to an untrusted volume takes so long that a path found at its end may have led
      // elsewhere at its beginning.
      if (mNumbers == Numbers::kUntrusted && inSteps.responses.contains(response) &&
          LeadsTo(GraphOf(last), mPlace, request.code, response).empty()) {
        return Verdict::kNowhere;
      }
      break;
  }
  return Verdict::kWrong;
}

// The item meant in a state is the one to which the exact answer in that state leads.
Judge::Destination Judge::DestinationOf(const std::vector<const State*>& states,
                                        const Request& request, const std::string& response) const {
  std::set<Node> reached;
  std::set<Node> meant = LedToInPassing(states, request);
  for (const State* const state : states) {
    const Graph graph({state});
    reached.merge(LeadsTo(graph, mPlace, request.code, response));
    for (const Request& stage : StagesOf(request)) {
      for (const std::string& exact : Answers(graph, mPlace, stage).responses)
        meant.merge(LeadsTo(graph, mPlace, stage.code, exact));
    }
  }
  if (reached.empty()) return Destination::kNone;
  const bool isMeant =
      std::any_of(reached.begin(), reached.end(), [&](Node node) { return meant.contains(node); });
  return isMeant ? Destination::kMeant : Destination::kAnother;
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
