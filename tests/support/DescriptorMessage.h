// The message that passes a descriptor through a socket, unix(7): one byte, and room for one
// descriptor.
#pragma once

#include <sys/socket.h>
#include <sys/uio.h>

#include <array>

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

  // The message to send or receive, of one byte.
  msghdr message{};

 private:
  char byte = 0;
  iovec data{&byte, 1};
  alignas(cmsghdr) std::array<char, CMSG_SPACE(sizeof(int))> control{};
};

}  // namespace tallowmere::test
