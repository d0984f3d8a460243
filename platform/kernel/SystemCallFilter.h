// The filter of system calls for a confined process: seccomp(2).
#pragma once

#include <linux/filter.h>

#include <array>
#include <cstddef>

namespace tallowmere::kernel {

// What the filter leaves open because something else closes it, or because it is needed.
struct Openings {
  bool toWrite;     // opening files for writing: closed by Landlock
  bool toNetworks;  // sockets of the internet and netlink: needed
};

// A program for the kernel's filters: bpf(2), classic.
struct SystemCallFilter {
  static constexpr std::size_t kMost = 200;
  std::array<sock_filter, kMost> steps;
  unsigned short size = 0;
};

// The filter for this process. It returns EPERM, or ENOSYS for calls that it does not know. Empty
// on an architecture whose calls it does not know at all.
SystemCallFilter MakeSystemCallFilter(const Openings& openings);

}  // namespace tallowmere::kernel
