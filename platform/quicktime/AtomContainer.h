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
#include <vector>

namespace tallowmere::quicktime {

class AtomContainer {
 public:
  AtomContainer();

  // Begins an atom with so many children, which follow; Close ends it.
  void Open(OSType type, UInt16 childCount);
  void Close();

  // An atom with a number for its data.
  void AddLeaf(OSType type, UInt32 number);
  void AddLeaf(OSType type, UInt16 number);

  // REQUIRES: every atom is closed.
  const std::string& Bytes() const { return mBytes; }

 private:
  void Append(UInt32 number);
  void Append(UInt16 number);

  std::string mBytes;
  std::vector<std::size_t> mOpen;  // where the open atoms begin
};

}  // namespace tallowmere::quicktime
