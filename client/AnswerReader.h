// The fields of one answer, taken one after the other from the bytes that have arrived.
//
// When bytes are missing or are not what the protocol knows, that field and all that follow are
// zeros and empty, and the reader says so at the end.
#pragma once

#include <tallowmere/Types.h>

#include <cstddef>
#include <cstring>
#include <string>
#include <string_view>

namespace tallowmere {

class AnswerReader {
 public:
  // REQUIRES: the bytes outlive the reader. More may follow the answer.
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

  // Counted bytes that end with their only NUL, without it; empty when there are none.
  std::string TakeString();

  // What stands before the first NUL of a buffer, which has one.
  std::string TakeBuffer(std::size_t size);

  // A record; its name is within its bounds.
  FSSpec TakeSpec();

  void TakeTrailer();

  // Refuses the answer. `fault` is a sentence that outlives the reader.
  void Refuse(std::string_view fault = "the service's answer is not what the protocol says");

  // Why this is no answer; empty when nothing is wrong so far.
  std::string_view Fault() const { return mFault; }

  // Whether everything that was asked for was there.
  bool IsWhole() const { return mFault.empty() && mNeeded == 0; }

  // Of how many bytes, from the answer's first one, there must be more than there are now.
  // REQUIRES: neither whole nor at fault.
  std::size_t Needed() const { return mNeeded; }

  // How many bytes the answer has. REQUIRES: IsWhole().
  std::size_t Size() const { return mUsed; }

 private:
  std::string_view mBytes;
  std::string_view mFault;
  std::size_t mUsed = 0;
  std::size_t mNeeded = 0;
};

}  // namespace tallowmere
