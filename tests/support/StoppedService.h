// A service that is stopped at a chosen system call while a test changes what it is asked about.
#pragma once

#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

#include "support/ChildProgram.h"

namespace tallowmere::test {

class StoppedService {
 public:
  explicit StoppedService(const std::string& program);
  StoppedService(const StoppedService&) = delete;
  StoppedService& operator=(const StoppedService&) = delete;
  ~StoppedService();

  // Whether the kernel lets us stop it.
  bool CanStop() const { return mListener >= 0; }

  // The service's streams. It does not stop unless a change is pending.
  ChildProgram& Streams() { return *mProgram; }

  // Calls `change` when the service is about to make its system call number `call`, counted from
  // now, the next one being 0.
  void ChangeAt(int call, std::function<void()> change);

  // Cancels a pending change. Returns whether the change was made.
  bool HasChanged();

 private:
  void Supervise();

  int mSocket = -1;
  int mListener = -1;
  std::unique_ptr<ChildProgram> mProgram;
  std::thread mSupervisor;
  std::mutex mMutex;  // guards everything below
  int mCallsToGo = 0;
  std::function<void()> mChange;
  bool mHasChanged = false;
};

}  // namespace tallowmere::test
