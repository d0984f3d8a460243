// The boundary between C++ that may run out of memory and host calls that never throw.
#pragma once

#include <MacTypes.h>

#include <exception>

namespace tallowmere::foundation {

// Returns what `body` returns, or a zero result (null, false, 0) when it throws: out of memory, or
// a text longer than a string can be.
template <typename Body>
auto OrZero(Body&& body) noexcept -> decltype(body()) {
  try {
    return body();
  } catch (const std::exception&) {
    return decltype(body())();
  }
}

// Returns what `body` returns, or ioErr when it throws.
template <typename Body>
OSErr OrError(Body&& body) noexcept {
  try {
    return body();
  } catch (const std::exception&) {
    return ioErr;
  }
}

}  // namespace tallowmere::foundation
