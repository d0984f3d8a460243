// Makes the kernel look different to the program that this is linked into, where a test asks for
// it: another time of day, entries without types, a missing call, something that happens between
// two calls. Each lasts as long as its object; nothing else is changed.
#pragma once

#include <chrono>
#include <cstdint>
#include <functional>

namespace tallowmere::test {

// Shifts the time of day (CLOCK_REALTIME) by this much, forwards or backwards.
class OtherTime {
 public:
  explicit OtherTime(std::chrono::nanoseconds later);
  OtherTime(const OtherTime&) = delete;
  OtherTime& operator=(const OtherTime&) = delete;
  ~OtherTime();
};

// Hides the type of every folder entry: DT_UNKNOWN, as on file systems that do not store it.
class UntypedEntries {
 public:
  UntypedEntries();
  UntypedEntries(const UntypedEntries&) = delete;
  UntypedEntries& operator=(const UntypedEntries&) = delete;
  ~UntypedEntries();
};

// Makes statfs report this type for every FUSE file system.
class FuseAsType {
 public:
  explicit FuseAsType(std::uint32_t type);
  FuseAsType(const FuseAsType&) = delete;
  FuseAsType& operator=(const FuseAsType&) = delete;
  ~FuseAsType();
};

// Makes openat2 fail with this error: EPERM in a sandbox, ENOSYS before Linux 5.6.
class RefusedOpenat2 {
 public:
  explicit RefusedOpenat2(int error);
  RefusedOpenat2(const RefusedOpenat2&) = delete;
  RefusedOpenat2& operator=(const RefusedOpenat2&) = delete;
  ~RefusedOpenat2();
};

// Does something whenever openat2 is about to open this path.
class BeforeOpenat2 {
 public:
  explicit BeforeOpenat2(std::function<void(const char* path)> happens);
  BeforeOpenat2(const BeforeOpenat2&) = delete;
  BeforeOpenat2& operator=(const BeforeOpenat2&) = delete;
  ~BeforeOpenat2();
};

// Does something whenever entries of a folder are about to be read: getdents64 of this descriptor.
class BeforeEntries {
 public:
  explicit BeforeEntries(std::function<void(int folder)> happens);
  BeforeEntries(const BeforeEntries&) = delete;
  BeforeEntries& operator=(const BeforeEntries&) = delete;
  ~BeforeEntries();
};

// Waits until the kernel's clock for time stamps has advanced, some milliseconds, so that later
// changes get another time than earlier ones.
void WaitForTheNextTick();

}  // namespace tallowmere::test
