// Linked into a test program, it keeps the program and the services that it starts on one
// processor: where they only wait for each other, waking each other across processors takes half of
// the time.
#include <gtest/gtest.h>
#include <sched.h>

namespace tallowmere::test {
namespace {

class OneProcessor : public testing::Environment {
 public:
  // On the one that the kernel has chosen. Where that is not permitted it is only slower.
  void SetUp() override {
    cpu_set_t one;
    CPU_ZERO(&one);
    CPU_SET(static_cast<unsigned>(sched_getcpu()), &one);
    sched_setaffinity(0, sizeof one, &one);
  }
};
[[maybe_unused]] testing::Environment* const kOneProcessor =
    testing::AddGlobalTestEnvironment(new OneProcessor);

}  // namespace
}  // namespace tallowmere::test
