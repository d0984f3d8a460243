#include "cli/OldRecords.h"

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <string_view>

#include "cli/Records.h"
#include "service/Protocol.h"

namespace tallowmere::cli {
namespace {

std::string NameOfFile(const std::string& path) {
  return path == "-" ? "standard input" : path;
}

// Fails with the system's reason.
Result<std::string> ReadAll(const std::string& path) {
  const int file =
      path == "-" ? dup(STDIN_FILENO) : open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY);
  std::string bytes;
  std::array<char, 65536> piece;
  ssize_t got = file < 0 ? -1 : 1;
  while (got > 0) {
    got = read(file, piece.data(), piece.size());
    if (got > 0) bytes.append(piece.data(), static_cast<std::size_t>(got));
    if (got < 0 && errno == EINTR) got = 1;
  }
  const int error = errno;
  if (file >= 0) close(file);
  if (got < 0) return Error{Outcome::kInvalid, NameOfFile(path) + ": " + std::strerror(error)};
  return bytes;
}

// What is wrong with the length of a file of records; empty when nothing is. The last record needs
// nothing behind it up to the stride.
std::string WhyNoRecords(std::size_t size, const RecordForm& form) {
  if (size < form.skip) return "it has fewer bytes than are to be skipped";
  const std::size_t left = (size - form.skip) % form.stride;
  if (left == 0 || left >= protocol::kFileSpecSize) return {};
  const std::string last =
      left == 1 ? "its last byte is" : "its last " + std::to_string(left) + " bytes are";
  return last + " no record of 70 bytes";
}

// Whether it has at most 24 bits, and so more in the other byte order.
bool IsSmallID(std::int32_t id) {
  constexpr std::uint32_t kAbove24Bits = 1U << 24;
  return id != 0 && static_cast<std::uint32_t>(id) < kAbove24Bits;
}

}  // namespace

Result<std::vector<PackedRecord>> ReadPackedRecords(const std::vector<std::string>& files,
                                                    const RecordForm& form) {
  std::vector<PackedRecord> records;
  for (const std::string& path : files) {
    const auto bytes = ReadAll(path);
    if (!bytes) return bytes.Failure();
    const std::string reason = WhyNoRecords(bytes->size(), form);
    if (!reason.empty()) {
      return Error{Outcome::kInvalid, NameOfFile(path).append(": ").append(reason)};
    }
    std::size_t number = 0;
    for (std::size_t at = form.skip; at < bytes->size(); at += form.stride) {
      const auto record = std::string_view(*bytes).substr(at, protocol::kFileSpecSize);
      records.push_back({Hex(record), path, ++number, at});
    }
  }
  return records;
}

std::optional<std::string> HintAtOtherOrder(const std::string& text, std::endian order,
                                            RecordVolume volume) {
  const auto bytes = ReadRecordBytes(text);
  const bool isBig = order == std::endian::big;
  const auto record = bytes ? DecodeFSSpec(*bytes, order) : std::nullopt;
  const auto other =
      bytes ? DecodeFSSpec(*bytes, isBig ? std::endian::little : std::endian::big) : std::nullopt;
  if (!record || !other) return std::nullopt;
  const std::string inOther =
      "in the other byte order (--byte-order " + std::string(isBig ? "little" : "big") + ") its ";
  if (other->vRefNum < 0 && (record->vRefNum > 0 || volume == RecordVolume::kUnknown)) {
    return inOther + "volume would be " + std::to_string(other->vRefNum);
  }
  if (volume == RecordVolume::kTold && IsSmallID(other->parID) && !IsSmallID(record->parID)) {
    return inOther + "folder would be " + std::to_string(other->parID);
  }
  return std::nullopt;
}

}  // namespace tallowmere::cli
