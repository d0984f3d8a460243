// The items that a command is about: its arguments, or with the one argument "-" the lines of
// standard input.
#pragma once

#include <cstddef>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace tallowmere::cli {

class Items {
 public:
  // `separator` ends an item of standard input; the last one may lack it.
  Items(std::vector<std::string> arguments, char separator);

  // The next one, or none at the end. `beforeWaiting` is called before each wait for whoever writes
  // to standard input.
  std::optional<std::string> Next(const std::function<void()>& beforeWaiting);

  // How much of it lies behind, 0 to 1; none where nobody can tell.
  std::optional<double> Done() const;

  // The error number of a read that failed, which is an end; 0 without one.
  int ReadError() const { return mReadError; }

 private:
  bool Fill(const std::function<void()>& beforeWaiting);

  std::vector<std::string> mArguments;
  char mSeparator;
  bool mFromInput;
  std::size_t mNext = 0;   // of the arguments, or the bytes taken from standard input
  std::size_t mSize = 0;   // of standard input where it is a file, in bytes
  std::string mBuffer;     // read from standard input
  std::size_t mTaken = 0;  // of the buffer
  int mReadError = 0;
};

}  // namespace tallowmere::cli
