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

  // The service's streams; it runs on as long as nothing is to happen.
  ChildProgram& Streams() { return *mProgram; }

  // `change` is to be made when the service is about to make its call number `call` from now on,
  // the next one being 0.
  void ChangeAt(int call, std::function<void()> change);

  // Nothing is to happen any more. Whether it has happened.
  bool HasChanged();

 private:
  void Supervise();

  int mSocket = -1;
  int mListener = -1;
  std::unique_ptr<ChildProgram> mProgram;
  std::thread mSupervisor;
  std::mutex mMutex;  // of all below
  int mCallsToGo = 0;
  std::function<void()> mChange;
  bool mHasChanged = false;
};

}  // namespace tallowmere::test
