// How the bytes of an answer are read.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <functional>
#include <vector>

#include "client/Answers.h"
#include "support/Wire.h"

namespace tallowmere {
namespace {

constexpr std::string_view kMalformed = "the service's answer is not what the protocol says";

using Read = std::function<void(AnswerReader&)>;

const Read kFullPath = [](AnswerReader& answer) { answer::ReadFullPath(answer, 8); };
const Read kPathByResult = answer::ReadPathByResult;
const Read kStringByFlag = answer::ReadStringByFlag;
const Read kVolumeNumber = answer::ReadVolumeNumber;
const Read kSpec = answer::ReadSpec;
const Read kExportSettings = answer::ReadExportSettings;

std::string_view FaultOf(const Read& read, std::string_view bytes) {
  AnswerReader answer(bytes);
  read(answer);
  answer.TakeTrailer();
  return answer.Fault();
}

std::string Trailed(std::string fields) {
  return fields.append(test::kTrailer);
}

struct Whole {
  Read read;
  std::string bytes;
};

std::vector<Whole> WholeAnswers() {
  return {
      {kFullPath, Trailed(test::U16(300) + std::string("v:...:\0\0", 8))},
      {kPathByResult, test::ResultResponse(0, "/a")},
      {kPathByResult, test::ResultResponse(-43)},
      {kStringByFlag, test::PathResponse("/a")},
      {kStringByFlag, test::kNoPathResponse},
      {kVolumeNumber, test::VolumeNumberResponse(-1)},
      {kSpec, test::RecordResponse(1, test::Record(-1, 2, std::string(63, 'x')))},
      {kExportSettings, Trailed(test::I16(0) + test::U32(5) + std::string("12\0\0M", 5))},
  };
}

TEST(Answer, IsWholeWithItsLastByteWhateverFollows) {
  for (const auto& [read, bytes] : WholeAnswers()) {
    for (const char* const behind : {"", "M", "MWLT"}) {
      const std::string all = bytes + behind;
      AnswerReader answer(all);
      read(answer);
      answer.TakeTrailer();
      EXPECT_EQ(answer.Fault(), "");
      ASSERT_TRUE(answer.IsWhole());
      EXPECT_EQ(answer.Size(), bytes.size());
    }
  }
}

TEST(Answer, NeedsMoreBytesWithoutItsLastOne) {
  for (const auto& [read, bytes] : WholeAnswers()) {
    for (std::size_t size = 0; size < bytes.size(); ++size) {
      AnswerReader answer(std::string_view(bytes).substr(0, size));
      read(answer);
      answer.TakeTrailer();
      EXPECT_EQ(answer.Fault(), "");
      ASSERT_FALSE(answer.IsWhole());
      EXPECT_GT(answer.Needed(), size);
      EXPECT_LE(answer.Needed(), bytes.size());
    }
  }
}

TEST(Answer, GivesItsFields) {
  const std::string path = test::PathResponse("/a");
  AnswerReader pathAnswer(path);
  EXPECT_EQ(answer::ReadStringByFlag(pathAnswer), "/a");
  const std::string spec = test::RecordResponse(1, test::Record(-3, -4, "name"));
  AnswerReader specAnswer(spec);
  EXPECT_EQ(answer::ReadSpec(specAnswer), (FSSpec{-3, -4, "name"}));
  const std::string fullPath = test::U16(300) + std::string("v:\0zzz", 6);
  AnswerReader fullPathAnswer(fullPath);
  const auto [wholeLength, text] = answer::ReadFullPath(fullPathAnswer, 6);
  EXPECT_EQ(wholeLength, 300);
  EXPECT_EQ(text, "v:");
  const std::string settings = test::I16(-50) + test::U32(3) + std::string("a\0b", 3);
  AnswerReader settingsAnswer(settings);
  const auto [result, bytes] = answer::ReadExportSettings(settingsAnswer);
  EXPECT_EQ(result, -50);
  EXPECT_EQ(bytes, std::string("a\0b", 3));
}

TEST(Answer, IsNoneWhereItsFlagOrResultSaysSo) {
  const std::string path = test::Flag(0) + test::CString("/a");
  AnswerReader pathAnswer(path);
  EXPECT_EQ(answer::ReadStringByFlag(pathAnswer), std::nullopt);
  const std::string result = test::I16(-43) + test::CString("/a");
  AnswerReader resultAnswer(result);
  EXPECT_EQ(answer::ReadPathByResult(resultAnswer), std::nullopt);
  const std::string number = test::I16(32767);
  AnswerReader numberAnswer(number);
  EXPECT_EQ(answer::ReadVolumeNumber(numberAnswer), std::nullopt);
  const std::string spec = test::Flag(0) + test::Record(-1, 2, "x");
  AnswerReader specAnswer(spec);
  EXPECT_EQ(answer::ReadSpec(specAnswer), std::nullopt);
}

TEST(Answer, IsNoneWhereItsStringIsMissingOrEmpty) {
  for (const std::string& string : {test::U16(0), test::CString("")}) {
    const std::string bytes = test::Flag(1) + string;
    AnswerReader answer(bytes);
    EXPECT_EQ(answer::ReadStringByFlag(answer), std::nullopt);
    EXPECT_TRUE(answer.IsWhole());
  }
}

TEST(Answer, AFlagOfTwoIsMalformed) {
  EXPECT_EQ(FaultOf(kStringByFlag, test::Flag(2)), kMalformed);
  EXPECT_EQ(FaultOf(kSpec, test::Flag(255)), kMalformed);
}

TEST(Answer, AStringThatDoesNotEndWithItsNULIsMalformed) {
  EXPECT_EQ(FaultOf(kStringByFlag, test::Flag(1) + test::Counted("a")), kMalformed);
}

TEST(Answer, AStringWithAnotherNULIsMalformed) {
  EXPECT_EQ(FaultOf(kStringByFlag, test::Flag(1) + test::CString(std::string("a\0b", 3))),
            kMalformed);
}

TEST(Answer, ABufferWithoutANULIsMalformed) {
  EXPECT_EQ(FaultOf(kFullPath, test::U16(8) + "12345678"), kMalformed);
}

TEST(Answer, ARecordsNameOf64BytesIsMalformed) {
  std::string record = test::Record(0, 2, std::string(63, 'n'));
  EXPECT_EQ(FaultOf(kSpec, test::Flag(1) + record), "");
  record[6] = 64;
  EXPECT_EQ(FaultOf(kSpec, test::Flag(1) + record), kMalformed);
}

TEST(Answer, SettingsOfMoreThanAMebibyteAreMalformed) {
  EXPECT_EQ(FaultOf(kExportSettings, test::I16(0) + test::U32(1 << 20)), "");
  EXPECT_EQ(FaultOf(kExportSettings, test::I16(0) + test::U32((1 << 20) + 1)), kMalformed);
}

TEST(Answer, AnotherTrailerIsSaid) {
  EXPECT_EQ(FaultOf(kVolumeNumber, test::I16(1) + "MWLt"),
            "the service's answer does not end as the protocol says");
}

RC_GTEST_PROP(Answer, OfAnyBytesIsWholeOrFaultyOrNeedsMore, (const std::string& bytes)) {
  for (const Read& read :
       {kFullPath, kPathByResult, kStringByFlag, kVolumeNumber, kSpec, kExportSettings}) {
    AnswerReader answer(bytes);
    read(answer);
    answer.TakeTrailer();
    if (!answer.Fault().empty()) continue;
    if (answer.IsWhole()) {
      RC_ASSERT(answer.Size() <= bytes.size());
    } else {
      RC_ASSERT(answer.Needed() > bytes.size());
    }
  }
}

}  // namespace
}  // namespace tallowmere
