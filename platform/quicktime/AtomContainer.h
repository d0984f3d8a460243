// Writes atom containers: trees of typed pieces of data, all numbers big-endian, as published with
// the movie file format ("QT atoms").
//
// An atom is a header of 20 bytes, followed by its children or its data. Every atom written here
// has id 1, as no two siblings have the same type.
#pragma once

#include <QuickTime/QuickTime.h>

#include <initializer_list>
#include <string>
#include <string_view>

namespace tallowmere::quicktime {

// A number as the data of an atom.
std::string BigEndian(UInt16 number);
std::string BigEndian(UInt32 number);

// REQUIRES: less than 4 GiB, header included; at most 65535 children.
std::string Leaf(OSType type, std::string_view data);
std::string Parent(OSType type, std::initializer_list<std::string_view> children);

// The whole container: the bytes that precede the root atom, then the root atom.
std::string AtomContainer(std::initializer_list<std::string_view> children);

}  // namespace tallowmere::quicktime
