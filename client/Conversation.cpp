#include "client/Conversation.h"

#include <algorithm>
#include <array>
#include <string>
#include <thread>
#include <utility>

#include "client/AnswerReader.h"
#include "client/FindService.h"
#include "client/Mounts.h"
#include "client/RequestText.h"

namespace tallowmere {
namespace {

using std::chrono::milliseconds;
using std::chrono::steady_clock;

// The most questions and bytes under way; a question larger than that goes alone.
constexpr std::size_t kMostQuestions = 256;
constexpr std::size_t kMostBytes = 65536;

// With more to come, a smaller piece is not worth a write.
constexpr std::size_t kPieceToSend = 4096;

constexpr std::size_t kPieceToReceive = 16384;

// While the service has this many questions, answers are left to gather for a while: waking up for
// each of them would cost more than the answer.
constexpr std::size_t kManyQuestions = kMostQuestions / 2;
constexpr std::chrono::microseconds kTimeToGather{200};

Error NoAnswer(std::string reason) {
  return {Outcome::kServiceFailed, std::move(reason)};
}

Error NotInTime(std::string_view request) {
  std::string message = "the service did not answer in time";
  if (request.empty()) return NoAnswer(std::move(message));
  message += ", asked for " + WhatIsAsked(request);
  if (!SearchesOtherVolumes(request)) return NoAnswer(std::move(message));
  std::string separator = "; the search of the other volumes may wait for ";
  for (const Mount& mount : ReadMounts()) {
    if (!HasServer(mount)) continue;
    message += std::exchange(separator, ", ") + mount.point + " (" + mount.kind + ')';
  }
  return NoAnswer(std::move(message));
}

}  // namespace

void Conversation::Put(std::string_view bytes, std::unique_ptr<Question> question) {
  mRequests.Reserve(bytes.size());
  mPending.push_back({bytes.size(), std::move(question)});
  mRequests.Append(bytes);
  if (mPending.size() == 1) mFirstSince = steady_clock::now();

  const auto isUnderWay = [this](std::size_t questions, std::size_t size) {
    return mPending.size() >= questions || mRequests.View().size() >= size;
  };
  if (isUnderWay(kMostQuestions, kMostBytes)) {
    while (isUnderWay(kManyQuestions, kMostBytes / 2)) Advance();
  } else if (mRequests.View().size() - mSent >= kPieceToSend) {
    while (!mPending.empty() && Step()) {
    }
  }
}

void Conversation::Finish() {
  while (!mPending.empty()) Advance();
}

void Conversation::Abandon() {
  if (mSent > 0) EndService();
  mPending.clear();
  mRequests.Clear();
}

// Advances the conversation by one step, waiting as long as that takes. REQUIRES: a question is
// pending.
void Conversation::Advance() {
  if (Step()) return;
  if (mPending.size() >= kManyQuestions) std::this_thread::sleep_for(kTimeToGather);
  Wait();
}

// The same without waiting; returns false when there is nothing to do but wait. The owner of a
// question is called last, so an exception from it leaves nothing half done.
bool Conversation::Step() {
  if (mGeneration != ProcessGeneration()) LeaveServiceToParent();
  if (HandOver()) return true;
  if (mOptions.deadline.count() <= 0) {
    FailFirst(NotInTime(mRequests.View().substr(0, mPending.front().size)));
    return true;
  }
  if (!mService) {
    Start();
    return true;
  }
  return Receive() || Send();
}

// Hands over the first answer, or the reason why there is none; returns false when neither is known
// yet.
bool Conversation::HandOver() {
  const std::string_view received = mReceived.View();
  Pending& first = mPending.front();
  if (first.size == 0) {
    TakeFirst().question->Answer();
    return true;
  }
  if (received.size() < mNeeded) return false;
  if (mSent < first.size) {
    FailFirst(NoAnswer("the service answered what it had not been asked"));
    return true;
  }
  AnswerReader answer(received);
  first.question->Read(answer);
  answer.TakeTrailer();
  if (!answer.Fault().empty()) {
    FailFirst(NoAnswer(std::string(answer.Fault())));
    return true;
  }
  if (!answer.IsWhole()) {
    mNeeded = answer.Needed();
    return false;
  }
  mReceived.Drop(answer.Size());
  mNeeded = 1;
  TakeFirst().question->Answer();
  return true;
}

bool Conversation::Receive() {
  std::array<char, kPieceToReceive> piece;
  const auto got = mService->Read(piece.data(), piece.size());
  if (!got) {
    FailFirst(got.Failure());
    return true;
  }
  mReceived.Append({piece.data(), *got});
  return *got > 0;
}

bool Conversation::Send() {
  const std::size_t most = std::max(mPending.front().size, kMostBytes);
  const std::string_view left = mRequests.View().substr(0, most).substr(mSent);
  if (left.empty()) return false;
  const auto sent = mService->Write(left);
  if (!sent) {
    FailFirst(sent.Failure());
    return true;
  }
  if (mSent == 0 && *sent > 0) mFirstSince = steady_clock::now();
  mSent += *sent;
  return *sent > 0;
}

void Conversation::Wait() {
  const auto waited = std::chrono::duration_cast<milliseconds>(steady_clock::now() - mFirstSince);
  const milliseconds left = mOptions.deadline - waited;
  if (left.count() <= 0) {
    FailFirst(NotInTime(mRequests.View().substr(0, mPending.front().size)));
  } else {
    mService->Wait(mSent < mRequests.View().size(), left);
  }
}

void Conversation::Start() {
  const std::string path = mOptions.service.empty() ? FindService() : mOptions.service;
  if (path.empty()) {
    FailFirst(NoAnswer("the service \"tallowmere\" is neither beside this program nor on PATH"));
    return;
  }
  auto service = ServiceProcess::Start(path);
  if (service) {
    mService.emplace(*std::move(service));
  } else {
    FailFirst(service.Failure());
  }
}

Conversation::Pending Conversation::TakeFirst() {
  Pending first = std::move(mPending.front());
  mPending.pop_front();
  mRequests.Drop(first.size);
  mSent -= std::min(mSent, first.size);
  mFirstSince = steady_clock::now();
  return first;
}

// The questions after the first are asked again of a new service.
void Conversation::FailFirst(const Error& error) {
  EndService();
  TakeFirst().question->Fail(error);
}

// In a child made by fork(2): the service is the parent's, as are its answers.
void Conversation::LeaveServiceToParent() {
  EndService();
  mGeneration = ProcessGeneration();
}

void Conversation::EndService() {
  if (mService) mService->Kill();
  mService.reset();
  mSent = 0;
  mReceived.Clear();
  mNeeded = 1;
}

}  // namespace tallowmere
