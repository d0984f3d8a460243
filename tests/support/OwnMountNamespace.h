// Puts a whole test program into a mount namespace of its own, where that is permitted, before its
// first look at the mounts: the list of mounts that a process has read is one of a namespace.
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
