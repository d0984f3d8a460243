// The items of a command: its arguments, or, with "-" as the only argument, the lines of standard
// input.
#pragma once

#include <cstddef>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace tallowmere::cli {

class Items {
 public:
  // `separator` ends each item on standard input; it is optional after the last one.
  Items(std::vector<std::string> arguments, char separator);

  // The next item, or nullopt at the end. `beforeWaiting` is called before each wait for more
  // standard input.
  std::optional<std::string> Next(const std::function<void()>& beforeWaiting);

  // How much has been taken, 0 to 1. Nullopt when that is unknown.
  std::optional<double> Done() const;

  // The error number of a failed read, which counts as the end; 0 without one.
  int ReadError() const { return mReadError; }

 private:
  bool Fill(const std::function<void()>& beforeWaiting);

  std::vector<std::string> mArguments;
  char mSeparator;
  bool mFromInput;
  std::size_t mNext = 0;   // index of an argument, or bytes taken from standard input
  std::size_t mSize = 0;   // of standard input when it is a file, in bytes
  std::string mBuffer;     // read from standard input
  std::size_t mTaken = 0;  // bytes of mBuffer
  int mReadError = 0;
};

}  // namespace tallowmere::cli
