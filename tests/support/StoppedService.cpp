#include "support/StoppedService.h"

#include <linux/seccomp.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <utility>

#include "support/DescriptorMessage.h"

namespace tallowmere::test {
StoppedService::StoppedService(const std::string& program) {
  std::array<int, 2> ends{};
  if (socketpair(AF_UNIX, SOCK_STREAM, 0, ends.data()) != 0) std::abort();
  mSocket = ends[0];
  mProgram = std::make_unique<ChildProgram>(
      TALLOWMERE_STOP_AT_CALLS,
      std::vector<std::string>{std::to_string(ends[1]), program, std::to_string(getpid())});
  close(ends[1]);
  mListener = ReceiveDescriptor(mSocket);
  if (mListener >= 0) mSupervisor = std::thread([this] { Supervise(); });
}

StoppedService::~StoppedService() {
  mProgram.reset();
  if (mSupervisor.joinable()) mSupervisor.join();
  if (mListener >= 0) close(mListener);
  close(mSocket);
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
