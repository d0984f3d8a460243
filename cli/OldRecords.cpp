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

// Fails with the reason of the system.
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
  if (got < 0) return Error{Outcome::kInvalid, path + ": " + std::strerror(error)};
  return bytes;
}

// What is wrong with the length of a file of records; empty when nothing is. The last record needs
// nothing behind it up to the stride.
std::string WhyNoRecords(std::size_t size, const RecordForm& form) {
  if (size < form.skip) return "it has fewer bytes than are to be skipped";
  const std::size_t left = (size - form.skip) % form.stride;
  if (left == 0 || left >= protocol::kFileSpecSize) return {};
  return std::to_string(left) + " bytes at its end are no record of 70";
}

}  // namespace

Result<std::vector<std::string>> ReadPackedRecords(const std::vector<std::string>& files,
                                                   const RecordForm& form) {
  std::vector<std::string> records;
  for (const std::string& path : files) {
    const auto bytes = ReadAll(path);
    if (!bytes) return bytes.Failure();
    const std::string reason = WhyNoRecords(bytes->size(), form);
    if (!reason.empty()) {
      return Error{Outcome::kInvalid, std::string(path).append(": ").append(reason)};
    }
    for (std::size_t at = form.skip; at < bytes->size(); at += form.stride) {
      records.push_back(Hex(std::string_view(*bytes).substr(at, protocol::kFileSpecSize)));
    }
  }
  return records;
}

std::optional<std::string> HintAtOtherOrder(const std::string& text, std::endian order,
                                            bool isKnown) {
  const auto bytes = ReadRecordBytes(text);
  const bool isBig = order == std::endian::big;
  const auto record = bytes ? DecodeFSSpec(*bytes, order) : std::nullopt;
  const auto other =
      bytes ? DecodeFSSpec(*bytes, isBig ? std::endian::little : std::endian::big) : std::nullopt;
  if (!record || other->vRefNum >= 0 || (record->vRefNum <= 0 && isKnown)) return std::nullopt;
  return "in the other byte order (--byte-order " + std::string(isBig ? "little" : "big") +
         ") its volume would be " + std::to_string(other->vRefNum);
}

}  // namespace tallowmere::cli
