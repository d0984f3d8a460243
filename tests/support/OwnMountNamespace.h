// Moves a whole test program into a mount namespace of its own, where that is permitted, before it
// first reads the mounts: the list of mounts that a process has read is that of a namespace.
#pragma once

#include <gtest/gtest.h>

#include "support/MountNamespace.h"

namespace tallowmere::test {

class OwnMountNamespace : public testing::Environment {
 public:
  void SetUp() override { EnterOwnMountNamespace(); }
};
inline testing::Environment* const kOwnMountNamespace =
    testing::AddGlobalTestEnvironment(new OwnMountNamespace);

}  // namespace tallowmere::test
