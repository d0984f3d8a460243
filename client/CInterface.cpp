#include <tallowmere.h>
#include <tallowmere/Client.h>
#include <tallowmere/Version.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <new>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "service/Protocol.h"

using tallowmere::Conversion;
using tallowmere::Error;
using tallowmere::FSSpec;
using tallowmere::Outcome;

struct tallowmere_client {
  tallowmere::Client client;
};

namespace {

static_assert(static_cast<int>(Outcome::kFound) == TALLOWMERE_FOUND);
static_assert(static_cast<int>(Outcome::kNew) == TALLOWMERE_NEW);
static_assert(static_cast<int>(Outcome::kNothing) == TALLOWMERE_NOTHING);
static_assert(static_cast<int>(Outcome::kAmbiguous) == TALLOWMERE_AMBIGUOUS);
static_assert(static_cast<int>(Outcome::kRefused) == TALLOWMERE_REFUSED);
static_assert(static_cast<int>(Outcome::kNotAVolume) == TALLOWMERE_NOT_A_VOLUME);
static_assert(static_cast<int>(Outcome::kInvalid) == TALLOWMERE_INVALID);
static_assert(static_cast<int>(Outcome::kServiceFailed) == TALLOWMERE_SERVICE_FAILED);
static_assert(TALLOWMERE_RECORD_SIZE == tallowmere::protocol::kFileSpecSize);
static_assert(TALLOWMERE_MOST_NAME == tallowmere::protocol::kLongestHFSPath);

constexpr const char* kNoMemory = "there is no memory";

std::string& Reason() {
  thread_local std::string reason;
  return reason;
}

tallowmere_outcome Fail(Outcome outcome, std::string reason) {
  Reason() = std::move(reason);
  return static_cast<tallowmere_outcome>(outcome);
}

tallowmere_outcome Fail(const Error& error) {
  return Fail(error.outcome, error.message);
}

// Calls `work`, whose exceptions end here.
template <class Work>
tallowmere_outcome Guarded(Work work) {
  try {
    return work();
  } catch (const std::bad_alloc&) {
    Reason().assign(kNoMemory);  // short enough to need none
  } catch (const std::exception& error) {
    return Fail(Outcome::kServiceFailed, error.what());
  }
  return TALLOWMERE_SERVICE_FAILED;
}

// Where a text goes.
struct TextPlace {
  char** text;
  std::size_t* length;
};

void Store(const std::string& value, TextPlace place) {
  auto* const copy = static_cast<char*>(std::malloc(value.size() + 1));
  if (copy == nullptr) throw std::bad_alloc();
  std::memcpy(copy, value.c_str(), value.size() + 1);
  *place.text = copy;
  *place.length = value.size();
}

void Store(const FSSpec& value, tallowmere_record* place) {
  *place = {};
  place->volume = value.vRefNum;
  place->parent = value.parID;
  place->name_length = static_cast<std::uint8_t>(value.name.size());
  std::copy(value.name.begin(), value.name.end(), place->name);
}

void Store(std::int16_t value, std::int16_t* place) {
  *place = value;
}

FSSpec SpecOf(const tallowmere_record& record) {
  return {record.volume, record.parent, std::string(record.name, record.name_length)};
}

// Keeps the answer that `ask` gets, and gives its outcome.
template <class Place, class Ask>
tallowmere_outcome Convert(Place place, Ask ask) {
  return Guarded([&] {
    const auto answer = ask();
    if (!answer) return Fail(answer.Failure());
    Store(answer->value, place);
    return static_cast<tallowmere_outcome>(answer->outcome);
  });
}

template <class T, class Place>
tallowmere_outcome Keep(const std::optional<T>& answer, Place place, Outcome none,
                        const char* reason) {
  if (!answer) return Fail(none, reason);
  Store(*answer, place);
  return TALLOWMERE_FOUND;
}

// The same for a raw request.
template <class Place, class Ask>
tallowmere_outcome Request(Place place, Ask ask) {
  return Guarded([&] {
    const auto answer = ask();
    if (!answer) return Fail(answer.Failure());
    return Keep(*answer, place, Outcome::kNothing, "the service says that there is none");
  });
}

}  // namespace

const char* tallowmere_version() {
  return TALLOWMERE_VERSION;
}

const char* tallowmere_outcome_name(tallowmere_outcome outcome) {
  if (outcome < TALLOWMERE_FOUND || outcome > TALLOWMERE_SERVICE_FAILED) return "";
  return Name(static_cast<Outcome>(outcome)).data();
}

const char* tallowmere_error() {
  return Reason().c_str();
}

void tallowmere_free(void* text) {
  std::free(text);
}

tallowmere_client* tallowmere_open(const char* service, std::uint32_t deadline_milliseconds) {
  try {
    tallowmere::ClientOptions options;
    if (service != nullptr) options.service = service;
    if (deadline_milliseconds != 0) {
      options.deadline = std::chrono::milliseconds(deadline_milliseconds);
    }
    return new tallowmere_client{tallowmere::Client(std::move(options))};
  } catch (const std::exception&) {
    Reason().assign(kNoMemory);
    return nullptr;
  }
}

void tallowmere_close(tallowmere_client* client) {
  delete client;
}

// --- Conversions ---

tallowmere_outcome tallowmere_record_of(tallowmere_client* client, const char* path,
                                        size_t path_length, tallowmere_record* record) {
  return Convert(record,
                 [&] { return client->client.RecordOf(std::string_view(path, path_length)); });
}

tallowmere_outcome tallowmere_path_of(tallowmere_client* client, const tallowmere_record* record,
                                      int search_other_volumes, char** path, size_t* path_length) {
  return Convert(TextPlace{path, path_length},
                 [&] { return client->client.PathOf(SpecOf(*record), search_other_volumes != 0); });
}

tallowmere_outcome tallowmere_hfs_path_of(tallowmere_client* client, const char* path,
                                          size_t path_length, char** hfs_path,
                                          size_t* hfs_path_length) {
  return Convert(TextPlace{hfs_path, hfs_path_length},
                 [&] { return client->client.HFSPathOf(std::string_view(path, path_length)); });
}

tallowmere_outcome tallowmere_path_of_hfs_path(tallowmere_client* client, const char* hfs_path,
                                               size_t hfs_path_length, char** path,
                                               size_t* path_length) {
  return Convert(TextPlace{path, path_length}, [&] {
    return client->client.PathOfHFSPath({hfs_path, hfs_path_length});
  });
}

tallowmere_outcome tallowmere_hfs_name_of(tallowmere_client* client, const char* path,
                                          size_t path_length, char** hfs_name,
                                          size_t* hfs_name_length) {
  return Convert(TextPlace{hfs_name, hfs_name_length},
                 [&] { return client->client.HFSNameOf(std::string_view(path, path_length)); });
}

tallowmere_outcome tallowmere_path_in_folder(tallowmere_client* client, const char* folder,
                                             size_t folder_length, const char* hfs_name,
                                             size_t hfs_name_length, char** path,
                                             size_t* path_length) {
  return Convert(TextPlace{path, path_length}, [&] {
    return client->client.PathInFolder(std::string_view(folder, folder_length),
                                       {hfs_name, hfs_name_length});
  });
}

// --- Requests ---

tallowmere_outcome tallowmere_make_full_path(tallowmere_client* client, const char* path,
                                             size_t path_length, char** full_path,
                                             size_t* full_path_length) {
  return Guarded([&] {
    const auto answer = client->client.MakeFullPath(std::string_view(path, path_length));
    if (!answer) return Fail(answer.Failure());
    Store(*answer, TextPlace{full_path, full_path_length});
    return tallowmere_outcome{TALLOWMERE_FOUND};
  });
}

tallowmere_outcome tallowmere_make_file_ref_from_path(tallowmere_client* client,
                                                      const char* hfs_path, size_t hfs_path_length,
                                                      char** path, size_t* path_length) {
  return Request(TextPlace{path, path_length}, [&] {
    return client->client.MakeFileRefFromPath({hfs_path, hfs_path_length});
  });
}

tallowmere_outcome tallowmere_get_vol_refnum_by_hfs_name(tallowmere_client* client,
                                                         const char* name, size_t name_length,
                                                         int16_t* volume) {
  return Request(volume, [&] { return client->client.GetVolRefnumByHFSName({name, name_length}); });
}

tallowmere_outcome tallowmere_get_hfs_volume_name(tallowmere_client* client, int16_t volume,
                                                  char** name, size_t* name_length) {
  return Request(TextPlace{name, name_length},
                 [&] { return client->client.GetHFSVolumeName(volume); });
}

tallowmere_outcome tallowmere_get_hfs_name(tallowmere_client* client, const char* path,
                                           size_t path_length, char** name, size_t* name_length) {
  return Request(TextPlace{name, name_length},
                 [&] { return client->client.GetHFSName(std::string_view(path, path_length)); });
}

tallowmere_outcome tallowmere_add_hfs_name(tallowmere_client* client, const char* folder,
                                           size_t folder_length, const char* name,
                                           size_t name_length, char** path, size_t* path_length) {
  return Request(TextPlace{path, path_length}, [&] {
    return client->client.AddHFSName(std::string_view(folder, folder_length), {name, name_length});
  });
}

tallowmere_outcome tallowmere_get_fsspec(tallowmere_client* client, const char* path,
                                         size_t path_length, tallowmere_record* record) {
  return Request(record,
                 [&] { return client->client.GetFSSpec(std::string_view(path, path_length)); });
}

tallowmere_outcome tallowmere_set_file_ref_from_fsspec_data(tallowmere_client* client,
                                                            const tallowmere_record* record,
                                                            char** path, size_t* path_length) {
  return Request(TextPlace{path, path_length},
                 [&] { return client->client.SetFileRefFromFSSpecData(SpecOf(*record)); });
}

tallowmere_outcome tallowmere_set_file_ref_from_fsspec(tallowmere_client* client,
                                                       const tallowmere_record* record,
                                                       int search_other_volumes, char** path,
                                                       size_t* path_length) {
  return Request(TextPlace{path, path_length}, [&] {
    return client->client.SetFileRefFromFSSpec(SpecOf(*record), search_other_volumes != 0);
  });
}

tallowmere_outcome tallowmere_get_aiff_export_settings(tallowmere_client* client, uint32_t rate,
                                                       uint16_t sample_size, uint8_t channels,
                                                       uint32_t format, int16_t* result,
                                                       char** settings, size_t* settings_length) {
  return Guarded([&] {
    const auto answer = client->client.GetAIFFExportSettings({rate, sample_size, channels, format});
    if (!answer) return Fail(answer.Failure());
    Store(answer->bytes, TextPlace{settings, settings_length});
    *result = answer->result;
    return tallowmere_outcome{TALLOWMERE_FOUND};
  });
}

// --- Records and texts ---

tallowmere_outcome tallowmere_decode_record(const void* bytes, tallowmere_record* record) {
  return Guarded([&] {
    const auto spec =
        tallowmere::DecodeFSSpec({static_cast<const char*>(bytes), TALLOWMERE_RECORD_SIZE});
    return Keep(spec, record, Outcome::kInvalid, "a record's name has at most 63 bytes");
  });
}

tallowmere_outcome tallowmere_encode_record(const tallowmere_record* record, void* bytes) {
  return Guarded([&] {
    if (record->name_length > tallowmere::protocol::kLongestSpecName) {
      return Fail(Outcome::kInvalid, "a record's name has at most 63 bytes");
    }
    const std::string encoded = EncodeFSSpec(SpecOf(*record));
    std::memcpy(bytes, encoded.data(), encoded.size());
    return tallowmere_outcome{TALLOWMERE_FOUND};
  });
}

tallowmere_outcome tallowmere_text_of_record(const tallowmere_record* record, char** text,
                                             size_t* text_length) {
  return Guarded([&] {
    Store(TextOfFSSpec(SpecOf(*record)), TextPlace{text, text_length});
    return tallowmere_outcome{TALLOWMERE_FOUND};
  });
}

tallowmere_outcome tallowmere_record_of_text(const char* text, size_t text_length,
                                             tallowmere_record* record) {
  return Guarded([&] {
    return Keep(tallowmere::FSSpecOfText({text, text_length}), record, Outcome::kInvalid,
                "a record is volume:parent:name, the name of at most 63 Mac Roman characters");
  });
}

tallowmere_outcome tallowmere_utf8_of_hfs_name(const char* name, size_t name_length, char** text,
                                               size_t* text_length) {
  return Guarded([&] {
    Store(tallowmere::Utf8OfHFSName({name, name_length}), TextPlace{text, text_length});
    return tallowmere_outcome{TALLOWMERE_FOUND};
  });
}

tallowmere_outcome tallowmere_hfs_name_of_utf8(const char* text, size_t text_length, char** name,
                                               size_t* name_length) {
  return Guarded([&] {
    return Keep(tallowmere::HFSNameOfUtf8({text, text_length}), TextPlace{name, name_length},
                Outcome::kInvalid, "it has a character that HFS names cannot have");
  });
}
