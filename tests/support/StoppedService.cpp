#include "support/StoppedService.h"

#include <linux/seccomp.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <utility>

namespace tallowmere::test {
StoppedService::StoppedService(const Copies& services) {
  mProgram = std::make_unique<ChildProgram>(
      [&services](const ChildProgram::Streams& streams) { return services.Make(streams); });
  mListener = services.Descriptor();
  if (mListener >= 0) mSupervisor = std::thread([this] { Supervise(); });
}

StoppedService::~StoppedService() {
  mProgram.reset();
  if (mSupervisor.joinable()) mSupervisor.join();
  if (mListener >= 0) close(mListener);
}

void StoppedService::ChangeAt(int call, std::function<void()> change) {
  const std::lock_guard lock(mMutex);
  mCalls = 0;
  mChanges.clear();
  mChanges.emplace(call, std::move(change));
}

void StoppedService::ThenChangeAt(int call, std::function<void()> change) {
  const std::lock_guard lock(mMutex);
  mChanges.emplace(call, std::move(change));
}

bool StoppedService::HasChanged() {
  const std::lock_guard lock(mMutex);
  return std::exchange(mChanges, {}).empty();
}

// Runs until the service has ended.
void StoppedService::Supervise() {
  pollfd awaited{mListener, POLLIN, 0};
  while (poll(&awaited, 1, -1) == 1 && (awaited.revents & POLLIN) != 0) {
    seccomp_notif stopped{};
    if (ioctl(mListener, SECCOMP_IOCTL_NOTIF_RECV, &stopped) != 0) continue;
    {
      const std::lock_guard lock(mMutex);
      const int call = mCalls++;
      while (!mChanges.empty() && mChanges.begin()->first == call) {
        mChanges.begin()->second();
        mChanges.erase(mChanges.begin());
      }
    }
    seccomp_notif_resp goOn{};
    goOn.id = stopped.id;
    goOn.flags = SECCOMP_USER_NOTIF_FLAG_CONTINUE;
    ioctl(mListener, SECCOMP_IOCTL_NOTIF_SEND, &goOn);
  }
}

}  // namespace tallowmere::test
