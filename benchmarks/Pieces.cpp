// Pieces of a request in one process, by Google Benchmark: where its time goes, by calls of the
// host and by steps of the service.
#include <CFOwned.h>
#include <CFileRef.h>
#include <CoreServices/CoreServices.h>
#include <LegacyHFSBridge.h>
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "support/TemporaryFolder.h"

namespace {

using namespace tallowmere;
using benchmark::DoNotOptimize;
using benchmark::State;

constexpr const char* kPlainName = "Mix 1 (final).aif";
constexpr const char* kAccentedName = "Été à Genève.aif";

// A new file and its identities on the host.
struct File {
  explicit File(const char* name = kPlainName) : path(folder.MakeFile(name)) {
    if (!CFileRef(path.c_str(), false).GetFSRef(&reference) ||
        FSGetCatalogInfo(&reference, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr) != noErr) {
      std::abort();
    }
  }

  test::TemporaryFolder folder;
  std::string path;
  FSRef reference{};
  FSSpec spec{};
};

// --- Calls of the host --------------------------------------------------------------------------

void VolumeOfANumber(State& state) {
  const File file;
  for ([[maybe_unused]] auto _ : state) {
    HParamBlockRec volume{};
    volume.volumeParam.ioVRefNum = file.spec.vRefNum;
    DoNotOptimize(PBHGetVInfoSync(&volume));
  }
}
BENCHMARK(VolumeOfANumber);

void AllVolumes(State& state) {
  HParamBlockRec volume{};
  for ([[maybe_unused]] auto _ : state) {
    volume = {};
    do ++volume.volumeParam.ioVolIndex;
    while (PBHGetVInfoSync(&volume) == noErr);
  }
  state.counters["volumes"] = volume.volumeParam.ioVolIndex - 1;
}
BENCHMARK(AllVolumes);

// Asks for files in turn; with more than some thousands of them, the places of the first are
// forgotten meanwhile.
void ReferenceOfAPath(State& state) {
  const test::TemporaryFolder folder;
  std::vector<std::string> paths;
  for (int64_t i = 0; i < state.range(0); ++i) paths.push_back(folder.MakeFile(std::to_string(i)));
  std::size_t next = 0;
  for ([[maybe_unused]] auto _ : state) {
    FSRef reference;
    DoNotOptimize(CFileRef(paths[next].c_str(), false).GetFSRef(&reference));
    next = (next + 1) % paths.size();
  }
}
BENCHMARK(ReferenceOfAPath)->Arg(1)->Arg(1000)->Arg(10'000);

void PathOfAReference(State& state) {
  const File file;
  for ([[maybe_unused]] auto _ : state) {
    DoNotOptimize(CFOwned<CFURLRef>(CFURLCreateFromFSRef(nullptr, &file.reference)));
  }
}
BENCHMARK(PathOfAReference);

void SpecOfAReference(State& state, const char* name) {
  const File file(name);
  for ([[maybe_unused]] auto _ : state) {
    FSSpec spec;
    DoNotOptimize(
        FSGetCatalogInfo(&file.reference, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr));
  }
}
BENCHMARK_CAPTURE(SpecOfAReference, plain_name, kPlainName);
BENCHMARK_CAPTURE(SpecOfAReference, accented_name, kAccentedName);

void ReferenceOfASpec(State& state, const char* name) {
  const File file(name);
  for ([[maybe_unused]] auto _ : state) {
    FSRef reference;
    DoNotOptimize(FSpMakeFSRef(&file.spec, &reference));
  }
}
BENCHMARK_CAPTURE(ReferenceOfASpec, plain_name, kPlainName);
BENCHMARK_CAPTURE(ReferenceOfASpec, accented_name, kAccentedName);

void ReferenceOfANodeID(State& state) {
  const File file;
  for ([[maybe_unused]] auto _ : state) {
    FSRef reference;
    DoNotOptimize(
        FSResolveNodeID(file.spec.vRefNum, static_cast<UInt32>(file.spec.parID), &reference));
  }
}
BENCHMARK(ReferenceOfANodeID);

void ParentOfAFolder(State& state) {
  const File file;
  for ([[maybe_unused]] auto _ : state) {
    Str255 name;
    CInfoPBRec folder{};
    folder.dirInfo = {name, file.spec.vRefNum, -1, file.spec.parID, 0};
    DoNotOptimize(PBGetCatInfoSync(&folder));
  }
}
BENCHMARK(ParentOfAFolder);

// --- Steps of the service -----------------------------------------------------------------------

void RecordOfAPath(State& state) {
  const File file;
  for ([[maybe_unused]] auto _ : state) {
    const CFileRef item(file.path.c_str(), true);
    FSSpec spec;
    DoNotOptimize(CFileUtilGetDeprecatedFSSpecThroughIPC(item, &spec));
  }
}
BENCHMARK(RecordOfAPath);

void PathOfARecord(State& state) {
  const File file;
  for ([[maybe_unused]] auto _ : state) {
    CFileRef item;
    DoNotOptimize(
        CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(&item, &file.spec, false, false));
  }
}
BENCHMARK(PathOfARecord);

void FullPathOfAPath(State& state) {
  const File file;
  char full[1024];
  for ([[maybe_unused]] auto _ : state) {
    CFileRef item;
    item.Set(file.path.c_str(), false);
    DoNotOptimize(CFileUtilMakeFullPath(item, full, sizeof full, 1));
  }
}
BENCHMARK(FullPathOfAPath);

}  // namespace

BENCHMARK_MAIN();
