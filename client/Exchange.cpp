#include "client/Exchange.h"

namespace tallowmere::conversion {

void Exchange::Take(std::unique_ptr<Question> question) {
  mQuestions.push_back(std::move(question));
  while (!mQuestions.empty() && mQuestions.front()->IsAnswered()) TellFirst();
}

void Exchange::Finish() {
  while (!mQuestions.empty()) {
    mBatch.Finish();
    TellFirst();
  }
  places.Forget();
  mVolumes.clear();
}

// The question is out of the line when its owner is told, so an exception from that leaves nothing
// half done.
void Exchange::TellFirst() {
  const std::unique_ptr<Question> first = std::move(mQuestions.front());
  mQuestions.pop_front();
  first->Tell(*this);
}

void Exchange::PutFullPathOf(const std::shared_ptr<Folder>& folder) {
  if (std::exchange(folder->hasBeenAsked, true)) return;
  mBatch.Add(request::MakeFullPath(folder->PathOrRoot()), [folder](Result<std::string> answer) {
    folder->hasBeenAsked = answer.HasValue();
    folder->fullPath.emplace(std::move(answer));
  });
}

Result<bool> Exchange::IsVolume(std::int16_t number) {
  if (const auto known = mVolumes.find(number); known != mVolumes.end()) return known->second;
  const auto name = AskNow(request::GetHFSVolumeName(number));
  if (!name) return name.Failure();
  mVolumes.emplace(number, name->has_value());
  return name->has_value();
}

}  // namespace tallowmere::conversion
