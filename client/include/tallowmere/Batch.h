// Many requests to one client, several of them under way at a time. Handlers are called in the
// order of the requests, within Add and Finish.
//
// A request that the service does not survive gets the error; the requests after it are asked again
// of a new service. At most 256 requests or 64 KiB are under way, whichever is less, so that
// neither memory nor the pipes fill up; a larger request goes alone.
#pragma once

#include <tallowmere/Client.h>

#include <functional>
#include <type_traits>

namespace tallowmere {

class Batch {
 public:
  // REQUIRES: the client outlives the batch. From its first request on until it has finished, the
  // batch has the client to itself: see Client.h. A batch belongs to one thread at a time.
  explicit Batch(Client& client);
  Batch(const Batch&) = delete;
  Batch& operator=(const Batch&) = delete;
  // Drops the requests that have not been answered; their handlers are not called.
  ~Batch();

  // The handler may throw: the exception leaves Add or Finish, and the requests after it are still
  // asked. It must not use the batch or its client.
  template <class T>
  void Add(const Request<T>& request, std::type_identity_t<std::function<void(Result<T>)>> handler);

  // Returns when every handler has been called.
  void Finish();

 private:
  bool TakeTurn();

  Conversation& mConversation;
  bool mHasTurn = false;
};

}  // namespace tallowmere
