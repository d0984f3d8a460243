// Checks the answers of services that run in unusual environments.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "support/AtomReader.h"
#include "support/EveryRequest.h"
#include "support/FileSystemImage.h"
#include "support/Wire.h"

namespace tallowmere::test {

#ifdef __SANITIZE_ADDRESS__
constexpr bool kIsSanitized = true;
#else
constexpr bool kIsSanitized = false;
#endif

// An id in the range that items can share. No item has it, so the service reads every folder.
constexpr auto kSharedID = static_cast<std::int32_t>(0x80001234);

// Returns a command that runs `line` in a shell, then, if it succeeded, the program appended to it.
inline std::vector<std::string> After(const std::string& line,
                                      std::vector<std::string> command = {}) {
  command.insert(command.end(), {"sh", "-c", "{ " + line + "; } && exec \"$@\"", "sh"});
  return command;
}

// Returns whether the command may start a program here.
inline bool IsPermitted(std::vector<std::string> command) {
  // Without an argument the service exits at once with status 1.
  command.insert(command.end(), {"sh", "-c", "\"$0\"; test $? = 1", TALLOWMERE_SERVICE});
  return RunTool(command);
}

// Checks every request about the file at `path`. REQUIRES: its name and those of its folders are
// also their HFS names.
inline void ExpectRightAnswers(Service& service, const std::string& path) {
  const Item item = LearnItem(service, path);
  ASSERT_EQ(item.record, Record(item.volume, item.folderID, item.name));
  EXPECT_NE(item.folderID, 0);

  // The full path continues the volume's name with the folders below the volume's mount point.
  std::string way = item.folder + "/";
  std::replace(way.begin(), way.end(), '/', ':');
  EXPECT_TRUE(item.fullPath.starts_with(item.volumeName + ":")) << item.fullPath;
  EXPECT_TRUE(way.ends_with(item.fullPath.substr(item.fullPath.find(':')))) << item.fullPath;

  for (unsigned code = 1; code <= 9; ++code) {
    EXPECT_TRUE(service.Answers(RequestAbout(item, code), AnswerAbout(item, code)))
        << "code " << code << " about " << path;
  }
  const std::string head = I16(0) + U32(144);
  const std::string settings = service.Ask(RequestAbout(item, 10), head.size() + 144 + 4);
  EXPECT_TRUE(settings.starts_with(head));
  EXPECT_TRUE(settings.ends_with(kTrailer));
  EXPECT_EQ(ReadAtomContainer(settings.substr(head.size(), 144)),
            SettingsOf("twos", kRateOfACD, 16, 2));
}

}  // namespace tallowmere::test
