// How many blocks each request allocates after an earlier request about the same item. The requests
// are served in this process, whose operator new counts.
#include <fcntl.h>
#include <gtest/gtest.h>

#include <array>
#include <cstdlib>
#include <string_view>

#include "CountedAllocations.h"
#include "service/Request.h"
#include "support/EveryRequest.h"

namespace {

// Live blocks at the last write of a trailer.
int gLiveAtTrailer = 0;

}  // namespace

// Wraps the C library's write (linker option --wrap).
extern "C" ssize_t __real_write(int descriptor, const void* bytes, std::size_t size);
extern "C" ssize_t __wrap_write(int descriptor, const void* bytes, std::size_t size) {
  const std::string_view text(static_cast<const char*>(bytes), size);
  if (text == tallowmere::test::kTrailer) gLiveAtTrailer = tallowmere::test::LiveAllocations();
  return __real_write(descriptor, bytes, size);
}

namespace tallowmere::test {
namespace {

struct Allocations {
  unsigned code;
  int most;  // allows for a long path of the temporary folder
};

std::ostream& operator<<(std::ostream& out, const Allocations& row) {
  return out << "code " << row.code;
}

// Redirects a standard stream to a pipe end while it exists.
class Redirected {
 public:
  Redirected(int stream, int end) : mStream(stream), mSaved(dup(stream)) { dup2(end, stream); }
  Redirected(const Redirected&) = delete;
  Redirected& operator=(const Redirected&) = delete;
  ~Redirected() {
    dup2(mSaved, mStream);
    close(mSaved);
  }

 private:
  int mStream;
  int mSaved;
};

// Serves the request in this process and returns how many blocks that allocated.
int Serve(const std::string& request) {
  std::array<int, 2> requests{};
  std::array<int, 2> responses{};
  if (pipe(requests.data()) != 0 || pipe(responses.data()) != 0) std::abort();
  int taken = 0;
  {
    const Redirected input(STDIN_FILENO, requests[0]);
    const Redirected output(STDOUT_FILENO, responses[1]);
    EXPECT_EQ(write(requests[1], request.data(), request.size()),
              static_cast<ssize_t>(request.size()));
    const int before = CountedAllocations();
    EXPECT_EQ(service::ServeOneRequest(), noErr);
    taken = CountedAllocations() - before;
  }
  for (const int end : {requests[0], requests[1], responses[0], responses[1]}) close(end);
  return taken;
}

class OfARequest : public testing::TestWithParam<Allocations> {};

TEST_P(OfARequest, AreAtMostThese) {
  const EveryRequest requests;
  if (!requests.IsMade()) GTEST_SKIP() << "the path of the temporary folder is too long";
  Serve(requests.Of(7));
  Serve(requests.Of(GetParam().code));
  EXPECT_LE(Serve(requests.Of(GetParam().code)), GetParam().most);
}

// Except for what the exporter keeps after each success.
TEST_P(OfARequest, AreGivenBackBeforeTheTrailer) {
  const EveryRequest requests;
  if (!requests.IsMade()) GTEST_SKIP() << "the path of the temporary folder is too long";
  const std::string request = requests.Of(GetParam().code);
  Serve(requests.Of(7));
  Serve(request);
  Serve(request);
  const int before = LiveAllocations();
  Serve(request);
  EXPECT_EQ(gLiveAtTrailer, LiveAllocations());
  if (GetParam().code != 10) {
    EXPECT_EQ(gLiveAtTrailer, before);
  }
}

INSTANTIATE_TEST_SUITE_P(
    Allocations, OfARequest,
    testing::ValuesIn(std::to_array<Allocations>(
        {{1, 70}, {2, 39}, {3, 0}, {4, 0}, {5, 16}, {6, 31}, {7, 15}, {8, 21}, {9, 15}, {10, 2}})),
    [](const auto& row) { return "Code" + std::to_string(row.param.code); });

}  // namespace
}  // namespace tallowmere::test
