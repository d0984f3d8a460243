#include "formats/Bookmark.h"

#include <algorithm>
#include <bit>
#include <bitset>
#include <iterator>
#include <unordered_set>

#include "formats/Bytes.h"

namespace tallowmere::formats {
namespace {

constexpr std::string_view kFileMark("book\0\0\0\0mark\0\0\0\0", kBookmarkFileMark);
constexpr std::uint32_t kVersion = 0x10040000;
constexpr std::uint32_t kDataOfFileAt = 0x38;
constexpr std::uint32_t kBareHead = 0x30;

constexpr std::uint32_t kLevelOfTarget = 1;
constexpr std::uint32_t kTableMagic = 0xFFFFFFFE;
constexpr std::uint64_t kTableHead = 20;
constexpr std::uint64_t kTableEntry = 12;

constexpr std::uint32_t kText = 0x0101;
constexpr std::uint32_t kBytes = 0x0201;
constexpr std::uint32_t kInteger8 = 0x0301;
constexpr std::uint32_t kInteger16 = 0x0302;
constexpr std::uint32_t kInteger32 = 0x0303;
constexpr std::uint32_t kInteger64 = 0x0304;
constexpr std::uint32_t kDate = 0x0400;
constexpr std::uint32_t kFalse = 0x0500;
constexpr std::uint32_t kTrue = 0x0501;
constexpr std::uint32_t kList = 0x0601;
constexpr std::uint32_t kURL = 0x0901;
constexpr std::uint32_t kRelativeURL = 0x0902;
constexpr std::uint32_t kNothing = 0x0A01;

// No path of the writers has more components or bytes. Items can be shared: without bounds, a small
// bookmark could have a large content.
constexpr std::size_t kMostComponents = 1024;
constexpr std::size_t kLongestText = 1024;
constexpr int kDeepest = 16;

struct Item {
  std::uint32_t type;
  std::string_view bytes;
};

// The data of a bookmark: all offsets are from its begin.
class Data {
 public:
  explicit Data(std::string_view bytes) : mBytes(bytes) {}

  // Nullopt when it does not fit.
  std::optional<Item> ItemAt(std::uint64_t offset) const {
    const auto length = LittleEndianAt<std::uint32_t>(mBytes, offset);
    const auto type = LittleEndianAt<std::uint32_t>(mBytes, offset + sizeof *length);
    if (!type) return std::nullopt;
    const auto bytes = Piece(mBytes, offset + sizeof *length + sizeof *type, *length);
    if (!bytes) return std::nullopt;
    return Item{*type, *bytes};
  }

  static std::optional<std::string> TextOf(const Item& item, std::uint32_t type = kText) {
    if (item.type != type || item.bytes.size() > kLongestText) return std::nullopt;
    return std::string(item.bytes);
  }

  std::optional<std::string> URLOf(const Item& item, int depth = 0) const {
    if (item.type == kURL) return TextOf(item, kURL);
    const auto baseAt = LittleEndianAt<std::uint32_t>(item.bytes, 0);
    const auto textAt = LittleEndianAt<std::uint32_t>(item.bytes, sizeof *baseAt);
    if (item.type != kRelativeURL || !textAt || depth == kDeepest) return std::nullopt;
    const auto base = ItemAt(*baseAt);
    const auto text = ItemAt(*textAt);
    const auto front = base ? URLOf(*base, depth + 1) : std::nullopt;
    const auto back = text ? TextOf(*text) : std::nullopt;
    if (!front || !back || front->size() + back->size() > kLongestText) return std::nullopt;
    return *front + *back;
  }

  static std::optional<std::int64_t> IntegerOf(const Item& item) {
    switch (item.type) {
      case kInteger8:
        return LittleEndianAt<std::int8_t>(item.bytes, 0);
      case kInteger16:
        return LittleEndianAt<std::int16_t>(item.bytes, 0);
      case kInteger32:
        return LittleEndianAt<std::int32_t>(item.bytes, 0);
      case kInteger64:
        return LittleEndianAt<std::int64_t>(item.bytes, 0);
      default:
        return std::nullopt;
    }
  }

  static std::optional<double> DateOf(const Item& item) {
    const auto bits = BigEndianAt<std::uint64_t>(item.bytes, 0);
    if (item.type != kDate || !bits) return std::nullopt;
    return std::bit_cast<double>(*bits);
  }

  static std::optional<bool> TruthOf(const Item& item) {
    if (item.type != kTrue && item.type != kFalse) return std::nullopt;
    return item.type == kTrue;
  }

  static std::optional<BookmarkFlags> FlagsOf(const Item& item) {
    const auto set = LittleEndianAt<std::uint64_t>(item.bytes, 0);
    const auto known = LittleEndianAt<std::uint64_t>(item.bytes, sizeof *set);
    if (item.type != kBytes || !known) return std::nullopt;
    return BookmarkFlags{*set, *known};
  }

  // What `read` makes of each item of a list.
  template <class Read>
  auto ListOf(const Item& list, const Read& read) const
      -> std::optional<std::vector<typename decltype(read(list))::value_type>> {
    constexpr std::size_t kOffset = sizeof(std::uint32_t);
    const std::size_t count = list.bytes.size() / kOffset;
    const bool isList = list.type == kList && list.bytes.size() % kOffset == 0;
    if (!isList || count > kMostComponents + 1) return std::nullopt;
    std::vector<typename decltype(read(list))::value_type> values;
    for (std::size_t at = 0; at < list.bytes.size(); at += kOffset) {
      const auto item = ItemAt(*LittleEndianAt<std::uint32_t>(list.bytes, at));
      auto value = item ? read(*item) : std::nullopt;
      if (!value) return std::nullopt;
      values.push_back(*std::move(value));
    }
    return values;
  }

  std::optional<std::vector<std::string>> TextsOf(const Item& list) const {
    return ListOf(list, [](const Item& item) { return TextOf(item); });
  }
  std::optional<std::vector<std::int64_t>> IntegersOf(const Item& list) const {
    return ListOf(list, [](const Item& item) {
      return item.type == kNothing ? std::optional<std::int64_t>(0) : IntegerOf(item);
    });
  }

 private:
  std::string_view mBytes;
};

// A key and what takes its item: false where the bookmark is broken, which only those can be that
// decide where it leads.
struct Key {
  std::uint32_t key;
  bool (*take)(const Data& data, const Item& item, Bookmark& bookmark);
};

template <class Value>
bool Take(std::optional<Value> value, std::optional<Value>& field) {
  field = std::move(value);
  return field.has_value();
}
template <class Value>
bool Show(std::optional<Value> value, std::optional<Value>& field) {
  field = std::move(value);
  return true;
}

constexpr Key kKeys[] = {
    {0x1004,
     [](const Data& d, const Item& i, Bookmark& b) { return Take(d.TextsOf(i), b.components); }},
    {0x1005,
     [](const Data& d, const Item& i, Bookmark& b) { return Show(d.IntegersOf(i), b.ids); }},
    {0x1010,
     [](const Data&, const Item& i, Bookmark& b) { return Take(Data::FlagsOf(i), b.flags); }},
    {0x1030,
     [](const Data&, const Item& i, Bookmark& b) { return Show(Data::IntegerOf(i), b.targetID); }},
    {0x1040, [](const Data&, const Item& i,
                Bookmark& b) { return Show(Data::DateOf(i), b.targetCreation); }},
    {0x2000, [](const Data& d, const Item& i,
                Bookmark& b) { return Take(d.IntegersOf(i), b.volumeLevels); }},
    {0x2002,
     [](const Data&, const Item& i, Bookmark& b) { return Take(Data::TextOf(i), b.volumePath); }},
    {0x2005,
     [](const Data& d, const Item& i, Bookmark& b) { return Show(d.URLOf(i), b.volumeURL); }},
    {0x2010,
     [](const Data&, const Item& i, Bookmark& b) { return Take(Data::TextOf(i), b.volumeName); }},
    {0x2011,
     [](const Data&, const Item& i, Bookmark& b) { return Show(Data::TextOf(i), b.volumeUUID); }},
    {0x2012, [](const Data&, const Item& i,
                Bookmark& b) { return Show(Data::IntegerOf(i), b.volumeSize); }},
    {0x2013, [](const Data&, const Item& i,
                Bookmark& b) { return Show(Data::DateOf(i), b.volumeCreation); }},
    {0x2030, [](const Data&, const Item& i,
                Bookmark& b) { return Show(Data::TruthOf(i), b.isOnBootVolume); }},
    {0x2040, [](const Data&, const Item& i,
                Bookmark& b) { return Show(Data::IntegerOf(i), b.diskImageLevel); }},
    {0xC011,
     [](const Data&, const Item& i, Bookmark& b) { return Show(Data::TextOf(i), b.userName); }},
};

struct Table {
  std::uint32_t level;
  std::uint32_t next;  // offset; 0 for none
  std::string_view entries;
};

// The size that the table gives is not used: writers differ in how they count.
std::optional<Table> ReadTable(std::string_view data, std::uint32_t offset) {
  const auto magic = LittleEndianAt<std::uint32_t>(data, std::uint64_t{offset} + 4);
  const auto level = LittleEndianAt<std::uint32_t>(data, std::uint64_t{offset} + 8);
  const auto next = LittleEndianAt<std::uint32_t>(data, std::uint64_t{offset} + 12);
  const auto count = LittleEndianAt<std::uint32_t>(data, std::uint64_t{offset} + 16);
  if (!count || magic != kTableMagic) return std::nullopt;
  const auto entries = Piece(data, offset + kTableHead, *count * kTableEntry);
  if (!entries) return std::nullopt;
  return Table{*level, *next, *entries};
}

bool ReadEntries(const Data& data, std::string_view entries, Bookmark& bookmark) {
  std::bitset<std::size(kKeys)> met;  // of a key that comes twice, the first counts
  for (std::size_t at = 0; at < entries.size(); at += kTableEntry) {
    const auto key = *LittleEndianAt<std::uint32_t>(entries, at);
    const auto* const known = std::find_if(std::begin(kKeys), std::end(kKeys),
                                           [key](const Key& entry) { return entry.key == key; });
    const auto index = static_cast<std::size_t>(known - std::begin(kKeys));
    if (known == std::end(kKeys) || met.test(index)) continue;
    met.set(index);
    const auto item = data.ItemAt(*LittleEndianAt<std::uint32_t>(entries, at + 4));
    if (!item || !known->take(data, *item, bookmark)) return false;
  }
  return true;
}

std::optional<Bookmark> ReadData(std::string_view bytes) {
  const Data data(bytes);
  const auto first = LittleEndianAt<std::uint32_t>(bytes, 0);
  const auto table = first ? ReadTable(bytes, *first) : std::nullopt;
  Bookmark bookmark;
  if (!table || table->level != kLevelOfTarget) return std::nullopt;
  if (!ReadEntries(data, table->entries, bookmark)) return std::nullopt;
  std::unordered_set<std::uint32_t> met{*first};
  for (std::uint32_t next = table->next; next != 0;) {
    const auto other = met.insert(next).second ? ReadTable(bytes, next) : std::nullopt;
    if (!other) return std::nullopt;
    next = other->next;
  }
  return bookmark;
}

}  // namespace

bool BeginsBookmarkFile(std::string_view data) {
  return data.starts_with(kFileMark);
}

std::optional<Bookmark> ReadBookmarkFile(std::string_view file) {
  const auto dataAt = LittleEndianAt<std::uint32_t>(file, 16);
  const auto sameAgain = LittleEndianAt<std::uint32_t>(file, 20);
  const auto length = LittleEndianAt<std::uint32_t>(file, 24);
  const auto version = LittleEndianAt<std::uint32_t>(file, 28);
  if (!BeginsBookmarkFile(file) || dataAt != kDataOfFileAt || sameAgain != dataAt) {
    return std::nullopt;
  }
  if (version != kVersion || file.size() != std::uint64_t{kDataOfFileAt} + *length) {
    return std::nullopt;
  }
  return ReadData(file.substr(kDataOfFileAt));
}

std::optional<Bookmark> ReadBookmark(std::string_view bytes) {
  const bool isMarked = bytes.starts_with("book") || bytes.starts_with("alis");
  const auto size = LittleEndianAt<std::uint32_t>(bytes, 4);
  const auto version = LittleEndianAt<std::uint32_t>(bytes, 8);
  const auto head = LittleEndianAt<std::uint32_t>(bytes, 12);
  if (!isMarked || !head || *head < kBareHead || version != kVersion) return std::nullopt;
  const auto all = Piece(bytes, 0, *size);
  const auto data = all ? From(*all, *head) : std::nullopt;
  return data ? ReadData(*data) : std::nullopt;
}

}  // namespace tallowmere::formats
