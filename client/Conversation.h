// What is said to the service and what it says: questions are sent in the order in which they are
// put, and their answers handed over in that order.
//
// Nothing here waits for one pipe alone, so a service that answers while it is being asked cannot
// bring the two to a stop.
#pragma once

#include <tallowmere/Client.h>
#include <tallowmere/Result.h>

#include <chrono>
#include <cstddef>
#include <deque>
#include <memory>
#include <optional>
#include <string_view>
#include <utility>

#include "client/ByteQueue.h"
#include "client/ServiceProcess.h"

namespace tallowmere {

class AnswerReader;

// Waits for one answer, of whatever type.
class Question {
 public:
  Question() = default;
  Question(const Question&) = delete;
  Question& operator=(const Question&) = delete;
  virtual ~Question() = default;

  // Reads and keeps the answer, up to the trailer. Called again when it was not whole.
  virtual void Read(AnswerReader& answer) = 0;

  // Hands over the answer that was read last. Each may throw what the question's owner throws.
  virtual void Answer() = 0;
  virtual void Fail(const Error& error) = 0;
};

class Conversation {
 public:
  explicit Conversation(ClientOptions options) : mOptions(std::move(options)) {}

  // Puts a question behind the others. Nothing is sent for one without bytes, which has its answer
  // already. When enough are under way, this hands over answers until half of them are. What that
  // throws leaves Put, the question is put nevertheless.
  void Put(std::string_view bytes, std::unique_ptr<Question> question);

  // Hands over all answers.
  void Finish();

  // Forgets what has not been answered.
  void Abandon();

 private:
  struct Pending {
    std::size_t size;  // of its bytes
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
  void EndService();

  ClientOptions mOptions;
  std::optional<ServiceProcess> mService;
  std::deque<Pending> mPending;  // not answered yet
  ByteQueue mRequests;           // their bytes
  std::size_t mSent = 0;         // of those, to the service that is running now
  ByteQueue mReceived;           // what follows the last answer
  std::size_t mNeeded = 1;       // with fewer bytes received there is no answer
  // When the first one was first sent, or the one before it answered.
  std::chrono::steady_clock::time_point mFirstSince;
};

}  // namespace tallowmere
