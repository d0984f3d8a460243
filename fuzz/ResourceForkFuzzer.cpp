// Resource forks: arbitrary bytes.
#include <algorithm>

#include "formats/Bytes.h"
#include "formats/ResourceFork.h"
#include "fuzz/Check.h"
#include "fuzz/Within.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere;
  const std::string_view fork = fuzz::Input(data, size).Rest();
  const auto resources = formats::ResourcesOfType(fork, formats::Code("alis"));
  if (!resources) return 0;
  for (const auto& resource : *resources) {
    if (resource.data) fuzz::CheckPiece(*resource.data, fork);
  }
  fuzz::Check(resources->size() * 12 <= fork.size());
  if (resources->empty()) return 0;
  const auto& first = formats::FirstByID(*resources);
  fuzz::Check(first.id == 0 ||
              std::all_of(resources->begin(), resources->end(), [&](const auto& other) {
                return other.id != 0 && other.id >= first.id;
              }));
  return 0;
}
