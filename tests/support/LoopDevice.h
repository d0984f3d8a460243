// A block device with the content of a file: loop(4).
#pragma once

#include <string>

namespace tallowmere::test {

class LoopDevice {
 public:
  // Attaches a free device to an open file. The device detaches itself when its last user closes
  // it; until then this process keeps it open, also after the object is gone.
  explicit LoopDevice(int file);

  // False where that is not permitted.
  bool IsAttached() const { return mDescriptor >= 0; }

  // The device is /dev/loopNUMBER. REQUIRES: IsAttached().
  unsigned Number() const { return mNumber; }
  std::string Path() const;

  // Stops keeping it open.
  void Close();

 private:
  bool AttachFreeOne(int control, int file);

  unsigned mNumber = 0;
  int mDescriptor = -1;
};

}  // namespace tallowmere::test
