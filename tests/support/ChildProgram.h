// A program started by a test, with pipes to its standard streams.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::test {

class ChildProgram {
 public:
  enum class BrokenPipe { kEnds, kIsAnError };  // what SIGPIPE does to the child

  // Starts `path` with `arguments` (without the program's name). Aborts the test program when it
  // cannot.
  ChildProgram(const std::string& path, const std::vector<std::string>& arguments,
               BrokenPipe brokenPipe = BrokenPipe::kEnds);
  ChildProgram(const ChildProgram&) = delete;
  ChildProgram& operator=(const ChildProgram&) = delete;
  ~ChildProgram();  // kills it if it still runs

  pid_t Process() const { return mProcess; }

  void Write(std::string_view bytes);
  void CloseInput();
  void CloseOutput();  // our end: the child's writes then fail

  // Up to `size` bytes of its standard output: fewer at its end, or when nothing comes for ten
  // seconds.
  std::string Read(std::size_t size);
  std::string ReadToEnd();

  // What has come of its standard output, at least a byte: nothing at its end, or when nothing
  // comes for ten seconds.
  std::string ReadSome();
  std::string ReadErrorsToEnd();

  // How many of the bytes written to it it has not read yet.
  std::size_t UnreadInput() const;

  // How many bytes of its standard output are there to be read now.
  std::size_t UnreadOutput() const;

  // Waits for its end, at most ten seconds: its exit status, minus the signal that ended it, or
  // -1000 when it still runs.
  int Wait();

 private:
  pid_t mProcess = -1;
  int mInput = -1;        // we write
  int mInputReader = -1;  // the child's end, kept open by us too
  int mOutput = -1;       // we read
  int mErrors = -1;       // we read
};

}  // namespace tallowmere::test
