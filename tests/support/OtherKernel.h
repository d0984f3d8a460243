// Shows the program that it is linked into another kernel than the real one, where a test asks for
// it: another time of day, entries without types, a missing call, something that happens between
// two calls. Each for as long as its object lives; nothing is changed otherwise.
#pragma once

#include <chrono>
#include <functional>

namespace tallowmere::test {

// The time of day (CLOCK_REALTIME) is shown that much later, or earlier.
class OtherTime {
 public:
  explicit OtherTime(std::chrono::nanoseconds later);
  OtherTime(const OtherTime&) = delete;
  OtherTime& operator=(const OtherTime&) = delete;
  ~OtherTime();
};

// No entry of a folder has a type: DT_UNKNOWN, as on file systems that do not store it.
class UntypedEntries {
 public:
  UntypedEntries();
  UntypedEntries(const UntypedEntries&) = delete;
  UntypedEntries& operator=(const UntypedEntries&) = delete;
  ~UntypedEntries();
};

// openat2 fails with that error: EPERM in a sandbox, ENOSYS before Linux 5.6.
class RefusedOpenat2 {
 public:
  explicit RefusedOpenat2(int error);
  RefusedOpenat2(const RefusedOpenat2&) = delete;
  RefusedOpenat2& operator=(const RefusedOpenat2&) = delete;
  ~RefusedOpenat2();
};

// Something happens whenever entries of a folder are about to be read: getdents64 of that
// descriptor.
class BeforeEntries {
 public:
  explicit BeforeEntries(std::function<void(int folder)> happens);
  BeforeEntries(const BeforeEntries&) = delete;
  BeforeEntries& operator=(const BeforeEntries&) = delete;
  ~BeforeEntries();
};

// Waits until the kernel's clock for time stamps has moved on, so that what is changed from now on
// has another time than what was changed before: some milliseconds.
void WaitForTheNextTick();

}  // namespace tallowmere::test
