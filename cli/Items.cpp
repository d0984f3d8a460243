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

}  // namespace

Items::Items(std::vector<std::string> arguments, char separator)
    : mArguments(std::move(arguments)),
      mSeparator(separator),
      mFromInput(mArguments.size() == 1 && mArguments[0] == "-") {
  if (mFromInput) mSize = SizeOfInput();
}

std::optional<std::string> Items::Next() {
  if (!mFromInput) {
    if (mNext == mArguments.size()) return std::nullopt;
    return mArguments[mNext++];
  }
  std::size_t end = mBuffer.find(mSeparator, mTaken);
  while (end == std::string::npos) {
    const std::size_t known = mBuffer.size() - mTaken;
    if (!Fill()) break;
    end = mBuffer.find(mSeparator, known);
  }
  const bool isLast = end == std::string::npos;
  if (isLast && mTaken == mBuffer.size()) return std::nullopt;
  std::string item = mBuffer.substr(mTaken, isLast ? std::string::npos : end - mTaken);
  mTaken = isLast ? mBuffer.size() : end + 1;
  mNext += item.size() + (isLast ? 0 : 1);
  return item;
}

bool Items::WouldWait() const {
  if (!mFromInput || mEnded || mBuffer.find(mSeparator, mTaken) != std::string::npos) return false;
  pollfd input{STDIN_FILENO, POLLIN, 0};
  return poll(&input, 1, 0) == 0;
}

std::optional<double> Items::Done() const {
  const std::size_t all = mFromInput ? mSize : mArguments.size();
  if (all == 0) return std::nullopt;
  return static_cast<double>(mNext) / static_cast<double>(all);
}

// Reads a piece behind what has not been taken; false at the end.
bool Items::Fill() {
  mBuffer.erase(0, std::exchange(mTaken, 0));
  std::array<char, kPiece> piece;
  ssize_t got = 0;
  do {
    got = mEnded ? 0 : read(STDIN_FILENO, piece.data(), piece.size());
  } while (got < 0 && errno == EINTR);
  if (got < 0) mReadError = errno;
  mEnded = got <= 0;
  if (!mEnded) mBuffer.append(piece.data(), static_cast<std::size_t>(got));
  return !mEnded;
}

}  // namespace tallowmere::cli
