// Linked into a test program, keeps the program and the services that it starts on one processor.
// They mostly wait for each other, and waking each other across processors takes half of the time.
#include <gtest/gtest.h>
#include <sched.h>

namespace tallowmere::test {
namespace {

class OneProcessor : public testing::Environment {
 public:
  // Uses the processor that the kernel has chosen. Where pinning is not permitted, the tests are
  // just slower.
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
