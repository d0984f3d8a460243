// A QuickTime atom container, written from its root down: a tree of typed pieces of data, as
// published with the movie file format ("QT atoms"). All numbers are big-endian.
//
// The container is 10 zero bytes, a 16-bit lock count of 0 and the root atom. An atom is 20 bytes
// of header (32-bit size with header and content, 32-bit type, 32-bit id, 16 zero bits, 16-bit
// number of children, 32 zero bits) and then its children or its data. Every id is 1.
#pragma once

#include <QuickTime/QuickTime.h>

#include <cstddef>
#include <string>
#include <utility>

namespace tallowmere::quicktime {

class AtomContainer {
 public:
  AtomContainer();

  // Begins an atom with so many children, which follow. Returns where it begins, for Close.
  std::size_t Open(OSType type, UInt16 childCount);
  void Close(std::size_t begin);

  // An atom with a number for its data.
  void AddLeaf(OSType type, UInt32 number);
  void AddLeaf(OSType type, UInt16 number);

  // The container's bytes, which it gives up. REQUIRES: every atom is closed.
  std::string Take() { return std::move(mBytes); }

 private:
  std::string mBytes;
};

}  // namespace tallowmere::quicktime
