#include "Model.h"

#include <algorithm>
#include <cstdio>
#include <string_view>

namespace tallowmere::soak {
namespace {

constexpr std::size_t kLongestShortForm = 31;

#define LONG_STEM                                                      \
  "a track with a name of more than the sixty-three bytes that there " \
  "is room for"

constexpr std::array<Name, kEndOfFiles> kNames{{
    {"soak volume", "soak volume", "soak volume"},
    {"soak A", "soak A", "soak A"},
    {"soak B", "soak B", "soak B"},
    {"soak C", "soak C", "soak C"},
    {"soak D", "soak D", "soak D"},
    {"soak E", "soak E", "soak E"},
    {"soak F", "soak F", "soak F"},
    {"sub", "sub", "sub"},
    {"link", "link", "link"},
    {"track 1.aif", "track 1.aif", "track 1.aif"},
    {"track 2.aif", "track 2.aif", "track 2.aif"},
    {"caf\xC3\xA9", "caf\x8E", "caf\xC3\xA9"},
    {"the\xCC\x81", "th\x8E", "th\xC3\xA9"},
    {"1:2", "1/2", "1:2"},
    {LONG_STEM ".aif", LONG_STEM ".aif", LONG_STEM ".aif"},
}};

std::string Hexadecimal(std::uint64_t number) {
  std::array<char, 20> text{};
  const int size =
      std::snprintf(text.data(), text.size(), "%llX", static_cast<unsigned long long>(number));
  return {text.data(), static_cast<std::size_t>(size)};
}

}  // namespace

const Name& NameAt(NameIndex index) {
  return kNames.at(index);
}

std::string NewName(std::string_view hfsName) {
  for (const Name& name : kNames) {
    if (name.hfsName == hfsName) return name.newName;
  }
  std::string name(hfsName);  // a short form, with the only accent
  const std::size_t accented = name.find('\x8E');
  if (accented != std::string::npos) name.replace(accented, 1, "\xC3\xA9");
  return name;
}

bool HasShortForm(NameIndex name) {
  return std::string_view(NameAt(name).hfsName).size() > kLongestRecordName;
}

bool IsVolumePlace(const Entry& entry) {
  return entry.folder == kMainRoot && entry.name == kVolumePlace;
}

std::string ShortForm(const Entry& entry, std::size_t marks) {
  const std::string name = NameAt(entry.name).hfsName;
  const std::size_t dot = std::min(name.rfind('.'), name.size());
  const std::string tail = std::string(marks, '#') + Hexadecimal(entry.inode) + name.substr(dot);
  return name.substr(0, std::min(dot, kLongestShortForm - tail.size())) + tail;
}

std::string RecordName(const Entry& entry) {
  return HasShortForm(entry.name) ? ShortForm(entry) : NameAt(entry.name).hfsName;
}

const Entry* State::Find(Node folder, NameIndex name) const {
  const Entry* const found = std::find_if(begin(), end(), [&](const Entry& entry) {
    return entry.folder == folder && entry.name == name;
  });
  return found == end() ? nullptr : found;
}

std::string TextOf(const Entry& entry) {
  static constexpr std::array<const char*, 3> kKinds{"folder", "file", "link"};
  std::string text = "in " + std::to_string(entry.folder) + " '" + NameAt(entry.name).linuxName +
                     "' " + kKinds.at(static_cast<std::size_t>(entry.kind)) + " " +
                     std::to_string(entry.node) + " inode " + std::to_string(entry.inode);
  if (entry.kind != Kind::kLink) return text;
  text += std::string(" to ") + NameAt(entry.target).linuxName;
  if (entry.innerTarget != kNoName) text += std::string("/") + NameAt(entry.innerTarget).linuxName;
  return text;
}

std::string TextOf(const Volume& volume) {
  return "root " + std::to_string(volume.root) + ", number " + std::to_string(volume.number);
}

}  // namespace tallowmere::soak
