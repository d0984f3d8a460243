// A value, or the reason why there is none: the one way in which the platform reports a failure.
// Only the host's calls turn it into result codes.
#pragma once

#include <cerrno>
#include <cstdint>
#include <optional>
#include <utility>

namespace tallowmere::kernel {

// Why there is no value: an error number of the kernel, or a negative one of the platform's own.
struct Error {
  int number;

  // The errno of this thread's last system call.
  static Error OfLastCall() { return {errno}; }

  bool operator==(const Error&) const = default;
};

// The item or folder in question is on no volume, or there is no such volume.
inline constexpr Error kNoVolume{-1};
// A folder on the way to the requested item is missing or is not a folder.
inline constexpr Error kNoFolder{-2};
inline constexpr Error kNotThere{ENOENT};

// Whether the kernel reports that nothing is there, or that no path leads there. Permission and
// input errors only hide what may be there.
inline bool MeansGone(Error error) {
  return error.number == ENOENT || error.number == ENOTDIR || error.number == ELOOP;
}

// Whether the kernel reports a lack of permission.
inline bool MeansRefused(Error error) {
  return error.number == EACCES || error.number == EPERM;
}

template <class T>
class Result {
 public:
  // Implicit, so that a function can return a value or an error directly.
  Result(T value) : mValue(std::move(value)) {}   // NOLINT(google-explicit-constructor)
  Result(kernel::Error error) : mError(error) {}  // NOLINT(google-explicit-constructor)

  explicit operator bool() const { return mValue.has_value(); }

  // REQUIRES: there is a value.
  T& operator*() & { return *mValue; }
  const T& operator*() const& { return *mValue; }
  T&& operator*() && { return *std::move(mValue); }
  T* operator->() { return &*mValue; }
  const T* operator->() const { return &*mValue; }

  // REQUIRES: there is no value.
  kernel::Error Error() const { return mError; }

 private:
  std::optional<T> mValue;
  kernel::Error mError{0};
};

}  // namespace tallowmere::kernel
