// A value, or the reason why there is none.
#pragma once

#include <tallowmere/Outcome.h>

#include <string>
#include <utility>
#include <variant>

namespace tallowmere {

struct Error {
  Outcome outcome;
  std::string message;  // one sentence for a person, without a full stop
};

template <class T>
class [[nodiscard]] Result {
 public:
  // Implicit, so that a function can return either one directly.
  Result(T value) : mContent(std::move(value)) {}      // NOLINT(google-explicit-constructor)
  Result(Error error) : mContent(std::move(error)) {}  // NOLINT(google-explicit-constructor)

  bool HasValue() const { return std::holds_alternative<T>(mContent); }
  explicit operator bool() const { return HasValue(); }

  // REQUIRES: HasValue().
  T& operator*() & { return std::get<T>(mContent); }
  T&& operator*() && { return std::get<T>(std::move(mContent)); }
  const T& operator*() const& { return std::get<T>(mContent); }
  T* operator->() { return &std::get<T>(mContent); }
  const T* operator->() const { return &std::get<T>(mContent); }

  // The value, or `otherwise` when there is none.
  T ValueOr(T otherwise) const& { return HasValue() ? **this : std::move(otherwise); }
  T ValueOr(T otherwise) && { return HasValue() ? *std::move(*this) : std::move(otherwise); }

  // REQUIRES: !HasValue().
  const Error& Failure() const { return std::get<Error>(mContent); }

 private:
  std::variant<T, Error> mContent;
};

}  // namespace tallowmere
