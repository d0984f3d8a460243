// The examples of docs/protocol.md, replayed byte for byte by a service that was started in "/".
#include <gtest/gtest.h>

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

// Indented lines that begin with "request" or "response", and those that go on below.
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

TEST(TheProtocolPage, SaysWhatTheServiceAnswers) {
  const auto before = std::filesystem::current_path();
  std::filesystem::current_path("/");
  Service service;
  std::filesystem::current_path(before);
  for (const Example& example : ReadExamples()) {
    const int code = example.request.at(0);
    if (code == 0) continue;
    EXPECT_TRUE(service.Answers(example.request, example.response)) << "code " << code;
  }
  service.Write(ReadExamples().at(0).request);
  EXPECT_EQ(service.ReadToEnd(), ReadExamples().at(0).response);
  EXPECT_EQ(service.Wait(), 0);
}

}  // namespace
}  // namespace tallowmere::test
