// Memory handles.

#include <QuickTime/QuickTime.h>

#include <string>

#include "calls/Process.h"
#include "foundation/NoThrow.h"

using namespace tallowmere;
using calls::ThisProcess;

Handle NewHandleClear(Size byteCount) {
  if (byteCount < 0) return nullptr;
  return foundation::OrZero([byteCount] {
    return ThisProcess().handles.Make(std::string(static_cast<std::size_t>(byteCount), '\0'));
  });
}

void DisposeHandle(Handle handle) {
  foundation::OrZero([handle] { ThisProcess().handles.Dispose(handle); });
}

Size GetHandleSize(Handle handle) {
  return foundation::OrZero([handle] { return ThisProcess().handles.SizeOf(handle); });
}
