// A queue of bytes: appended at the end, removed at the front, each moved a bounded number of
// times.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace tallowmere {

class ByteQueue {
 public:
  std::string_view View() const { return std::string_view(mBytes).substr(mBegin); }

  // Afterwards, this many bytes can be appended without allocating memory.
  void Reserve(std::size_t size) { mBytes.reserve(mBytes.size() + size); }
  void Append(std::string_view bytes) { mBytes.append(bytes); }

  // Removes the first bytes. REQUIRES: there are that many.
  void Drop(std::size_t size) {
    mBegin += size;
    if (mBegin < mBytes.size() - mBegin) return;
    mBytes.erase(0, mBegin);
    mBegin = 0;
  }

  void Clear() {
    mBytes.clear();
    mBegin = 0;
  }

 private:
  std::string mBytes;
  std::size_t mBegin = 0;
};

}  // namespace tallowmere
