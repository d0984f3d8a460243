// Replays the examples of docs/protocol.md byte for byte to a service started in "/".
#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "support/Wire.h"

namespace tallowmere::test {
namespace {

struct Example {
  std::string request;
  std::string response;
};

std::string BytesOf(const std::string& hexadecimal) {
  std::string bytes;
  std::istringstream numbers(hexadecimal);
  for (unsigned byte = 0; numbers >> std::hex >> byte;) bytes.push_back(static_cast<char>(byte));
  return bytes;
}

// Reads the indented lines that begin with "request" or "response", and their continuations.
std::vector<Example> ReadExamples() {
  constexpr std::size_t kIndent = 4;
  constexpr std::size_t kLabel = 10;
  std::vector<Example> examples;
  std::ifstream page(TALLOWMERE_PROTOCOL_PAGE);
  std::string* field = nullptr;
  for (std::string line; std::getline(page, line);) {
    if (!line.starts_with(std::string(kIndent, ' '))) {
      field = nullptr;
      continue;
    }
    line.erase(0, kIndent);
    if (line.starts_with("request")) {
      examples.emplace_back();
      field = &examples.back().request;
    } else if (line.starts_with("response")) {
      field = &examples.back().response;
    }
    if (field != nullptr) field->append(BytesOf(line.substr(std::min(kLabel, line.size()))));
  }
  return examples;
}

TEST(TheProtocolPage, HasAnExampleOfEveryCode) {
  std::string codes;
  for (const Example& example : ReadExamples()) codes.push_back(example.request.at(0));
  EXPECT_EQ(codes, std::string("\0\1\2\3\4\5\6\7\10\11\12", 11));
}

// All examples in their order, except that code 0 comes last.
class TheExamples : public testing::Test {
 protected:
  TheExamples() : mFormer(std::filesystem::current_path()) {
    std::filesystem::current_path("/");
    std::rotate(mExamples.begin(), mExamples.begin() + 1, mExamples.end());
    for (const Example& example : mExamples) {
      mRequests += example.request;
      mResponses += example.response;
    }
  }
  ~TheExamples() override { std::filesystem::current_path(mFormer); }

  std::filesystem::path mFormer;
  std::vector<Example> mExamples = ReadExamples();
  std::string mRequests;
  std::string mResponses;
};

TEST_F(TheExamples, AreWhatTheServiceAnswers) {
  Service service;
  for (const Example& example : mExamples) {
    service.Write(example.request);
    EXPECT_EQ(service.Read(example.response.size()), example.response)
        << "code " << int{example.request.at(0)};
  }
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 0);
}

TEST_F(TheExamples, AreAnsweredInOrderWhenWrittenAtOnce) {
  Service service;
  service.Write(mRequests);
  EXPECT_EQ(service.ReadToEnd(), mResponses);
  EXPECT_EQ(service.Wait(), 0);
}

TEST_F(TheExamples, AreAnsweredWhenTheyComeAByteAtATime) {
  Service service;
  for (const char byte : mRequests) {
    service.Write({&byte, 1});
    while (service.UnreadInput() > 0) usleep(50);
  }
  EXPECT_EQ(service.ReadToEnd(), mResponses);
  EXPECT_EQ(service.Wait(), 0);
}

TEST_F(TheExamples, AreNotAnsweredWhereverTheyAreCut) {
  for (const Example& example : mExamples) {
    for (std::size_t length = 0; length < example.request.size(); ++length) {
      Service service;
      service.Write(example.request.substr(0, length));
      service.CloseInput();
      EXPECT_EQ(service.ReadToEnd(), "") << int{example.request.at(0)} << " at " << length;
      EXPECT_EQ(service.Wait(), 0);
    }
  }
}

}  // namespace
}  // namespace tallowmere::test
