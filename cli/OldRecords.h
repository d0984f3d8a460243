// Records as other machines stored them: in another byte order, packed in files.
#pragma once

#include <tallowmere/Result.h>
#include <tallowmere/Types.h>

#include <bit>
#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace tallowmere::cli {

struct RecordForm {
  std::endian order = std::endian::native;
  bool isPacked = false;    // items are files of packed records
  std::size_t skip = 0;     // bytes in front of the first record of a file
  std::size_t stride = 70;  // from the beginning of one record to that of the next, at least 70
};

// A record in a file, and where it is there.
struct PackedRecord {
  std::string hex;     // its 70 bytes
  std::string file;    // "-" for standard input
  std::size_t number;  // from 1
  std::size_t byte;    // of the file, at which it begins
};

// The records in files, in the order of the files. Fails for a file that cannot be read, and for
// one that does not end with a record.
Result<std::vector<PackedRecord>> ReadPackedRecords(const std::vector<std::string>& files,
                                                    const RecordForm& form);

// What is known of the volume that a record is of.
enum class RecordVolume {
  kMounted,  // its number is that of a volume here
  kUnknown,  // there is no volume for its number
  kTold,     // a person has told it, whatever its number
};

// What a record that leads nowhere would be in the other byte order, where it looks as if that were
// its own. Nullopt where it does not, and for a record that is text. Numbers of volumes are
// negative, so one that is so in the other order alone tells it, or one of no volume. Where the
// volume is told, the parent id does as well: ids of old volumes count from 16 on, and one above
// 24 bits is below that in the other order.
std::optional<std::string> HintAtOtherOrder(const std::string& text, std::endian order,
                                            RecordVolume volume);

}  // namespace tallowmere::cli
