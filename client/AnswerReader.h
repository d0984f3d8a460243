// Reads the fields of one answer, in order, from the bytes that have arrived.
//
// When bytes are missing or violate the protocol, that field and all that follow are zero or empty,
// and the reader reports it at the end.
#pragma once

#include <tallowmere/Types.h>

#include <cstddef>
#include <cstring>
#include <string>
#include <string_view>

namespace tallowmere {

class AnswerReader {
 public:
  // REQUIRES: the bytes outlive the reader. They may extend beyond the answer.
  explicit AnswerReader(std::string_view bytes) : mBytes(bytes) {}

  template <class Number>
  Number Take() {
    Number number{};
    const std::string_view bytes = TakeBytes(sizeof number);
    if (!bytes.empty()) std::memcpy(&number, bytes.data(), sizeof number);
    return number;
  }

  // 0 or 1.
  bool TakeFlag();

  std::string_view TakeBytes(std::size_t size);

  // Counted bytes that end in their only NUL, without it; empty when the count is 0.
  std::string TakeString();

  // The bytes before the first NUL of a buffer. A buffer without a NUL is refused.
  std::string TakeBuffer(std::size_t size);

  // A record, whose name is within its bounds.
  FSSpec TakeSpec();

  void TakeTrailer();

  // Rejects the answer. REQUIRES: `fault` is a sentence that outlives the reader.
  void Refuse(std::string_view fault = "the service's answer is not what the protocol says");

  // Why this is not an answer; empty when nothing is wrong so far.
  std::string_view Fault() const { return mFault; }

  // Whether every field that was asked for has arrived.
  bool IsWhole() const { return mFault.empty() && mNeeded == 0; }

  // The number of bytes, counted from the answer's first, that must arrive before it is worth
  // reading again. REQUIRES: neither whole nor at fault.
  std::size_t Needed() const { return mNeeded; }

  // The size of the answer in bytes. REQUIRES: IsWhole().
  std::size_t Size() const { return mUsed; }

 private:
  std::string_view mBytes;
  std::string_view mFault;
  std::size_t mUsed = 0;
  std::size_t mNeeded = 0;
};

}  // namespace tallowmere
