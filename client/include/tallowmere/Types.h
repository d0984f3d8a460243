// The parts of requests and answers.
//
// HFS names and HFS paths are Mac Roman bytes, as the service uses them; POSIX paths are the
// kernel's bytes.
#pragma once

#include <bit>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere {

// An item, identified by its volume, the id of its parent folder and its HFS name in that folder.
struct FSSpec {
  std::int16_t vRefNum;  // volume reference number
  std::int32_t parID;    // 32 bits: an id from 0x80000000 on is negative here
  std::string name;      // at most 63 bytes

  bool operator==(const FSSpec&) const = default;
};

// The 70 bytes of a record as in the protocol and in old programs' data: volume reference number
// (16 bits), parent id (32 bits), length of the name, name, zeros up to 63 bytes. The protocol has
// the numbers in this machine's byte order; older machines stored them with the highest byte first.
// REQUIRES: the name has at most 63 bytes.
std::string EncodeFSSpec(const FSSpec& spec, std::endian order = std::endian::native);

// The record in 70 bytes, ignoring what follows its name. Nullopt for any other number of bytes and
// for a name length above 63.
std::optional<FSSpec> DecodeFSSpec(std::string_view bytes, std::endian order = std::endian::native);

// A record as text: "volume:parent:name", such as "-27:19:hostname", with the name in UTF-8.
std::string TextOfFSSpec(const FSSpec& spec);

// The record in such a text. The numbers are decimal; a parent id may be signed or unsigned.
// Nullopt for anything else, for a name above 63 bytes and for one with a character that Mac Roman
// lacks.
std::optional<FSSpec> FSSpecOfText(std::string_view text);

// How sound is stored.
struct SoundFormat {
  std::uint32_t rate;        // in hertz × 65536
  std::uint16_t sampleSize;  // in bits
  std::uint8_t channels;
  std::uint32_t format;  // a four-character code, its first character in the highest byte
};

// The AIFF exporter's answer for a sound.
struct ExportSettings {
  std::int16_t result;  // the platform's result code, 0 for success; -2005: there is no exporter
  std::string bytes;    // an atom container; empty when there are no settings
};

// HFS names and paths as UTF-8, and back. Every name has a text, always precomposed. A text has a
// name when Mac Roman has all its characters, precomposed or decomposed.
std::string Utf8OfHFSName(std::string_view name);
std::optional<std::string> HFSNameOfUtf8(std::string_view text);

}  // namespace tallowmere
