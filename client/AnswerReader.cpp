#include "client/AnswerReader.h"

#include <cstdint>

#include "service/Protocol.h"

namespace tallowmere {

void AnswerReader::Refuse(std::string_view fault) {
  if (IsWhole()) mFault = fault;
}

std::string_view AnswerReader::TakeBytes(std::size_t size) {
  if (!IsWhole()) return {};
  if (mBytes.size() - mUsed < size) {
    mNeeded = mUsed + size;
    return {};
  }
  const std::string_view bytes = mBytes.substr(mUsed, size);
  mUsed += size;
  return bytes;
}

bool AnswerReader::TakeFlag() {
  const auto flag = Take<std::uint8_t>();
  if (flag > 1) Refuse();
  return flag == 1;
}

std::string AnswerReader::TakeString() {
  const std::string_view bytes = TakeBytes(Take<std::uint16_t>());
  if (bytes.empty()) return {};
  if (bytes.find('\0') != bytes.size() - 1) Refuse();
  return std::string(bytes.substr(0, bytes.size() - 1));
}

std::string AnswerReader::TakeBuffer(std::size_t size) {
  const std::string_view bytes = TakeBytes(size);
  const std::size_t end = bytes.find('\0');
  if (end == std::string_view::npos) Refuse();
  return std::string(bytes.substr(0, end));
}

FSSpec AnswerReader::TakeSpec() {
  const std::string_view bytes = TakeBytes(protocol::kFileSpecSize);
  auto spec = DecodeFSSpec(bytes);
  if (!spec && !bytes.empty()) Refuse();
  return spec.value_or(FSSpec{});
}

void AnswerReader::TakeTrailer() {
  const std::string_view trailer = TakeBytes(protocol::kTrailer.size());
  if (trailer != protocol::kTrailer) {
    Refuse("the service's answer does not end as the protocol says");
  }
}

}  // namespace tallowmere
