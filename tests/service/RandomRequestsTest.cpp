// Sends one service a hundred thousand requests with valid framing and random content.
#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <random>
#include <vector>

#include "support/TemporaryFolder.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

constexpr int kRequests = 100'000;

#if defined(__SANITIZE_ADDRESS__)
constexpr bool kMemoryIsTheServicesOwn = false;  // the sanitizer holds on to freed memory
#else
constexpr bool kMemoryIsTheServicesOwn = true;
#endif

class RandomRequests : public testing::Test {
 protected:
  void SetUp() override {
    mFolder.MakeFolder("folder/below");
    mFolder.MakeFile("folder/file");
    mFolder.MakeFile("folder/" + std::string(80, 'n'));
    mFolder.MakeFile("folder/\xE6\x97\xA5");
    mFolder.MakeLink("link", "folder");
    const std::string record =
        mService.Ask(RecordRequest((mFolder.Path() / "folder/file").string()), 75).substr(1, 70);
    ASSERT_EQ(record.size(), 70u);
    std::memcpy(&mVolume, record.data(), sizeof mVolume);
    std::memcpy(&mParent, record.data() + 2, sizeof mParent);
  }

  unsigned Below(unsigned limit) { return static_cast<unsigned>(mRandom() % limit); }
  bool OneIn(unsigned count) { return Below(count) == 0; }
  template <class Item>
  const Item& AnyOf(const std::vector<Item>& items) {
    return items[Below(static_cast<unsigned>(items.size()))];
  }

  std::string AnyBytes(std::size_t size) {
    std::string bytes(size, '\0');
    for (char& byte : bytes) byte = static_cast<char>(mRandom());
    return bytes;
  }
  // Mostly short, rarely the longest.
  std::size_t AnySize(std::size_t longest) {
    if (OneIn(1000)) return longest;
    return std::min<std::size_t>(longest, OneIn(50) ? Below(5000) : Below(40));
  }
  std::string AnyName(std::size_t longest) {
    const std::vector<std::string> names{
        "file", "below", std::string(80, 'n'), "?#1B", "", ":", "::", "~", "a/b", "\x8E"};
    std::string name = OneIn(2) ? AnyOf(names) : AnyBytes(AnySize(longest));
    if (!OneIn(4)) name.push_back('\0');
    if (OneIn(20)) name.insert(name.size() / 2, 1, '\0');
    name.resize(std::min(name.size(), longest));
    return name;
  }
  std::string AnyPath() {
    const std::string top = mFolder.Path();
    const std::vector<std::string> paths{top + "/folder",
                                         top + "/folder/file",
                                         top + "/link/file",
                                         top,
                                         "/",
                                         "",
                                         "~",
                                         "~/x",
                                         "relative",
                                         "/../..",
                                         "//",
                                         top + "/missing/x"};
    std::string path = OneIn(3) ? AnyBytes(AnySize(65535)) : AnyOf(paths);
    if (OneIn(3)) path += "/" + AnyName(255);
    if (!OneIn(10)) path.push_back('\0');
    path.resize(std::min<std::size_t>(path.size(), 65535));
    return path;
  }
  std::int16_t AnyVolume() {
    const std::vector<std::int16_t> volumes{mVolume, mVolume, 0, 32767, -1, 1};
    return OneIn(10) ? static_cast<std::int16_t>(mRandom()) : AnyOf(volumes);
  }
  // An id that no item has can make the service read every folder of a volume.
  std::int32_t AnyFolder() {
    const std::vector<std::int32_t> folders{mParent, mParent, 2, 1, 0, -1, 3};
    return OneIn(5000) ? static_cast<std::int32_t>(mRandom()) : AnyOf(folders);
  }
  std::string AnyFlag() { return Flag(AnyOf<unsigned>({0, 1, 2, 255})); }

  std::string AnyRequest() {
    switch (1 + Below(10)) {
      case 1: {
        // Sizes too small for the volume's name get no answer.
        mSize = AnyOf<unsigned>({0, 1023, 1024});
        return U16(1) + Counted(AnyPath()) + U16(mSize) + AnyFlag();
      }
      case 2:
        return U16(2) + Counted(AnyPath()) + Counted(AnyName(65535)) + AnyFlag();
      case 3:
        return U16(3) + Counted(AnyName(256));
      case 4:
        return U16(4) + I16(AnyVolume());
      case 5:
        return U16(5) + Counted(AnyPath()) + U16(Below(65536));
      case 6:
        return U16(6) + Counted(AnyPath()) + Counted(AnyName(1024)) + AnyFlag();
      case 7:
        return U16(7) + Counted(AnyPath());
      case 8:
        return U16(8) + I16(AnyVolume()) + Bytes(AnyFolder()) + Counted(AnyName(1024)) + AnyFlag();
      case 9:
        return U16(9) + I16(AnyVolume()) + Bytes(AnyFolder()) + AnyBytes(64) + AnyFlag() +
               AnyFlag();
      default:
        return U16(10) + U32(OneIn(5) ? 0 : static_cast<std::uint32_t>(mRandom())) +
               U32(Below(64)) + Flag(Below(256)) + (OneIn(2) ? "swot" : AnyBytes(4));
    }
  }

  // Reads one response. Returns whether it has the form that its code demands.
  bool TakeResponse(char code) {
    bool isRight = true;
    switch (code) {
      case 1:
        isRight = mService.Read(2 + mSize).size() == 2 + mSize;
        break;
      case 2:
        mService.Read(2);
        isRight = TakeText(false);
        break;
      case 3:
        mService.Read(2);
        break;
      case 4:
      case 5:
        isRight = TakeFlag() && TakeText(true);
        break;
      case 7:
        isRight = TakeFlag() && mService.Read(70).size() == 70;
        break;
      case 10: {
        std::uint32_t size = 0;
        mService.Read(2);
        const std::string field = mService.Read(4);
        std::memcpy(&size, field.data(), field.size());
        isRight = size < 1000 && mService.Read(size).size() == size;
        break;
      }
      default:
        isRight = TakeFlag() && TakeText(false);
    }
    return isRight && mService.Read(kTrailer.size()) == kTrailer;
  }
  bool TakeFlag() {
    const std::string flag = mService.Read(1);
    return flag == Flag(0) || flag == Flag(1);
  }
  // Reads a counted string. Returns whether it has exactly one NUL, at its end.
  bool TakeText(bool isAlwaysThere) {
    std::uint16_t count = 0;
    const std::string field = mService.Read(2);
    std::memcpy(&count, field.data(), field.size());
    if (count == 0) return !isAlwaysThere;
    const std::string text = mService.Read(count);
    return text.size() == count && text.find('\0') == count - 1u;
  }

  std::size_t OpenDescriptors() const {
    const std::string folder = "/proc/" + std::to_string(mService.Process()) + "/fd";
    const auto entries = std::filesystem::directory_iterator(folder);
    return static_cast<std::size_t>(std::distance(begin(entries), end(entries)));
  }
  // In bytes.
  std::size_t ResidentMemory() const {
    std::ifstream pages("/proc/" + std::to_string(mService.Process()) + "/statm");
    std::size_t all = 0;
    std::size_t resident = 0;
    pages >> all >> resident;
    return resident * static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
  }

  Service mService;
  TemporaryFolder mFolder;
  std::mt19937_64 mRandom{20'240'229};
  std::int16_t mVolume = 0;
  std::int32_t mParent = 0;
  unsigned mSize = 0;  // asked for by the last request of code 1
};

TEST_F(RandomRequests, AreAnsweredInFullAndLeaveDescriptorsAndMemoryAsTheyWere) {
  std::size_t memory = 0;
  std::size_t descriptors = 0;
  int exports = 0;
  for (int i = 0; i < kRequests; ++i) {
    const std::string request = AnyRequest();
    mService.Write(request);
    ASSERT_TRUE(TakeResponse(request[0])) << "request " << i << ", code " << int{request[0]};
    if (i > kRequests / 5 && request[0] == 10) ++exports;
    if (i != kRequests / 5) continue;
    memory = ResidentMemory();
    descriptors = OpenDescriptors();
  }
  EXPECT_EQ(OpenDescriptors(), descriptors);
  // Each success of code 10 leaves an instance and its settings.
  const std::size_t left = static_cast<std::size_t>(exports) * 512;
  if (kMemoryIsTheServicesOwn) {
    EXPECT_LT(ResidentMemory(), memory + left + (4 << 20));
  }
  mService.Write(kQuit);
  EXPECT_EQ(mService.ReadToEnd(), "");
  EXPECT_EQ(mService.Wait(), 0);
}

}  // namespace
}  // namespace tallowmere::test
