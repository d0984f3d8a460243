// The two pipes to the parent: fields of exact length, unbuffered.
//
// A failure lasts: after a short read, a write error or Fail(), every further Take returns an empty
// value and every further Put writes nothing, so a command reads all its fields and checks Failed()
// once. Interrupted reads and writes are not repeated: a read that returns nothing ends the
// conversation.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <type_traits>

namespace tallowmere::service {

class Channel {
 public:
  Channel(int input, int output) : mInput(input), mOutput(output) {}

  bool Failed() const { return mFailed; }
  void Fail() { mFailed = true; }

  // A number in the machine's byte order; 0 after a failure.
  template <class Number>
  Number Take() {
    static_assert(std::is_arithmetic_v<Number>);
    Number number{};
    TakeBytes(&number, sizeof number);
    return mFailed ? Number{} : number;
  }

  // Reads `size` bytes into `bytes`, whose content is unspecified after a failure.
  void TakeBytes(void* bytes, std::size_t size);

  // Reads counted bytes (a 16-bit length, then that many bytes) into `buffer`, followed by a NUL. A
  // length above `longest` is a failure; nothing more is read then. REQUIRES: `buffer` has room for
  // `longest` + 1 bytes.
  void TakeCounted(char* buffer, std::size_t longest);

  // Reads counted bytes of any length, followed by `nuls` NULs; stores the length in `announced`
  // unless null. Returns null after a failure, which includes running out of memory.
  std::unique_ptr<char[]> TakeAllocated(std::size_t nuls = 1, std::uint16_t* announced = nullptr);

  template <class Number>
  void Put(Number number) {
    static_assert(std::is_arithmetic_v<Number>);
    PutBytes(&number, sizeof number);
  }
  void PutFlag(bool flag) { Put<std::uint8_t>(flag ? 1 : 0); }
  void PutBytes(const void* bytes, std::size_t size);

  // Writes the text as a counted string, whose count includes the NUL. The count is 0 for null and
  // for a text too long to be counted with its NUL; the kernel takes no path of that length.
  void PutString(const char* text);

 private:
  int mInput;
  int mOutput;
  bool mFailed = false;
};

}  // namespace tallowmere::service
