// tallowmere-cli, run to its end.
#pragma once

#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "support/ChildProgram.h"

namespace tallowmere::test {

struct Output {
  int status;
  std::string text;
  std::string errors;
};

inline Output Cli(const std::vector<std::string>& arguments, const std::string& input = "") {
  ChildProgram cli(TALLOWMERE_CLI, arguments);
  cli.Write(input);
  cli.CloseInput();
  std::string text = cli.ReadToEnd();
  std::string errors = cli.ReadErrorsToEnd();
  return {cli.Wait(), std::move(text), std::move(errors)};
}

inline std::vector<std::string> Lines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream stream(text);
  for (std::string line; std::getline(stream, line);) lines.push_back(line);
  return lines;
}

}  // namespace tallowmere::test
