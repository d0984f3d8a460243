#include "FileServer.h"

#include <unistd.h>

#include <cstdint>

namespace tallowmere::benchmark {
namespace {

constexpr const char* kProgram = "/usr/lib/openssh/sftp-server";

// Types of packets.
constexpr char kInit = 1;
constexpr char kLStat = 7;
constexpr char kRealPath = 16;

constexpr std::uint32_t kVersion = 3;
constexpr std::uint32_t kAnyID = 1;

constexpr std::size_t kLengthSize = 4;
std::string Number(std::uint32_t value) {
  std::string bytes;
  for (int shift = 24; shift >= 0; shift -= 8) bytes += static_cast<char>(value >> shift);
  return bytes;
}

std::string Text(const std::string& text) {
  return Number(static_cast<std::uint32_t>(text.size())) + text;
}

std::string Packet(char type, const std::string& fields) {
  return Number(static_cast<std::uint32_t>(1 + fields.size())) + type + fields;
}

// The number of bytes that follow the length at the beginning of an answer.
std::size_t SizeOf(std::string_view length) {
  std::size_t size = 0;
  for (const char byte : length) size = size << 8 | static_cast<unsigned char>(byte);
  return size;
}

// A question with the size of its answer, found by asking another server.
Question Measured(std::string request) {
  FileServer server;
  const std::size_t size = SizeOf(server.Process().Ask(request, kLengthSize));
  return {std::move(request), kLengthSize + size};
}

}  // namespace

bool FileServer::IsInstalled() {
  return access(kProgram, X_OK) == 0;
}

// It answers with its version and a list of its extensions.
FileServer::FileServer()
    : mProcess(std::make_unique<Server>(kProgram, std::vector<std::string>{})) {
  const std::size_t size = SizeOf(mProcess->Ask(Packet(kInit, Number(kVersion)), kLengthSize));
  mProcess->Ask({}, size);
}

Question FileServer::Attributes(const std::string& path) {
  return Measured(Packet(kLStat, Number(kAnyID) + Text(path)));
}

Question FileServer::CanonicalPath(const std::string& path) {
  return Measured(Packet(kRealPath, Number(kAnyID) + Text(path)));
}

}  // namespace tallowmere::benchmark
