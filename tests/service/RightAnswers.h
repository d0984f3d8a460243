// What services answer that are started in unusual surroundings.
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

// An id that two items could have, and none has: all folders of its volume are read.
constexpr auto kSharedID = static_cast<std::int32_t>(0x80001234);

// The command that starts a program in a shell, once a line of the shell has succeeded there.
inline std::vector<std::string> After(const std::string& line,
                                      std::vector<std::string> command = {}) {
  command.insert(command.end(), {"sh", "-c", "{ " + line + "; } && exec \"$@\"", "sh"});
  return command;
}

// Whether a program can be started by a command.
inline bool IsPermitted(std::vector<std::string> command) {
  // The service itself, which without its argument ends at once with status 1.
  command.insert(command.end(), {"sh", "-c", "\"$0\"; test $? = 1", TALLOWMERE_SERVICE});
  return RunTool(command);
}

// Every request about the item at a path has its right answer. The item is a file whose name is its
// HFS name too, as are those of the folders on the way.
inline void ExpectRightAnswers(Service& service, const std::string& path) {
  const Item item = LearnItem(service, path);
  ASSERT_EQ(item.record, Record(item.volume, item.folderID, item.name));
  EXPECT_NE(item.folderID, 0);

  // Behind the volume's name the full path has the names behind its place, wherever that is.
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
