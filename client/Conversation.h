// The exchange with the service: questions are sent in the order in which they are put, and their
// answers are handed over in the same order.
//
// Nothing here waits for one pipe alone, so a service that answers while it is being asked cannot
// cause a deadlock.
#pragma once

#include <tallowmere/Client.h>
#include <tallowmere/Result.h>

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <optional>
#include <string_view>
#include <utility>

#include "client/ByteQueue.h"
#include "client/ServiceProcess.h"
#include "client/Turn.h"

namespace tallowmere {

class AnswerReader;

// Waits for one answer, whatever its type.
class Question {
 public:
  Question() = default;
  Question(const Question&) = delete;
  Question& operator=(const Question&) = delete;
  virtual ~Question() = default;

  // Reads and keeps the answer, up to the trailer. Called again when the answer was not whole.
  virtual void Read(AnswerReader& answer) = 0;

  // Answer hands over the answer that was read last, Fail the reason why there is none. Both may
  // throw what the question's owner throws.
  virtual void Answer() = 0;
  virtual void Fail(const Error& error) = 0;
};

class Conversation {
 public:
  explicit Conversation(ClientOptions options) : mOptions(std::move(options)) {}

  // Who may use the conversation: each of the functions below REQUIRES it to be taken.
  Turn& GetTurn() { return mTurn; }

  // Queues a question. One without bytes is not sent: it has its answer already. When enough are
  // under way, hands over answers until half of them are left. An exception from that leaves Put,
  // with the question queued nevertheless.
  void Put(std::string_view bytes, std::unique_ptr<Question> question);

  // Waits for all answers and hands them over.
  void Finish();

  bool IsFinished() const { return mPending.empty(); }

  // Drops every question that has not been answered.
  void Abandon();

 private:
  struct Pending {
    std::size_t size;  // of its request, in bytes
    std::unique_ptr<Question> question;
  };

  void Advance();
  bool Step();
  bool HandOver();
  bool Receive();
  bool Send();
  void Wait();
  void Start();
  Pending TakeFirst();
  void FailFirst(const Error& error);
  void LeaveServiceToParent();
  void EndService();

  Turn mTurn;
  ClientOptions mOptions;
  std::uint32_t mGeneration = ProcessGeneration();  // of the process that started the service
  std::optional<ServiceProcess> mService;
  std::deque<Pending> mPending;  // not answered yet
  ByteQueue mRequests;           // their requests
  std::size_t mSent = 0;         // bytes of mRequests sent to the running service
  ByteQueue mReceived;           // bytes after the last answer
  std::size_t mNeeded = 1;       // no answer is complete with fewer bytes received
  // When the first question was first sent, or the one before it answered, if later.
  std::chrono::steady_clock::time_point mFirstSince;
};

}  // namespace tallowmere
