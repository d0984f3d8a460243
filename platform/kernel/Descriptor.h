// An open file descriptor, closed when its owner is destroyed.
#pragma once

#include <unistd.h>

#include <utility>

namespace tallowmere::kernel {

class Descriptor {
 public:
  Descriptor() = default;
  explicit Descriptor(int descriptor) : mDescriptor(descriptor) {}  // takes ownership; -1 is none
  Descriptor(Descriptor&& other) noexcept : mDescriptor(std::exchange(other.mDescriptor, -1)) {}
  Descriptor& operator=(Descriptor&& other) noexcept {
    if (this != &other) {
      Close();
      mDescriptor = std::exchange(other.mDescriptor, -1);
    }
    return *this;
  }
  ~Descriptor() { Close(); }

  int Get() const { return mDescriptor; }
  bool IsOpen() const { return mDescriptor >= 0; }
  int Release() { return std::exchange(mDescriptor, -1); }  // to the caller, who closes it
  void Close() {
    if (mDescriptor >= 0) ::close(std::exchange(mDescriptor, -1));
  }

 private:
  int mDescriptor = -1;
};

}  // namespace tallowmere::kernel
