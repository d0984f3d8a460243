#include "cli/Items.h"

#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <utility>

namespace tallowmere::cli {
namespace {

constexpr std::size_t kPiece = 65536;  // bytes of one read

std::size_t SizeOfInput() {
  struct stat about {};
  const bool isFile = fstat(STDIN_FILENO, &about) == 0 && S_ISREG(about.st_mode);
  return isFile ? static_cast<std::size_t>(about.st_size) : 0;
}

// Waits at most `milliseconds`, -1 for ever; returns whether a read would not block.
bool HasInput(int milliseconds) {
  pollfd input{STDIN_FILENO, POLLIN, 0};
  return poll(&input, 1, milliseconds) != 0;
}

}  // namespace

Items::Items(std::vector<std::string> arguments, char separator)
    : mArguments(std::move(arguments)),
      mSeparator(separator),
      mFromInput(mArguments.size() == 1 && mArguments[0] == "-") {
  if (mFromInput) mSize = SizeOfInput();
}

std::optional<std::string> Items::Next(const std::function<void()>& beforeWaiting) {
  if (!mFromInput) {
    if (mNext == mArguments.size()) return std::nullopt;
    return mArguments[mNext++];
  }
  std::size_t end = mBuffer.find(mSeparator, mTaken);
  while (end == std::string::npos) {
    const std::size_t known = mBuffer.size() - mTaken;
    if (!Fill(beforeWaiting)) break;
    end = mBuffer.find(mSeparator, known);
  }
  const bool isLast = end == std::string::npos;
  if (isLast && mTaken == mBuffer.size()) return std::nullopt;
  std::string item = mBuffer.substr(mTaken, isLast ? std::string::npos : end - mTaken);
  mTaken = isLast ? mBuffer.size() : end + 1;
  mNext += item.size() + (isLast ? 0 : 1);
  return item;
}

std::optional<double> Items::Done() const {
  const std::size_t all = mFromInput ? mSize : mArguments.size();
  if (all == 0) return std::nullopt;
  return static_cast<double>(mNext) / static_cast<double>(all);
}

// Reads a piece into the buffer, after what has not been taken; returns false at the end.
bool Items::Fill(const std::function<void()>& beforeWaiting) {
  mBuffer.erase(0, std::exchange(mTaken, 0));
  std::array<char, kPiece> piece;
  ssize_t got = -1;
  while (got < 0) {
    if (!HasInput(0)) {
      beforeWaiting();
      HasInput(-1);
    }
    got = read(STDIN_FILENO, piece.data(), piece.size());
    if (got < 0 && errno != EINTR && errno != EAGAIN) {
      mReadError = errno;
      return false;
    }
  }
  mBuffer.append(piece.data(), static_cast<std::size_t>(got));
  return got > 0;
}

}  // namespace tallowmere::cli
