#include "support/OtherKernel.h"

#include <dirent.h>
#include <dlfcn.h>
#include <linux/magic.h>
#include <sys/syscall.h>
#include <sys/vfs.h>
#include <time.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <cstddef>
#include <cstdint>
#include <utility>

namespace {

constexpr long kNanosecondsInASecond = 1'000'000'000;

std::chrono::nanoseconds later{0};
bool isUntyped = false;
std::function<void(int)> beforeEntries;
std::function<void(const char*)> beforeOpenat2;
int openat2Error = 0;
std::uint32_t fuseType = 0;

template <class Call>
Call Real(const char* name) {
  return reinterpret_cast<Call>(dlsym(RTLD_NEXT, name));
}

}  // namespace

// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name): theirs are reserved.

extern "C" int clock_gettime(clockid_t clock, timespec* shown) noexcept {
  static const auto real = Real<int (*)(clockid_t, timespec*)>("clock_gettime");
  const int result = real(clock, shown);
  if (result != 0 || clock != CLOCK_REALTIME || later.count() == 0) return result;
  const std::int64_t now = shown->tv_sec * kNanosecondsInASecond + shown->tv_nsec + later.count();
  *shown = {now / kNanosecondsInASecond, now % kNanosecondsInASecond};
  return result;
}

extern "C" ssize_t getdents64(int folder, void* buffer, size_t size) noexcept {
  static const auto real = Real<ssize_t (*)(int, void*, size_t)>("getdents64");
  if (beforeEntries) beforeEntries(folder);
  const ssize_t got = real(folder, buffer, size);
  auto* const bytes = static_cast<char*>(buffer);
  for (ssize_t at = 0; isUntyped && at < got;) {
    auto* const entry = reinterpret_cast<dirent64*>(bytes + at);
    entry->d_type = DT_UNKNOWN;
    at += entry->d_reclen;
  }
  return got;
}

extern "C" int statfs(const char* path, struct statfs* about) noexcept {
  static const auto real = Real<int (*)(const char*, struct statfs*)>("statfs");
  const int result = real(path, about);
  if (result == 0 && fuseType != 0 && about->f_type == FUSE_SUPER_MAGIC) about->f_type = fuseType;
  return result;
}

extern "C" long syscall(long number, ...) noexcept {
  static const auto real = Real<long (*)(long, ...)>("syscall");
  if (number == SYS_openat2 && openat2Error != 0) {
    errno = openat2Error;
    return -1;
  }
  // No call has more arguments.
  long given[6];
  va_list arguments;
  va_start(arguments, number);
  for (long& argument : given) argument = va_arg(arguments, long);
  va_end(arguments);
  if (number == SYS_openat2 && beforeOpenat2) {
    beforeOpenat2(reinterpret_cast<const char*>(given[1]));
  }
  return real(number, given[0], given[1], given[2], given[3], given[4], given[5]);
}

// NOLINTEND(readability-inconsistent-declaration-parameter-name)

namespace tallowmere::test {

OtherTime::OtherTime(std::chrono::nanoseconds shown) {
  later = shown;
}

OtherTime::~OtherTime() {
  later = {};
}

UntypedEntries::UntypedEntries() {
  isUntyped = true;
}

UntypedEntries::~UntypedEntries() {
  isUntyped = false;
}

FuseAsType::FuseAsType(std::uint32_t type) {
  fuseType = type;
}

FuseAsType::~FuseAsType() {
  fuseType = 0;
}

RefusedOpenat2::RefusedOpenat2(int error) {
  openat2Error = error;
}

RefusedOpenat2::~RefusedOpenat2() {
  openat2Error = 0;
}

BeforeOpenat2::BeforeOpenat2(std::function<void(const char*)> happens) {
  beforeOpenat2 = std::move(happens);
}

BeforeOpenat2::~BeforeOpenat2() {
  beforeOpenat2 = nullptr;
}

BeforeEntries::BeforeEntries(std::function<void(int)> happens) {
  beforeEntries = std::move(happens);
}

BeforeEntries::~BeforeEntries() {
  beforeEntries = nullptr;
}

void WaitForTheNextTick() {
  const auto tick = [] {
    timespec now{};
    clock_gettime(CLOCK_REALTIME_COARSE, &now);
    return std::chrono::seconds(now.tv_sec) + std::chrono::nanoseconds(now.tv_nsec);
  };
  for (const auto before = tick(); tick() == before;) {
  }
}

}  // namespace tallowmere::test
