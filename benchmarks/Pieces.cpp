// Pieces of the service in one process, by Google Benchmark: where the time of a request goes.
#include <CFileRef.h>
#include <CoreServices/CoreServices.h>
#include <LegacyHFSBridge.h>
#include <benchmark/benchmark.h>
#include <fcntl.h>

#include <fstream>
#include <sstream>
#include <string>

#include "files/Catalog.h"
#include "files/HFSNames.h"
#include "files/MountInfo.h"
#include "files/MountTable.h"
#include "files/PlaceMemory.h"
#include "support/TemporaryFolder.h"

namespace {

using namespace tallowmere;
using benchmark::DoNotOptimize;
using benchmark::State;

void PlainNameToHFS(State& state) {
  for ([[maybe_unused]] auto _ : state) DoNotOptimize(files::PlainHFSName("Mix 1 (final).aif", 63));
}
BENCHMARK(PlainNameToHFS);

void AccentedNameToHFS(State& state) {
  for ([[maybe_unused]] auto _ : state) DoNotOptimize(files::PlainHFSName("Été à Genève.aif", 63));
}
BENCHMARK(AccentedNameToHFS);

void HFSNameToSpelledNames(State& state) {
  for ([[maybe_unused]] auto _ : state) DoNotOptimize(files::SpellHFSName("Mix 1 (final).aif"));
}
BENCHMARK(HFSNameToSpelledNames);

void ParseTheMountTable(State& state) {
  std::ostringstream text;
  text << std::ifstream("/proc/self/mountinfo").rdbuf();
  for ([[maybe_unused]] auto _ : state) DoNotOptimize(files::ParseMountInfo(text.str()));
}
BENCHMARK(ParseTheMountTable);

void AskTheMountTable(State& state) {
  for ([[maybe_unused]] auto _ : state)
    DoNotOptimize(files::MountTable::OfThisProcess().WithNumber(0));
}
BENCHMARK(AskTheMountTable);

void RememberAPlace(State& state) {
  const std::size_t places = static_cast<std::size_t>(state.range(0));
  files::PlaceMemory memory(places * 256);
  files::ItemReference item{};
  for ([[maybe_unused]] auto _ : state) {
    item.inode = (item.inode + 1) % (2 * places);
    memory.Remember(item, "/home/ann/Music/1994/Mixes");
  }
}
BENCHMARK(RememberAPlace)->Arg(10)->Arg(1000)->Arg(100'000);

void LookAtAPlace(State& state) {
  const test::TemporaryFolder folder;
  const std::string path = folder.MakeFile("Mix 1.aif");
  for ([[maybe_unused]] auto _ : state) DoNotOptimize(files::PlaceAt(path));
}
BENCHMARK(LookAtAPlace);

void RecordOfAPath(State& state) {
  const test::TemporaryFolder folder;
  const std::string path = folder.MakeFile("Mix 1.aif");
  for ([[maybe_unused]] auto _ : state) {
    const CFileRef item(path.c_str(), true);
    FSSpec spec;
    DoNotOptimize(CFileUtilGetDeprecatedFSSpecThroughIPC(item, &spec));
  }
}
BENCHMARK(RecordOfAPath);

void PathOfARecord(State& state) {
  const test::TemporaryFolder folder;
  const std::string path = folder.MakeFile("Mix 1.aif");
  FSSpec spec;
  CFileUtilGetDeprecatedFSSpecThroughIPC(CFileRef(path.c_str(), true), &spec);
  for ([[maybe_unused]] auto _ : state) {
    CFileRef item;
    DoNotOptimize(CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(&item, &spec, false, false));
  }
}
BENCHMARK(PathOfARecord);

void FullPathOfAPath(State& state) {
  const test::TemporaryFolder folder;
  const std::string path = folder.MakeFile("Mix 1.aif");
  char full[1024];
  for ([[maybe_unused]] auto _ : state) {
    CFileRef item;
    item.Set(path.c_str(), false);
    DoNotOptimize(CFileUtilMakeFullPath(item, full, sizeof full, 1));
  }
}
BENCHMARK(FullPathOfAPath);

}  // namespace

BENCHMARK_MAIN();
