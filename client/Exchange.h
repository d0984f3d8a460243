// The questions of one converter, in line, and their requests to the service.
#pragma once

#include <tallowmere/Batch.h>

#include <cstddef>
#include <cstdint>
#include <deque>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "client/Places.h"

namespace tallowmere::conversion {

class Exchange;

// A question that waits in line until its answer may be told.
class Inquiry {
 public:
  Inquiry() = default;
  Inquiry(const Inquiry&) = delete;
  Inquiry& operator=(const Inquiry&) = delete;
  virtual ~Inquiry() = default;

  // Whether everything that was asked for it has been answered.
  virtual bool IsAnswered() const { return mAwaited == 0; }

  // Tells the answer; may ask more first, and wait. REQUIRES: IsAnswered(), and all questions
  // before it have been told.
  virtual void Tell(Exchange& exchange) = 0;

 private:
  friend class Exchange;

  std::size_t mAwaited = 0;  // requests under way
};

// The questions of one converter, and their way to the service.
class Exchange {
 public:
  Exchange(Client& client, bool resolves) : places(resolves), mBatch(client) {}

  // Puts a request for a question; `store` keeps its answer.
  template <class T>
  void Put(const Request<T>& request, Inquiry& question, std::optional<Result<T>>& store) {
    ++question.mAwaited;
    mBatch.Add(request, [&question, &store](Result<T> answer) {
      store.emplace(std::move(answer));
      --question.mAwaited;
    });
  }

  // Asks at once, and waits for the answer, and for those of all requests before.
  template <class T>
  Result<T> AskNow(const Request<T>& request) {
    std::optional<Result<T>> answer;
    mBatch.Add(request, [&answer](Result<T> result) { answer.emplace(std::move(result)); });
    mBatch.Finish();
    return *std::move(answer);
  }

  // Takes a question in whose requests have been put; tells those whose turn it is.
  void Take(std::unique_ptr<Inquiry> question);

  // Waits for all answers and tells them.
  void Finish();

  // Asks for a folder's full path, once, and whether it leads back to the folder; the answer goes
  // into the folder. A path does not lead back where the folders above cannot be looked at, and
  // where two volumes have one name. One too long to ask about is taken as it is.
  void PutFullPathOf(const std::shared_ptr<Folder>& folder);

  // Why the full HFS path of the folder at a path does not lead back to it, asked at once; nullopt
  // when it does, and when it is too long to be asked about.
  std::optional<Error> WhyNotBack(const std::string& fullPath, const std::string& path);

  // Whether a volume with the number is mounted; asked once.
  Result<bool> IsVolume(std::int16_t number);

  Places places;

 private:
  struct FullPath {
    std::shared_ptr<Folder> folder;
    std::string text;
  };

  void PutChecks();
  void TellThoseInTurn();

  Batch mBatch;
  std::vector<FullPath> mUnchecked;
  std::vector<FullPath> mLost;  // those that lead nowhere
  std::deque<std::unique_ptr<Inquiry>> mQuestions;
  std::map<std::int16_t, bool> mVolumes;
};

}  // namespace tallowmere::conversion
