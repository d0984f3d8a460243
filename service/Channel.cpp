#include "service/Channel.h"

#include <unistd.h>

#include <cstring>
#include <new>

namespace tallowmere::service {

void Channel::TakeBytes(void* bytes, std::size_t size) {
  auto* const field = static_cast<char*>(bytes);
  std::size_t count = 0;
  while (!mFailed && count < size) {
    const ssize_t got = read(mInput, field + count, size - count);
    if (got < 1) {
      Fail();
    } else {
      count += static_cast<std::size_t>(got);
    }
  }
}

void Channel::TakeCounted(char* buffer, std::size_t longest) {
  std::size_t length = Take<std::uint16_t>();
  if (length > longest) {
    Fail();
    length = 0;
  }
  TakeBytes(buffer, length);
  buffer[length] = '\0';
}

std::unique_ptr<char[]> Channel::TakeAllocated() {
  const std::size_t length = Take<std::uint16_t>();
  std::unique_ptr<char[]> bytes(new (std::nothrow) char[length + 1]);
  if (!bytes) Fail();
  TakeBytes(bytes.get(), length);
  if (mFailed) return nullptr;
  bytes[length] = '\0';
  return bytes;
}

void Channel::PutBytes(const void* bytes, std::size_t size) {
  const auto* const field = static_cast<const char*>(bytes);
  std::size_t count = 0;
  while (!mFailed && count < size) {
    const ssize_t sent = write(mOutput, field + count, size - count);
    if (sent == -1) {
      Fail();
    } else {
      count += static_cast<std::size_t>(sent);
    }
  }
}

void Channel::PutString(const char* text) {
  const std::size_t length = text == nullptr ? 0 : std::strlen(text) + 1;
  Put(static_cast<std::uint16_t>(length));
  PutBytes(text, length);
}

}  // namespace tallowmere::service
