// Kept apart, so that a program that traces nothing starts without the standard streams.
#include <iostream>

#include "CFileRef.h"

void CFileRef::Trace() const {
  if (!IsValid()) {
    std::cout << "(invalid)";
    return;
  }
  std::cout << GetPath() << (Exists() ? " (state: existing)" : " (state: not existing)");
}
