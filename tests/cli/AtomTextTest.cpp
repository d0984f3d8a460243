#include <gtest/gtest.h>
#include <sys/resource.h>

#include <cstdlib>

#include "cli/AtomText.h"

namespace tallowmere::cli {
namespace {

// A big-endian number of that many bytes.
std::string Number(std::size_t number, std::size_t size) {
  std::string bytes;
  while (size-- > 0) bytes.push_back(static_cast<char>(number >> (8 * size)));
  return bytes;
}

std::string Atom(const char* type, std::size_t childCount, const std::string& content) {
  constexpr std::size_t kHead = 20;
  return Number(kHead + content.size(), 4) + type + Number(1, 4) + Number(0, 2) +
         Number(childCount, 2) + Number(0, 4) + content;
}

// A leaf nested in that many atoms, in a container.
std::string Nested(std::size_t atoms) {
  std::string atom = Atom("leaf", 0, "\1");
  for (std::size_t i = 0; i < atoms; ++i) {
    atom = Atom("fold", 1, atom);
  }
  return std::string(12, '\0') + atom;
}

TEST(AtomText, IndentsAtomsByThoseAroundThem) {
  EXPECT_EQ(TextOfAtoms(Nested(2)), "fold\n  fold\n    leaf  1\n");
}

TEST(AtomText, OfAnythingThatIsCutOffIsNone) {
  const std::string whole = Nested(1);
  for (std::size_t size = 13; size < whole.size(); ++size) {
    EXPECT_EQ(TextOfAtoms(std::string_view(whole).substr(0, size)), std::nullopt) << size;
  }
}

// Whether there is no text, judged by a process that has one second.
void ExitWith0IfNone(const std::string& container) {
  const rlimit aSecond{1, 1};
  setrlimit(RLIMIT_CPU, &aSecond);
  std::exit(TextOfAtoms(container) == std::nullopt ? 0 : 1);
}

// A size of 0 leads to the same atom for ever.
TEST(AtomText, OfAnAtomThatIsShorterThanItsHeadIsNone) {
  for (const std::size_t size : {0U, 1U, 19U}) {
    std::string container = Nested(0);
    container.replace(12, 4, Number(size, 4));
    EXPECT_EXIT(ExitWith0IfNone(container), testing::ExitedWithCode(0), "") << size;
  }
}

TEST(AtomText, OfSixteenAtomsWithinEachOtherIsThereAndOfMoreIsNone) {
  EXPECT_NE(TextOfAtoms(Nested(15)), std::nullopt);
  EXPECT_EQ(TextOfAtoms(Nested(16)), std::nullopt);
}

// As deep as an answer can nest: deeper than a stack holds.
TEST(AtomText, OfAtomsAsDeepAsAnAnswerIsLongIsNone) {
  constexpr std::size_t kAtomHead = 20;
  constexpr std::size_t kLongestSettings = 1 << 20;
  std::string container(12, '\0');
  for (std::size_t size = kLongestSettings - kLongestSettings % kAtomHead; size > 0;
       size -= kAtomHead) {
    container +=
        Number(size, 4) + "fold" + std::string(6, '\0') + Number(1, 2) + std::string(4, '\0');
  }
  EXPECT_EQ(TextOfAtoms(container), std::nullopt);
}

}  // namespace
}  // namespace tallowmere::cli
