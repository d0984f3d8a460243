// How a target reports a finding, and how it splits its input.
#pragma once

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string_view>

namespace tallowmere::fuzz {

// Called before the engine stores a finding.
inline void (*gBeforeFinding)() = [] {};

// Ends the program, which makes the input a finding, unless `isTrue`.
inline void Check(bool isTrue, const char* file = __builtin_FILE(), int line = __builtin_LINE()) {
  if (isTrue) return;
  std::fprintf(stderr, "%s:%d: this must be true and is not\n", file, line);
  gBeforeFinding();
  std::abort();
}

// The bytes of one execution. The engine passes them in a block of exactly their size, so a read
// past the end of Rest() leaves the block, which the sanitizer detects.
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

  // Two bytes, the low one first.
  unsigned TakeTwoBytes() {
    const unsigned low = TakeByte();
    return low | TakeByte() << 8;
  }

  std::string_view Rest() const { return mRest; }

 private:
  std::string_view mRest;
};

}  // namespace tallowmere::fuzz
