#include "client/RequestText.h"

#include <tallowmere/Types.h>

#include <cstdint>

#include "client/AnswerReader.h"
#include "service/Protocol.h"

namespace tallowmere {
namespace {

constexpr std::size_t kMostQuoted = 1000;  // bytes; no more helps a person

std::string Quoted(const std::string& text) {
  if (text.size() <= kMostQuoted) return '"' + text + '"';
  return '"' + text.substr(0, kMostQuoted) + "...\"";
}

std::string QuotedHFS(const std::string& name) {
  return Quoted(Utf8OfHFSName(name));
}

FSSpec TakePlainSpec(AnswerReader& request) {
  FSSpec spec{};
  spec.vRefNum = request.Take<std::int16_t>();
  spec.parID = request.Take<std::int32_t>();
  spec.name = request.TakeString();
  return spec;
}

}  // namespace

std::string WhatIsAsked(std::string_view bytes) {
  AnswerReader request(bytes);
  switch (request.Take<std::uint16_t>()) {
    case protocol::kRequestMakeFullPath:
      return "the full HFS path of " + Quoted(request.TakeString());
    case protocol::kRequestMakeFileRefFromPath:
      request.TakeString();
      return "the item with the HFS path " + QuotedHFS(request.TakeString());
    case protocol::kRequestGetVolRefnumByHFSName:
      return "the number of the volume " + QuotedHFS(request.TakeString());
    case protocol::kRequestGetHFSVolumeName:
      return "the name of the volume " + std::to_string(request.Take<std::int16_t>());
    case protocol::kRequestGetHFSName:
      return "the HFS name of " + Quoted(request.TakeString());
    case protocol::kRequestAddHFSName: {
      const std::string folder = request.TakeString();
      return "the item " + QuotedHFS(request.TakeString()) + " in " + Quoted(folder);
    }
    case protocol::kRequestGetFSSpec:
      return "the record of " + Quoted(request.TakeString());
    case protocol::kRequestSetFileRefFromFSSpecData:
      return "the item with the record " + Quoted(TextOfFSSpec(TakePlainSpec(request)));
    case protocol::kRequestSetFileRefFromFSSpec:
      return "the item with the record " + Quoted(TextOfFSSpec(request.TakeSpec()));
    default:
      return "export settings";
  }
}

bool SearchesOtherVolumes(std::string_view bytes) {
  AnswerReader request(bytes);
  switch (request.Take<std::uint16_t>()) {
    case protocol::kRequestSetFileRefFromFSSpecData:
      return true;
    case protocol::kRequestSetFileRefFromFSSpec:
      request.TakeBytes(protocol::kFileSpecSize);
      return request.TakeFlag();
    default:
      return false;
  }
}

}  // namespace tallowmere
