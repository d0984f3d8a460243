// Writing atom containers: a tree of typed pieces of data, all numbers big-endian, as published
// with the movie file format ("QT atoms").
//
// An atom is a header of 20 bytes and then its children or its data. Every atom written here has id
// 1: no two of one type are siblings.
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

// The whole container: what stands before the root atom, and that.
std::string AtomContainer(std::initializer_list<std::string_view> children);

}  // namespace tallowmere::quicktime
