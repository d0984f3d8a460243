// A service that is stopped at a chosen system call while a test changes what it is asked about.
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <thread>

#include "support/ChildProgram.h"
#include "support/Copies.h"

namespace tallowmere::test {

class StoppedService {
 public:
  // Makes a copy of a service with the library of StopAtCalls.cpp.
  explicit StoppedService(const Copies& services);
  StoppedService(const StoppedService&) = delete;
  StoppedService& operator=(const StoppedService&) = delete;
  ~StoppedService();

  // Whether the kernel lets us stop it.
  bool CanStop() const { return mListener >= 0; }

  // The service's streams. It is not held up unless a change is pending.
  ChildProgram& Streams() { return *mProgram; }

  // Calls `change` when the service is about to make its system call number `call`, counted from
  // now, the next one being 0.
  void ChangeAt(int call, std::function<void()> change);

  // A second change, at this call or a later one. REQUIRES: no call was made since ChangeAt.
  void ThenChangeAt(int call, std::function<void()> change);

  // Cancels pending changes. Returns whether all changes were made.
  bool HasChanged();

 private:
  void Supervise();

  int mListener = -1;
  std::unique_ptr<ChildProgram> mProgram;
  std::thread mSupervisor;
  std::mutex mMutex;  // guards everything below
  int mCalls = 0;     // since the changes were given
  std::multimap<int, std::function<void()>> mChanges;
};

}  // namespace tallowmere::test
