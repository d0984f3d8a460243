/* A C program that converts and asks by the shared library: CInterfaceTest SERVICE FOLDER, an empty
 * folder. Ends with status 0 when all is right. */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <tallowmere.h>
#include <tallowmere/Version.h>

static int failures = 0;

#define EXPECT(condition)                                                              \
  do {                                                                                 \
    if (!(condition)) {                                                                \
      ++failures;                                                                      \
      fprintf(stderr, "line %d: %s (%s)\n", __LINE__, #condition, tallowmere_error()); \
    }                                                                                  \
  } while (0)

struct text {
  char* bytes;
  size_t length;
};

static int is(struct text* answer, const char* expected) {
  const int same = answer->length == strlen(expected) &&
                   strcmp(answer->bytes == NULL ? "" : answer->bytes, expected) == 0;
  tallowmere_free(answer->bytes);
  answer->bytes = NULL;
  answer->length = 0;
  return same;
}

static void convert(tallowmere_client* client, const char* path, const char* folder) {
  tallowmere_record record;
  struct text text = {NULL, 0};
  const size_t length = strlen(path);
  EXPECT(tallowmere_record_of(client, path, length, &record) == TALLOWMERE_FOUND);
  EXPECT(strcmp(record.name, "a/b") == 0 && record.name_length == 3);
  EXPECT(tallowmere_path_of(client, &record, 0, &text.bytes, &text.length) == TALLOWMERE_FOUND);
  EXPECT(is(&text, path));
  EXPECT(tallowmere_hfs_name_of(client, path, length, &text.bytes, &text.length) ==
         TALLOWMERE_FOUND);
  EXPECT(is(&text, "a/b"));
  EXPECT(tallowmere_path_in_folder(client, folder, strlen(folder), "a/b", 3, &text.bytes,
                                   &text.length) == TALLOWMERE_FOUND);
  EXPECT(is(&text, path));
  struct text hfs_path = {NULL, 0};
  EXPECT(tallowmere_hfs_path_of(client, path, length, &hfs_path.bytes, &hfs_path.length) ==
         TALLOWMERE_FOUND);
  EXPECT(tallowmere_path_of_hfs_path(client, hfs_path.bytes, hfs_path.length, &text.bytes,
                                     &text.length) == TALLOWMERE_FOUND);
  EXPECT(is(&text, path));
  tallowmere_free(hfs_path.bytes);
}

static void ask(tallowmere_client* client, const char* path, const char* folder) {
  tallowmere_record record;
  struct text text = {NULL, 0};
  const size_t length = strlen(path);
  EXPECT(tallowmere_get_fsspec(client, path, length, &record) == TALLOWMERE_FOUND);
  EXPECT(tallowmere_set_file_ref_from_fsspec(client, &record, 1, &text.bytes, &text.length) ==
         TALLOWMERE_FOUND);
  EXPECT(is(&text, path));
  EXPECT(tallowmere_set_file_ref_from_fsspec_data(client, &record, &text.bytes, &text.length) ==
         TALLOWMERE_FOUND);
  EXPECT(is(&text, path));
  EXPECT(tallowmere_get_hfs_name(client, path, length, &text.bytes, &text.length) ==
         TALLOWMERE_FOUND);
  EXPECT(is(&text, "a/b"));
  EXPECT(tallowmere_add_hfs_name(client, folder, strlen(folder), "a/b", 3, &text.bytes,
                                 &text.length) == TALLOWMERE_FOUND);
  EXPECT(is(&text, path));
  EXPECT(tallowmere_get_hfs_volume_name(client, 0, &text.bytes, &text.length) == TALLOWMERE_FOUND);
  int16_t volume = 0;
  EXPECT(tallowmere_get_vol_refnum_by_hfs_name(client, text.bytes, text.length, &volume) ==
         TALLOWMERE_FOUND);
  EXPECT(volume < 0);
  tallowmere_free(text.bytes);
  EXPECT(tallowmere_make_full_path(client, "/", 1, &text.bytes, &text.length) == TALLOWMERE_FOUND);
  EXPECT(text.length > 1 && text.bytes[text.length - 1] == ':');
  struct text root = {NULL, 0};
  EXPECT(tallowmere_make_file_ref_from_path(client, text.bytes, text.length, &root.bytes,
                                            &root.length) == TALLOWMERE_FOUND);
  EXPECT(is(&root, "/"));
  tallowmere_free(text.bytes);
}

static void ask_for_settings(tallowmere_client* client) {
  struct text settings = {NULL, 0};
  int16_t result = 1;
  EXPECT(tallowmere_get_aiff_export_settings(client, 44100u << 16, 16, 2, 0x74776F73, &result,
                                             &settings.bytes,
                                             &settings.length) == TALLOWMERE_FOUND);
  EXPECT(result == 0 && settings.length == 144);
  tallowmere_free(settings.bytes);
  EXPECT(tallowmere_get_aiff_export_settings(client, 44100u << 16, 16, 2, 0x6D703461, &result,
                                             &settings.bytes,
                                             &settings.length) == TALLOWMERE_FOUND);
  EXPECT(result == -206 && settings.length == 0);
  tallowmere_free(settings.bytes);
}

static void see_errors(tallowmere_client* client) {
  char untouched = 'u';
  struct text text = {&untouched, 42};
  EXPECT(tallowmere_hfs_path_of(client, "/missing/x", 10, &text.bytes, &text.length) ==
         TALLOWMERE_NOTHING);
  EXPECT(strcmp(tallowmere_error(), "there is no folder \"/missing\"") == 0);
  EXPECT(text.bytes == &untouched && text.length == 42);
  EXPECT(tallowmere_get_hfs_name(client, "/missing/x", 10, &text.bytes, &text.length) ==
         TALLOWMERE_NOTHING);
  EXPECT(text.bytes == &untouched && text.length == 42);
  tallowmere_client* failing = tallowmere_open("/bin/true", 1000);
  tallowmere_record record;
  EXPECT(tallowmere_record_of(failing, "/", 1, &record) == TALLOWMERE_SERVICE_FAILED);
  EXPECT(strcmp(tallowmere_error(), "the service ended before it answered") == 0);
  tallowmere_close(failing);
  tallowmere_close(NULL);
}

static void convert_values(void) {
  tallowmere_record record;
  tallowmere_record same;
  struct text text = {NULL, 0};
  unsigned char bytes[TALLOWMERE_RECORD_SIZE];
  EXPECT(tallowmere_record_of_text("-27:19:a:b", 10, &record) == TALLOWMERE_FOUND);
  EXPECT(record.volume == -27 && record.parent == 19);
  EXPECT(tallowmere_record_of_text("none", 4, &record) == TALLOWMERE_INVALID);
  EXPECT(tallowmere_encode_record(&record, bytes) == TALLOWMERE_FOUND);
  EXPECT(tallowmere_decode_record(bytes, &same) == TALLOWMERE_FOUND);
  EXPECT(memcmp(&record, &same, sizeof record) == 0);
  EXPECT(tallowmere_text_of_record(&same, &text.bytes, &text.length) == TALLOWMERE_FOUND);
  EXPECT(is(&text, "-27:19:a:b"));
  record.name_length = 64;
  EXPECT(tallowmere_encode_record(&record, bytes) == TALLOWMERE_INVALID);
  bytes[6] = 64;
  EXPECT(tallowmere_decode_record(bytes, &same) == TALLOWMERE_INVALID);
  EXPECT(tallowmere_utf8_of_hfs_name("\x8E", 1, &text.bytes, &text.length) == TALLOWMERE_FOUND);
  EXPECT(is(&text, "\xC3\xA9"));
  EXPECT(tallowmere_hfs_name_of_utf8("\xC3\xA9", 2, &text.bytes, &text.length) == TALLOWMERE_FOUND);
  EXPECT(is(&text, "\x8E"));
  EXPECT(tallowmere_hfs_name_of_utf8("\xFF", 1, &text.bytes, &text.length) == TALLOWMERE_INVALID);
  EXPECT(strcmp(tallowmere_version(), TALLOWMERE_VERSION) == 0);
  EXPECT(strcmp(tallowmere_outcome_name(TALLOWMERE_NOT_A_VOLUME), "not-a-volume") == 0);
  EXPECT(strcmp(tallowmere_outcome_name(8), "") == 0);
  EXPECT(strcmp(tallowmere_outcome_name(-1), "") == 0);
}

int main(int count, char** arguments) {
  if (count != 3) return 2;
  const char* const folder = arguments[2];
  char path[4096];
  snprintf(path, sizeof path, "%s/a:b", folder);
  FILE* file = fopen(path, "w");
  if (file == NULL) return 2;
  fclose(file);
  tallowmere_client* client = tallowmere_open(arguments[1], 0);
  convert(client, path, folder);
  ask(client, path, folder);
  ask_for_settings(client);
  see_errors(client);
  convert_values();
  tallowmere_close(client);
  return failures == 0 ? 0 : 1;
}
