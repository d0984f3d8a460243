// Conditions on a pipe that a parent process cannot produce at the right moment.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <string>
#include <thread>

#include "service/Channel.h"

namespace tallowmere::service {
namespace {

// A signal interrupts a write that waits for room after part of the bytes are written.
TEST(Channel, AnInterruptedWriteGoesOnWhereItStopped) {
  struct sigaction ignoring {};
  ignoring.sa_handler = [](int) {};
  sigaction(SIGUSR1, &ignoring, nullptr);
  int ends[2];
  ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
  const int room = fcntl(ends[1], F_SETPIPE_SZ, 4096);
  ASSERT_GT(room, 0);
  std::string bytes;
  for (int i = 0; i < 3 * room; ++i) bytes.push_back(static_cast<char>(i * i >> 8));

  std::thread writer([&] {
    Channel channel(-1, ends[1]);
    channel.PutBytes(bytes.data(), bytes.size());
    EXPECT_FALSE(channel.Failed());
    close(ends[1]);
  });
  int written = 0;
  while (written < room) ASSERT_EQ(ioctl(ends[0], FIONREAD, &written), 0);
  pthread_kill(writer.native_handle(), SIGUSR1);
  std::string got(bytes.size() + 1, '\0');
  std::size_t count = 0;
  for (ssize_t more = 1; more > 0; count += static_cast<std::size_t>(more)) {
    more = read(ends[0], got.data() + count, got.size() - count);
    ASSERT_GE(more, 0);
  }
  writer.join();
  close(ends[0]);
  EXPECT_EQ(got.substr(0, count), bytes);
}

// Returns whether four bytes can be read from the input.
bool CanTake(int input) {
  Channel channel(input, -1);
  channel.Take<std::uint32_t>();
  return !channel.Failed();
}

TEST(Channel, ANonBlockingReadWithoutDataIsAFailure) {
  int ends[2];
  ASSERT_EQ(pipe2(ends, O_CLOEXEC | O_NONBLOCK), 0);
  EXPECT_FALSE(CanTake(ends[0]));
  ASSERT_EQ(write(ends[1], "abc", 3), 3);  // part of the field
  EXPECT_FALSE(CanTake(ends[0]));
  ASSERT_EQ(write(ends[1], "abcd", 4), 4);
  EXPECT_TRUE(CanTake(ends[0]));
  close(ends[0]);
  close(ends[1]);
}

TEST(Channel, AReadOfAFolderIsAFailure) {
  const int folder = open("/", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  ASSERT_GE(folder, 0);
  EXPECT_FALSE(CanTake(folder));
  close(folder);
}

TEST(Channel, ANonBlockingWriteWithoutRoomIsAFailure) {
  int ends[2];
  ASSERT_EQ(pipe2(ends, O_CLOEXEC | O_NONBLOCK), 0);
  const std::string more(static_cast<std::size_t>(fcntl(ends[1], F_GETPIPE_SZ)) + 1, 'x');
  Channel channel(-1, ends[1]);
  channel.PutBytes(more.data(), more.size());
  EXPECT_TRUE(channel.Failed());
  close(ends[0]);
  close(ends[1]);
}

}  // namespace
}  // namespace tallowmere::service
