// What a target says of its finding, and how it takes its input apart.
#pragma once

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string_view>

namespace tallowmere::fuzz {

// What there is to do before the engine stores a finding.
inline void (*gBeforeFinding)() = [] {};

// Ends the program, which makes the input a finding, where what must be true is not.
inline void Check(bool isTrue, const char* file = __builtin_FILE(), int line = __builtin_LINE()) {
  if (isTrue) return;
  std::fprintf(stderr, "%s:%d: this must be true and is not\n", file, line);
  gBeforeFinding();
  std::abort();
}

// The bytes of one execution. The engine gives them in a block of their exact size, so a read
// behind the end of Rest() is one behind the block, which the sanitizer sees.
class Input {
 public:
  Input(const std::uint8_t* data, std::size_t size)
      : mRest(reinterpret_cast<const char*>(data), size) {}

  // The next byte; 0 when there is none.
  unsigned TakeByte() {
    if (mRest.empty()) return 0;
    const auto byte = static_cast<unsigned char>(mRest.front());
    mRest.remove_prefix(1);
    return byte;
  }

  // Two bytes, the lower one first.
  unsigned TakeTwoBytes() {
    const unsigned low = TakeByte();
    return low | TakeByte() << 8;
  }

  std::string_view Rest() const { return mRest; }

 private:
  std::string_view mRest;
};

}  // namespace tallowmere::fuzz
