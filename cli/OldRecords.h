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

// The records in files, "-" being standard input, each as hexadecimal digits in the order of the
// file. Fails for a file that cannot be read, and for one that does not end with a record.
Result<std::vector<std::string>> ReadPackedRecords(const std::vector<std::string>& files,
                                                   const RecordForm& form);

// What the volume reference number of a record would be in the other byte order, where it looks as
// if that were the one: numbers of volumes are negative. Nullopt for a record that is text.
// `isKnown`: whether a volume has the number.
std::optional<std::string> HintAtOtherOrder(const std::string& text, std::endian order,
                                            bool isKnown);

}  // namespace tallowmere::cli
