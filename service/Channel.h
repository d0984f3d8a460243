// The two pipes to the parent: fields of exact length, unbuffered.
//
// A failure stays: after a short read, a write error or Fail() every further Take gives an empty
// value and every further Put writes nothing, so a command reads all its fields and asks Failed()
// once. Reads and writes are not repeated after an interruption, as a read that gives nothing is
// the end of the conversation.
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

  // One number, in the machine's byte order; 0 after a failure.
  template <class Number>
  Number Take() {
    static_assert(std::is_arithmetic_v<Number>);
    Number number{};
    TakeBytes(&number, sizeof number);
    return mFailed ? Number{} : number;
  }

  // `size` bytes into `bytes`, whose content is unspecified after a failure.
  void TakeBytes(void* bytes, std::size_t size);

  // Counted bytes (a 16-bit length, then that many bytes) into `buffer`, and a NUL behind them. A
  // length above `longest` is a failure, and nothing more is read.
  // REQUIRES: `buffer` holds `longest` + 1 bytes.
  void TakeCounted(char* buffer, std::size_t longest);

  // Counted bytes of any length, told to `announced` where it is given, and so many NULs behind
  // them. Null after a failure; a lack of memory is one.
  std::unique_ptr<char[]> TakeAllocated(std::size_t nuls = 1, std::uint16_t* announced = nullptr);

  template <class Number>
  void Put(Number number) {
    static_assert(std::is_arithmetic_v<Number>);
    PutBytes(&number, sizeof number);
  }
  void PutFlag(bool flag) { Put<std::uint8_t>(flag ? 1 : 0); }
  void PutBytes(const void* bytes, std::size_t size);

  // The text as a counted string, its NUL inside the count; a count of 0 for null, and for a text
  // that is too long to be counted with its NUL, which is no path that the kernel takes.
  void PutString(const char* text);

 private:
  int mInput;
  int mOutput;
  bool mFailed = false;
};

}  // namespace tallowmere::service
