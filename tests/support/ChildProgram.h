// A program started by a test, with pipes to its standard streams.
#pragma once

#include <sys/types.h>

#include <array>
#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::test {

class ChildProgram {
 public:
  enum class BrokenPipe { kEnds, kIsAnError };  // the effect of SIGPIPE on the child

  // Starts `path` with `arguments` (excluding the program's name). Aborts the test program when
  // that fails.
  ChildProgram(const std::string& path, const std::vector<std::string>& arguments,
               BrokenPipe brokenPipe = BrokenPipe::kEnds);

  // With a child of this process that `start` makes another way: it gets the child's three standard
  // streams, and returns its id.
  using Streams = std::array<int, 3>;
  explicit ChildProgram(const std::function<pid_t(const Streams&)>& start);

  ChildProgram(const ChildProgram&) = delete;
  ChildProgram& operator=(const ChildProgram&) = delete;
  ~ChildProgram();  // kills the program if it still runs

  pid_t Process() const { return mProcess; }

  void Write(std::string_view bytes);
  void CloseInput();
  void CloseOutput();  // closes our end: the child's writes then fail

  // Reads up to `size` bytes of its standard output; fewer at the end, or when nothing arrives for
  // ten seconds.
  std::string Read(std::size_t size);
  std::string ReadToEnd();

  // Reads what has arrived of its standard output, at least one byte; nothing at the end, or when
  // nothing arrives for ten seconds.
  std::string ReadSome();
  std::string ReadErrorsToEnd();

  // The number of bytes written to it that it has not read yet.
  std::size_t UnreadInput() const;

  // The number of bytes of its standard output that can be read now.
  std::size_t UnreadOutput() const;

  // Waits at most ten seconds for it to end. Returns its exit status, minus the signal that ended
  // it, or -1000 when it still runs.
  int Wait();

 private:
  pid_t mProcess = -1;
  int mInput = -1;        // we write to it
  int mInputReader = -1;  // the child's end, which we keep open too
  int mOutput = -1;       // we read from it
  int mErrors = -1;       // we read from it
};

}  // namespace tallowmere::test
