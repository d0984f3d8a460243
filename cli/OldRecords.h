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

// A hint that a record which leads nowhere is of the other byte order. Nullopt when nothing says
// so, and for a record that is text. The other order is likely where
//
//   - its volume's number is negative there, as all are, and here positive or no volume's
//   - its volume is told, and the parent id has more than 24 bits here and fewer there: ids of old
//     volumes count up from 16
std::optional<std::string> HintAtOtherOrder(const std::string& text, std::endian order,
                                            RecordVolume volume);

}  // namespace tallowmere::cli
