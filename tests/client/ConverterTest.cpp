#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/syscall.h>
#include <tallowmere/Batch.h>
#include <tallowmere/Converter.h>

#include <algorithm>
#include <array>
#include <stdexcept>
#include <vector>

#include "client/ClientSupport.h"
#include "support/CountedCalls.h"

namespace tallowmere {
namespace {

using test::StartClient;
using test::TemporaryFolder;
using testing::ElementsAre;

// What a conversion has answered, as text.
template <class T>
std::string TextOf(const Conversion<T>& answer) {
  if (!answer) return std::string(Name(answer.Failure().outcome));
  if constexpr (std::is_same_v<T, FSSpec>) {
    return answer->value.name;
  } else {
    return answer->value;
  }
}

class ConverterTest : public testing::Test {
 protected:
  std::string In(const std::string& name) const { return (mFolder.Path() / name).string(); }

  // Keeps the answer at the end of mAnswers.
  auto Keep() {
    return [this](const auto& answer) { mAnswers.push_back(TextOf(answer)); };
  }

  TemporaryFolder mFolder;
  Client mClient = StartClient();
  std::vector<std::string> mAnswers;
};

TEST_F(ConverterTest, TellsAnswersAndErrorsInTheOrderOfTheQuestions) {
  const std::string file = mFolder.MakeFile("file");
  const FSSpec record = mClient.RecordOf(file)->value;
  const std::string hfsPath = mClient.HFSPathOf(file)->value;
  Converter converter(mClient);
  converter.RecordOf(file, Keep());
  converter.RecordOf("", Keep());
  converter.PathOf(record, false, Keep());
  converter.PathOf({-32000, 2, "x"}, false, Keep());
  converter.HFSPathOf(file, Keep());
  converter.Tell([this] { mAnswers.emplace_back("told"); });
  converter.PathOfHFSPath(hfsPath, Keep());
  converter.PathOfHFSPath(hfsPath + "2", Keep());
  converter.HFSNameOf(file, Keep());
  converter.Ask(request::GetHFSName(file),
                [this](const auto& name) { mAnswers.push_back(**name); });
  converter.PathInFolder(mFolder.Path(), "file", Keep());
  converter.Finish();
  EXPECT_THAT(mAnswers, ElementsAre("file", "invalid", file, "not-a-volume", hfsPath, "told", file,
                                    file + "2", "file", "file", file));
}

TEST_F(ConverterTest, AnswersManyAsOneAtATime) {
  std::vector<std::string> paths;
  for (int i = 0; i < 3000; ++i) {
    const std::string folder = "folder" + std::to_string(i / 7 % 12);
    mFolder.MakeFolder(folder);
    paths.push_back(In(folder + "/" + std::to_string(i)));
    if (i % 2 == 0) mFolder.MakeFile(folder + "/" + std::to_string(i));
  }
  Converter converter(mClient);
  for (const auto& path : paths) converter.HFSPathOf(path, Keep());
  converter.Finish();
  ASSERT_EQ(mAnswers.size(), paths.size());
  for (std::size_t i = 0; i < paths.size(); i += 97) {
    EXPECT_EQ(mAnswers[i], mClient.HFSPathOf(paths[i])->value) << paths[i];
  }
  for (std::size_t i = 0; i < paths.size(); ++i) {
    EXPECT_TRUE(
        mAnswers[i].ends_with("folder" + std::to_string(i / 7 % 12) + ":" + std::to_string(i)))
        << mAnswers[i];
  }
}

TEST_F(ConverterTest, SeesAChangedFolderAfterItHasFinished) {
  mFolder.MakeFolder("one");
  mFolder.MakeFolder("two");
  mFolder.MakeLink("link", "one");
  Converter converter(mClient);
  converter.HFSPathOf(In("link/x"), Keep());
  converter.Finish();
  std::filesystem::remove(In("link"));
  mFolder.MakeLink("link", "two");
  converter.HFSPathOf(In("link/x"), Keep());
  converter.Finish();
  EXPECT_THAT(mAnswers, ElementsAre(testing::EndsWith(":one:x"), testing::EndsWith(":two:x")));
}

TEST_F(ConverterTest, GoesOnAfterAHandlerHasThrown) {
  Converter converter(mClient);
  converter.RecordOf(In("a"), [](const auto&) { throw std::runtime_error("thrown"); });
  converter.RecordOf(In("b"), Keep());
  EXPECT_THROW(converter.Finish(), std::runtime_error);
  converter.Finish();
  EXPECT_THAT(mAnswers, ElementsAre("b"));
}

TEST_F(ConverterTest, CallsNoHandlerAfterItHasGone) {
  {
    Converter converter(mClient);
    converter.RecordOf(In("a"), Keep());
  }
  EXPECT_TRUE(mClient.RecordOf(In("b")));
  EXPECT_THAT(mAnswers, ElementsAre());
}

TEST_F(ConverterTest, GivesTheErrorToTheQuestionThatTheServiceDoesNotSurvive) {
  mFolder.MakeFile("real");
  Client client({.service = test::ImpostorOnce(mFolder, "head -c 4 >/dev/null; exit 1")});
  Converter converter(client);
  converter.RecordOf(In("real"), Keep());
  converter.RecordOf(In("new"), Keep());
  converter.Finish();
  EXPECT_THAT(mAnswers, ElementsAre("service-failed", "new"));
}

TEST_F(ConverterTest, KeepsNoFolderOpenAfterItHasFinished) {
  ASSERT_TRUE(mClient.RecordOf(In("a")));
  const auto before = test::OpenDescriptors();
  Converter converter(mClient);
  for (int i = 0; i < 100; ++i) {
    converter.RecordOf(mFolder.MakeFolder("folder" + std::to_string(i)) / "x", Keep());
  }
  converter.Finish();
  EXPECT_EQ(test::OpenDescriptors(), before);
}

#ifdef __x86_64__  // elsewhere, some of these calls have other names

// The calls that look at the file system, of a converter of so many paths in three folders.
std::ptrdiff_t LooksAt(const TemporaryFolder& folder, int paths) {
  std::vector<std::string> all;
  for (int i = 0; i < paths; ++i) {
    const std::string name = "folder" + std::to_string(i % 3);
    all.push_back(folder.MakeFolder(name) / std::to_string(i));
  }
  std::optional<Client> client;
  const auto calls =
      test::CallsOf([&] { client.emplace(StartClient()).GetHFSVolumeName(0).HasValue(); },
                    [&] {
                      Converter converter(*client);
                      for (const auto& path : all) {
                        converter.HFSPathOf(path, [](const auto&) {});
                      }
                      converter.Finish();
                    });
  if (!calls) return -1;
  constexpr std::array kLooks{SYS_newfstatat, SYS_openat, SYS_open, SYS_close, SYS_readlink,
                              SYS_lstat,      SYS_fstat,  SYS_stat, SYS_statx, SYS_fcntl};
  return std::count_if(calls->begin(), calls->end(), [&](long call) {
    return std::find(kLooks.begin(), kLooks.end(), call) != kLooks.end();
  });
}

TEST_F(ConverterTest, LooksOnceAtEachItemOfAFolderThatItKnows) {
  const auto few = LooksAt(mFolder, 30);
  if (few < 0) GTEST_SKIP() << "tracing is not possible here";
  EXPECT_EQ(LooksAt(mFolder, 530) - few, 500);
}

#endif

}  // namespace
}  // namespace tallowmere
