#include "client/Exchange.h"

#include "client/FullPathRequest.h"
#include "client/Quoted.h"
#include "service/Protocol.h"

namespace tallowmere::conversion {
namespace {

// What is wrong with the full HFS path of the folder at a path, by the answer where it leads.
std::optional<Error> WhatIsWrong(const std::string& path,
                                 const Result<answer::PathByResult>& answer) {
  if (!answer) return answer.Failure();
  const std::string name = Quoted(path);
  if (answer->code != 0) {
    return Error{Outcome::kRefused, "the folders above " + name + " cannot all be looked at"};
  }
  if (IsSameItem(answer->path, path)) return std::nullopt;
  return Error{Outcome::kAmbiguous,
               "the HFS path of " + name + " leads to " + Quoted(answer->path)};
}

}  // namespace

void Exchange::Take(std::unique_ptr<Question> question) {
  mQuestions.push_back(std::move(question));
  PutChecks();
  TellThoseInTurn();
}

void Exchange::Finish() {
  while (!mQuestions.empty()) {
    mBatch.Finish();
    PutChecks();
    mBatch.Finish();
    TellThoseInTurn();
  }
  places.Forget();
  mVolumes.clear();
}

// A question is out of the line when its owner is told, so an exception from that leaves nothing
// half done.
void Exchange::TellThoseInTurn() {
  while (!mQuestions.empty() && mQuestions.front()->IsAnswered()) {
    const std::unique_ptr<Question> first = std::move(mQuestions.front());
    mQuestions.pop_front();
    first->Tell(*this);
  }
}

void Exchange::PutFullPathOf(const std::shared_ptr<Folder>& folder) {
  if (std::exchange(folder->hasBeenAsked, true)) return;
  folder->fullPath.reset();
  mBatch.Add(request::MakeFullPath(folder->PathOrRoot()),
             [this, folder](Result<std::string> answer) {
               if (answer && answer->size() <= protocol::kLongestHFSPath) {
                 mUnchecked.push_back({folder, *std::move(answer)});
                 return;
               }
               folder->hasBeenAsked = answer.HasValue();
               folder->fullPath.emplace(std::move(answer));
             });
}

void Exchange::PutChecks() {
  for (FullPath& path : std::exchange(mUnchecked, {})) {
    const auto request = request::PathAndResult(path.text);
    mBatch.Add(request, [path = std::move(path)](const Result<answer::PathByResult>& answer) {
      auto error = WhatIsWrong(path.folder->PathOrRoot(), answer);
      path.folder->hasBeenAsked = answer.HasValue();
      path.folder->fullPath = error ? Result<std::string>(*std::move(error)) : path.text;
    });
  }
}

std::optional<Error> Exchange::WhyNotBack(const std::string& fullPath, const std::string& path) {
  if (fullPath.size() > protocol::kLongestHFSPath) return std::nullopt;
  return WhatIsWrong(path, AskNow(request::PathAndResult(fullPath)));
}

Result<bool> Exchange::IsVolume(std::int16_t number) {
  if (const auto known = mVolumes.find(number); known != mVolumes.end()) return known->second;
  const auto name = AskNow(request::GetHFSVolumeName(number));
  if (!name) return name.Failure();
  mVolumes.emplace(number, name->has_value());
  return name->has_value();
}

}  // namespace tallowmere::conversion
