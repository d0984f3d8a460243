// What the kernel lets a process that is locked in ask of it: a filter of system calls, seccomp(2).
#pragma once

#include <linux/filter.h>

#include <array>
#include <cstddef>

namespace tallowmere::kernel {

// What the filter leaves open where there is another wall, or a need.
struct Openings {
  bool toWrite;     // opening files to write: Landlock refuses it
  bool toNetworks;  // sockets of the internet and netlink
};

// A program of the kernel's filters: bpf(2), classic.
struct SystemCallFilter {
  static constexpr std::size_t kMost = 200;
  std::array<sock_filter, kMost> steps;
  unsigned short size = 0;
};

// The filter for this process; it answers EPERM, and ENOSYS to calls that it does not know. Empty
// on an architecture whose calls it does not know at all.
SystemCallFilter MakeSystemCallFilter(const Openings& openings);

}  // namespace tallowmere::kernel
