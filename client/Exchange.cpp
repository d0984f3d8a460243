#include "client/Exchange.h"

#include "client/FullPathRequest.h"
#include "client/Quoted.h"
#include "service/Protocol.h"

namespace tallowmere::conversion {
namespace {

constexpr std::int16_t kNoSuchItem = -43;
constexpr std::int16_t kNoSuchFolder = -120;
constexpr std::int16_t kNotPermitted = -5000;

bool LeadsNowhere(const Result<answer::PathByResult>& answer) {
  return answer && (answer->code == kNoSuchItem || answer->code == kNoSuchFolder);
}

std::string VolumeOf(const std::string& fullPath) {
  return fullPath.substr(0, fullPath.find(protocol::kSeparator));
}

// What is wrong with the full HFS path of the folder at a path, by the answer where it leads.
std::optional<Error> WhatIsWrong(const std::string& path,
                                 const Result<answer::PathByResult>& answer) {
  if (!answer) return answer.Failure();
  const std::string name = Quoted(path);
  if (answer->code == kNotPermitted) {
    return Error{Outcome::kRefused, "the folders above " + name + " cannot all be looked at"};
  }
  if (answer->code != 0) {
    return Error{Outcome::kRefused, "the system fails on the way of the HFS path to " + name};
  }
  if (IsSameItem(answer->path, path)) return std::nullopt;
  return Error{Outcome::kAmbiguous,
               "the HFS path of " + name + " leads to " + Quoted(answer->path)};
}

// The same where it leads nowhere, by the answer where its volume's name leads. On the folder's own
// volume it does so when folders have been left out of it.
Error WhyNowhere(const std::string& path, const std::string& fullPath,
                 const Result<answer::PathByResult>& volume) {
  if (!volume) return volume.Failure();
  const std::string name = Quoted(path);
  if (volume->code == 0 && IsSameFileSystem(volume->path, path)) {
    return {Outcome::kRefused, "the folders above " + name + " cannot all be looked at"};
  }
  return {Outcome::kAmbiguous, "the HFS path of " + name + " leads to no folder of the volume " +
                                   "that is found as " + Quoted(Utf8OfHFSName(VolumeOf(fullPath)))};
}

Request<answer::PathByResult> RootOfVolume(const std::string& fullPath) {
  return request::PathAndResult(VolumeOf(fullPath) + protocol::kSeparator);
}

}  // namespace

void Exchange::Take(std::unique_ptr<Inquiry> question) {
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
  // Requests that the answers about a volume's root folder did not wait for.
  mBatch.Finish();
  mUnchecked.clear();
  mLost.clear();
  places.Forget();
  mVolumes.clear();
}

// A question is out of the line when its owner is told, so an exception from that leaves nothing
// half done.
void Exchange::TellThoseInTurn() {
  while (!mQuestions.empty() && mQuestions.front()->IsAnswered()) {
    const std::unique_ptr<Inquiry> first = std::move(mQuestions.front());
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
  for (FullPath& path : std::exchange(mLost, {})) {
    const auto request = RootOfVolume(path.text);
    mBatch.Add(request, [path = std::move(path)](const Result<answer::PathByResult>& volume) {
      path.folder->hasBeenAsked = volume.HasValue();
      path.folder->fullPath = WhyNowhere(path.folder->PathOrRoot(), path.text, volume);
    });
  }
  for (FullPath& path : std::exchange(mUnchecked, {})) {
    const auto request = request::PathAndResult(path.text);
    mBatch.Add(request, [this, path = std::move(path)](const Result<answer::PathByResult>& answer) {
      if (LeadsNowhere(answer)) return mLost.push_back(path);
      auto error = WhatIsWrong(path.folder->PathOrRoot(), answer);
      path.folder->hasBeenAsked = answer.HasValue();
      path.folder->fullPath = error ? Result<std::string>(*std::move(error)) : path.text;
    });
  }
}

std::optional<Error> Exchange::WhyNotBack(const std::string& fullPath, const std::string& path) {
  if (fullPath.size() > protocol::kLongestHFSPath) return std::nullopt;
  const auto answer = AskNow(request::PathAndResult(fullPath));
  if (!LeadsNowhere(answer)) return WhatIsWrong(path, answer);
  return WhyNowhere(path, fullPath, AskNow(RootOfVolume(fullPath)));
}

Result<bool> Exchange::IsVolume(std::int16_t number) {
  if (const auto known = mVolumes.find(number); known != mVolumes.end()) return known->second;
  const auto name = AskNow(request::GetHFSVolumeName(number));
  if (!name) return name.Failure();
  mVolumes.emplace(number, name->has_value());
  return name->has_value();
}

}  // namespace tallowmere::conversion
