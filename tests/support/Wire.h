// Requests and responses as bytes, written field by field: the tests' own implementation of the
// protocol, independent of the client's.
#pragma once

#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

#include "support/ChildProgram.h"

namespace tallowmere::test {

inline constexpr std::string_view kTrailer = "MWLT";

// A little-endian integer of the type's width.
template <class Integer>
std::string Bytes(Integer value) {
  return {reinterpret_cast<const char*>(&value), sizeof value};
}
inline std::string U16(unsigned value) {
  return Bytes(static_cast<std::uint16_t>(value));
}
inline std::string U32(std::uint32_t value) {
  return Bytes(value);
}
inline std::string I16(int value) {
  return Bytes(static_cast<std::int16_t>(value));
}

// A 16-bit count, followed by the bytes.
inline std::string Counted(std::string_view bytes) {
  return U16(static_cast<unsigned>(bytes.size())).append(bytes);
}

// A text as a counted string, whose count includes the NUL.
inline std::string CString(std::string_view text) {
  return Counted(std::string(text).append(1, '\0'));
}

inline const std::string kQuit = U16(0);
inline std::string VolumeNumberRequest(std::string_view name) {
  return U16(3) + CString(name);
}
inline std::string VolumeNameRequest(int number) {
  return U16(4) + I16(number);
}

inline std::string Flag(unsigned value) {
  return Bytes(static_cast<std::uint8_t>(value));
}
inline std::string FullPathRequest(std::string_view path, unsigned size, unsigned flag) {
  return U16(1) + CString(path) + U16(size) + Flag(flag);
}
// `folder` and `name` include any NULs they are to have.
inline std::string PathOfHFSPathRequest(std::string_view folder, std::string_view name,
                                        unsigned flag) {
  return U16(2) + Counted(folder) + Counted(name) + Flag(flag);
}
inline std::string HFSNameRequest(std::string_view path, unsigned longest) {
  return U16(5) + CString(path) + U16(longest);
}
inline std::string AddNameRequest(std::string_view path, std::string_view name, unsigned flag) {
  return U16(6) + CString(path) + CString(name) + Flag(flag);
}
inline std::string RecordRequest(std::string_view path) {
  return U16(7) + CString(path);
}
inline std::string PathOfPartsRequest(int volume, std::int32_t folder, std::string_view name,
                                      unsigned flag) {
  return U16(8) + I16(volume) + Bytes(folder) + CString(name) + Flag(flag);
}
inline std::string PathOfRecordRequest(std::string_view record, unsigned search, unsigned flag) {
  return U16(9).append(record) + Flag(search) + Flag(flag);
}

// A record of 70 bytes, zero after the name.
inline std::string Record(int volume, std::int32_t folder, std::string_view name) {
  std::string record = I16(volume) + Bytes(folder) + Flag(static_cast<unsigned>(name.size()));
  record.append(name).resize(70);
  return record;
}
inline const std::string kEmptyRecord = Record(32767, -1, "");

// The format is given as it is read, "twos".
inline std::string ExportSettingsRequest(std::uint32_t rate, std::uint32_t sampleSize,
                                         std::uint8_t channels, std::string_view format) {
  return U16(10) + U32(rate) + U32(sampleSize) + Bytes(channels) +
         std::string(format.rbegin(), format.rend());
}

inline std::string VolumeNumberResponse(int number) {
  return I16(number).append(kTrailer);
}
inline std::string VolumeNameResponse(std::string_view name) {
  return ("\1" + CString(name)).append(kTrailer);
}
inline std::string NameResponse(unsigned flag, std::string_view name) {
  return (Flag(flag) + CString(name)).append(kTrailer);
}
inline std::string RecordResponse(unsigned flag, std::string_view record) {
  return Flag(flag).append(record).append(kTrailer);
}
// The response to codes 6, 8 and 9.
inline std::string PathResponse(std::string_view path) {
  return (Flag(1) + CString(path)).append(kTrailer);
}
inline const std::string kNoPathResponse = (Flag(0) + U16(0)).append(kTrailer);
// The response to code 9 about an item that cannot be found.
inline const std::string kNoItemResponse = (Flag(1) + U16(0)).append(kTrailer);
// The response to code 1 about a full path with fewer than `room` bytes.
inline std::string FullPathResponse(std::string fullPath, unsigned room) {
  const auto length = static_cast<unsigned>(fullPath.size());
  fullPath.resize(room);
  return U16(length).append(fullPath).append(kTrailer);
}

// Results of code 2, except the last one, which is of code 10.
inline constexpr int kResultNoItem = -43;
inline constexpr int kResultNoFolder = -120;
inline constexpr int kResultNoVolume = -35;
inline constexpr int kResultImpossibleName = -37;
inline constexpr int kResultNotPermitted = -5000;
inline constexpr int kResultSystemError = -36;
inline constexpr int kResultNoMemory = -108;

// The response to code 2.
inline std::string ResultResponse(int result, std::string_view path) {
  return (I16(result) + CString(path)).append(kTrailer);
}
inline std::string ResultResponse(int result) {
  return (I16(result) + U16(0)).append(kTrailer);
}
inline const std::string kNoVolumeNameResponse = std::string("\0\1\0\0MWLT", 8);

// A request that any service answers, and its answer.
inline const std::string kAnyRequest = VolumeNameRequest(32767);
inline const std::string& kItsResponse = kNoVolumeNameResponse;

// The service that is tested: the one of this build, or the one that TALLOWMERE_SERVICE_TO_TEST in
// the environment names, as one of another machine.
inline std::string ServiceToTest() {
  const char* const other = std::getenv("TALLOWMERE_SERVICE_TO_TEST");
  return other != nullptr ? other : TALLOWMERE_SERVICE;
}

// A running service whose parent is this process.
class Service : public ChildProgram {
 public:
  explicit Service(const std::string& parent = std::to_string(getpid()),
                   BrokenPipe brokenPipe = BrokenPipe::kEnds)
      : ChildProgram(ServiceToTest(), {parent}, brokenPipe) {}

  // Starts the service by a command to which the service's program and its argument are appended:
  // {"setpriv", "--clear-groups"}. The argument is the service's own process group, which lives as
  // long as the service does.
  explicit Service(const std::vector<std::string>& command)
      : ChildProgram(command.front(), WithService(command)) {}

  std::string Ask(std::string_view request, std::size_t responseSize) {
    Write(request);
    return Read(responseSize);
  }

  // Whether the response is exactly this one.
  bool Answers(std::string_view request, const std::string& response) {
    Write(request);
    Write(kAnyRequest);
    return Read(response.size()) == response && Read(kItsResponse.size()) == kItsResponse;
  }

  // The number of the volume with a name, by code 3.
  int NumberOf(std::string_view name) {
    const std::string response = Ask(VolumeNumberRequest(name), 6);
    if (response.size() != 6 || !response.ends_with(kTrailer)) return 0;
    return static_cast<std::int16_t>(static_cast<unsigned char>(response[0]) |
                                     static_cast<unsigned char>(response[1]) << 8);
  }

  // The name of the volume with a number, by code 4; empty when there is none.
  std::string NameOf(int number) {
    const std::string head = Ask(VolumeNameRequest(number), 3);
    if (head.size() != 3) return {};
    const std::size_t length = static_cast<unsigned char>(head[1]);
    const std::string rest = Read(length + kTrailer.size());
    return rest.substr(0, rest.size() - kTrailer.size() - 1);
  }

 private:
  static std::vector<std::string> WithService(const std::vector<std::string>& command) {
    std::vector<std::string> arguments(command.begin() + 1, command.end());
    arguments.insert(arguments.end(), {ServiceToTest(), "0"});
    return arguments;
  }
};

}  // namespace tallowmere::test
