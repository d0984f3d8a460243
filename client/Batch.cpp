#include <tallowmere/Batch.h>

#include <memory>
#include <utility>

#include "client/Answers.h"
#include "client/Conversation.h"

namespace tallowmere {
namespace {

template <class T>
class QuestionWithHandler final : public Question {
 public:
  using Handler = std::function<void(Result<T>)>;

  QuestionWithHandler(typename Request<T>::Reader reader, std::optional<T> answer, Handler handler)
      : mReader(std::move(reader)), mAnswer(std::move(answer)), mHandler(std::move(handler)) {}

  void Read(AnswerReader& answer) override { mAnswer.emplace(mReader(answer)); }
  void Answer() override { mHandler(*std::move(mAnswer)); }
  void Fail(const Error& error) override { mHandler(error); }

 private:
  typename Request<T>::Reader mReader;
  std::optional<T> mAnswer;
  Handler mHandler;
};

}  // namespace

Batch::Batch(Client& client) : mConversation(*client.mConversation) {}

Batch::~Batch() {
  if (!mHasTurn) return;
  mConversation.Abandon();
  mConversation.GetTurn().Release();
}

bool Batch::TakeTurn() {
  if (!mHasTurn) mHasTurn = mConversation.GetTurn().Take();
  return mHasTurn;
}

template <class T>
void Batch::Add(const Request<T>& request,
                std::type_identity_t<std::function<void(Result<T>)>> handler) {
  if (!TakeTurn()) {
    return handler(Error{Outcome::kServiceFailed, "this thread uses the client already"});
  }
  mConversation.Put(request.mBytes, std::make_unique<QuestionWithHandler<T>>(
                                        request.mReader, request.mAnswer, std::move(handler)));
}

void Batch::Finish() {
  if (!mHasTurn) return;
  // When the last request's handler throws, the turn ends as well.
  struct EndOfTurn {
    Batch& batch;
    ~EndOfTurn() {
      if (!batch.mConversation.IsFinished()) return;
      batch.mHasTurn = false;
      batch.mConversation.GetTurn().Release();
    }
  };
  const EndOfTurn end{*this};
  mConversation.Finish();
}

// A batch of one.
template <class T>
Result<T> Client::Ask(const Request<T>& request) {
  std::optional<Result<T>> answer;
  Batch batch(*this);
  batch.Add(request, [&answer](Result<T> result) { answer.emplace(std::move(result)); });
  batch.Finish();
  return *std::move(answer);
}

// The types of answers to requests; there are no others.
#define TALLOWMERE_ANSWERED_WITH(...)                                                       \
  template void Batch::Add(const Request<__VA_ARGS__>&,                                     \
                           std::type_identity_t<std::function<void(Result<__VA_ARGS__>)>>); \
  template Result<__VA_ARGS__> Client::Ask(const Request<__VA_ARGS__>&)

TALLOWMERE_ANSWERED_WITH(std::string);
TALLOWMERE_ANSWERED_WITH(std::optional<std::string>);
TALLOWMERE_ANSWERED_WITH(std::optional<std::int16_t>);
TALLOWMERE_ANSWERED_WITH(std::optional<FSSpec>);
TALLOWMERE_ANSWERED_WITH(ExportSettings);
TALLOWMERE_ANSWERED_WITH(answer::FullPath);
TALLOWMERE_ANSWERED_WITH(answer::PathByResult);

}  // namespace tallowmere
