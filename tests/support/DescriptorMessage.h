// Passes descriptors through a local socket, unix(7): each with one byte.
#pragma once

#include <sys/socket.h>
#include <sys/uio.h>

#include <array>
#include <cstring>

namespace tallowmere::test {

struct DescriptorMessage {
  DescriptorMessage() {
    message.msg_iov = &data;
    message.msg_iovlen = 1;
    message.msg_control = control.data();
    message.msg_controllen = control.size();
  }
  DescriptorMessage(const DescriptorMessage&) = delete;
  DescriptorMessage& operator=(const DescriptorMessage&) = delete;

  msghdr message{};

 private:
  char byte = 0;
  iovec data{&byte, 1};
  alignas(cmsghdr) std::array<char, CMSG_SPACE(sizeof(int))> control{};
};

inline bool SendDescriptor(int socket, int descriptor) {
  DescriptorMessage sent;
  cmsghdr* const header = CMSG_FIRSTHDR(&sent.message);
  header->cmsg_level = SOL_SOCKET;
  header->cmsg_type = SCM_RIGHTS;
  header->cmsg_len = CMSG_LEN(sizeof descriptor);
  std::memcpy(CMSG_DATA(header), &descriptor, sizeof descriptor);
  return sendmsg(socket, &sent.message, MSG_NOSIGNAL) == 1;
}

// Waits for a descriptor, which started programs do not inherit; -1 when the other end is closed.
inline int ReceiveDescriptor(int socket) {
  DescriptorMessage received;
  if (recvmsg(socket, &received.message, MSG_CMSG_CLOEXEC) != 1) return -1;
  const cmsghdr* const header = CMSG_FIRSTHDR(&received.message);
  if (header == nullptr || header->cmsg_type != SCM_RIGHTS) return -1;
  int descriptor = -1;
  std::memcpy(&descriptor, CMSG_DATA(header), sizeof descriptor);
  return descriptor;
}

}  // namespace tallowmere::test
