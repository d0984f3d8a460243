#include "service/Channel.h"

#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <limits>
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

std::unique_ptr<char[]> Channel::TakeAllocated(std::size_t nuls, std::uint16_t* announced) {
  const auto length = Take<std::uint16_t>();
  if (announced != nullptr) *announced = length;
  std::unique_ptr<char[]> bytes(new (std::nothrow) char[length + nuls]);
  if (!bytes) Fail();
  TakeBytes(bytes.get(), length);
  if (mFailed) return nullptr;
  std::fill_n(bytes.get() + length, nuls, '\0');
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
  std::size_t length = text == nullptr ? 0 : std::strlen(text) + 1;
  if (length > std::numeric_limits<std::uint16_t>::max()) length = 0;
  Put(static_cast<std::uint16_t>(length));
  PutBytes(text, length);
}

}  // namespace tallowmere::service
