// Atom containers: arbitrary bytes as a container, and the exporter's settings for any sound.
#include <algorithm>
#include <cstring>
#include <string>

#include "cli/AtomText.h"
#include "fuzz/Check.h"
#include "quicktime/AIFFExporter.h"
#include "quicktime/AtomContainer.h"
#include "quicktime/FourCharacterCode.h"
#include "support/AtomReader.h"

namespace tallowmere::fuzz {
namespace {

// Any bytes are read to the end or refused. What the strict reader accepts, the lenient one shows
// with a line for each atom, unless it is too deep.
std::size_t CountAtoms(const test::Atom& atom) {
  std::size_t count = 1;
  for (const test::Atom& child : atom.children) count += CountAtoms(child);
  return count;
}

std::size_t DepthOf(const test::Atom& atom) {
  std::size_t deepest = 0;
  for (const test::Atom& child : atom.children) deepest = std::max(deepest, DepthOf(child));
  return deepest + 1;
}

void CheckReading(std::string_view container) {
  const auto text = cli::TextOfAtoms(container);
  const auto root = test::ReadAtomContainer(container);
  if (!root) return;
  constexpr std::size_t kDeepestShown = 16;
  Check(text.has_value() == (DepthOf(*root) <= kDeepestShown));
  if (!text) return;
  const auto lines = std::count(text->begin(), text->end(), '\n');
  Check(static_cast<std::size_t>(lines) == CountAtoms(*root));
}

// Returns the lowest bytes of a number, the most significant first.
std::string Bytes(UInt32 number, int count) {
  std::string bytes;
  while (count-- > 0) bytes.push_back(static_cast<char>(number >> (8 * count)));
  return bytes;
}

// The settings for an accepted sound contain that sound. No shorter beginning is a container.
void CheckExport(const SoundDescription& sound, std::size_t cut) {
  quicktime::AIFFExporter exporter;
  const OSErr result = exporter.SetSound(sound);
  Check(result == noErr || result == paramErr || result == badFormat);
  Check(exporter.HasSound() == (result == noErr));
  if (result != noErr) return;
  const std::string settings = exporter.Settings();
  const auto root = test::ReadAtomContainer(settings);
  Check(root == test::SettingsOf(Bytes(sound.dataFormat, 4), sound.sampleRate,
                                 static_cast<UInt16>(sound.sampleSize),
                                 static_cast<UInt16>(sound.numChannels)));
  CheckReading(settings);
  const std::string_view beginning = std::string_view(settings).substr(0, cut % settings.size());
  Check(!test::ReadAtomContainer(beginning));
}

// A tree of four atoms with arbitrary numbers is read back as it was written.
void CheckWriting(Input& input) {
  const auto word = static_cast<UInt32>(input.TakeByte() << 24 | input.TakeByte());
  const auto half = static_cast<UInt16>(input.TakeByte() << 8 | input.TakeByte());
  quicktime::AtomContainer container;
  const std::size_t root = container.Open(quicktime::FourCharacterCode("sean"), 2);
  container.AddLeaf(quicktime::FourCharacterCode("leaf"), word);
  const std::size_t fold = container.Open(quicktime::FourCharacterCode("fold"), 1);
  container.AddLeaf(quicktime::FourCharacterCode("leaf"), half);
  container.Close(fold);
  container.Close(root);
  const test::Atom wordLeaf{"leaf", 1, {}, Bytes(word, 4)};
  const test::Atom halfLeaf{"leaf", 1, {}, Bytes(half, 2)};
  const test::Atom folder{"fold", 1, {halfLeaf}, ""};
  Check(test::ReadAtomContainer(container.Take()) == test::Atom{"sean", 1, {wordLeaf, folder}, ""});
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: a kind, then a container, the fields of a sound, or numbers for atoms.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  Input input(data, size);
  switch (input.TakeByte() % 3) {
    case 0:
      CheckReading(input.Rest());
      break;
    case 1: {
      const std::size_t cut = input.TakeByte();
      SoundDescription sound = {};
      const std::string_view fields = input.Rest();
      std::memcpy(&sound, fields.data(), std::min(fields.size(), sizeof sound));
      CheckExport(sound, cut);
      break;
    }
    default:
      CheckWriting(input);
  }
  return 0;
}
