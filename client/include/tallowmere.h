/* The client for C, and for languages that call C: the library tallowmere_c.
 *
 * Conversions resolve the way to an item, look once whether it exists, and refuse what would not
 * lead back; requests send what they are given and hand over what the service answers. Both are
 * told in full in <tallowmere/Client.h>, <tallowmere/Conversion.h> and <tallowmere/Request.h>,
 * under the same names.
 *
 * Text. What is given is bytes and their number, needs no NUL, and is only read. What is answered
 * is made by malloc(3), ends in a NUL that does not count, and belongs to the caller, who frees it
 * with tallowmere_free. Paths are the kernel's bytes; HFS names and HFS paths are Mac Roman.
 *
 * Outcomes. Answers are given for TALLOWMERE_FOUND and TALLOWMERE_NEW alone; with any other outcome
 * nothing that an answer goes to is touched, and tallowmere_error tells the reason. Where a request
 * has an answer, the outcome is TALLOWMERE_FOUND, and TALLOWMERE_NOTHING where the service says
 * that there is none.
 *
 * Threads may share a client; see <tallowmere/Client.h>. No exception leaves a function. Pointers
 * are not null unless that is stated.
 */
#ifndef TALLOWMERE_H
#define TALLOWMERE_H

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#define TALLOWMERE_API __attribute__((visibility("default")))

/* This is C, which has no other way. NOLINTBEGIN(modernize-use-using) */

typedef int32_t tallowmere_outcome;
enum {
  TALLOWMERE_FOUND = 0,          /* the item exists */
  TALLOWMERE_NEW = 1,            /* its folder exists, it does not */
  TALLOWMERE_NOTHING = 2,        /* neither is there */
  TALLOWMERE_AMBIGUOUS = 3,      /* more than one item could be meant */
  TALLOWMERE_REFUSED = 4,        /* the system does not let this process look */
  TALLOWMERE_NOT_A_VOLUME = 5,   /* it is on no volume; no volume has this number or name */
  TALLOWMERE_INVALID = 6,        /* no question can be made of it */
  TALLOWMERE_SERVICE_FAILED = 7, /* the service gave no answer, or memory is short */
};

enum {
  TALLOWMERE_RECORD_SIZE = 70, /* bytes of a record as the protocol and old programs have it */
  TALLOWMERE_MOST_NAME = 255   /* bytes of a name below; a record of an item has at most 63 */
};

/* An item, identified by its volume, the id of its parent folder and its HFS name. */
typedef struct tallowmere_record {
  int16_t volume;
  uint8_t name_length;
  uint8_t reserved; /* zero */
  int32_t parent;
  char name[TALLOWMERE_MOST_NAME + 1]; /* a NUL behind the name */
} tallowmere_record;

typedef struct tallowmere_client tallowmere_client;

/* The version of the library, such as "0.1.0". Static. */
TALLOWMERE_API const char* tallowmere_version(void);

/* "found", "new" and so on; "" for what is no outcome. Static. */
TALLOWMERE_API const char* tallowmere_outcome_name(tallowmere_outcome outcome);

/* Why the latest call of this thread that did not succeed did not. Never null; stays until the next
 * such call of this thread. */
TALLOWMERE_API const char* tallowmere_error(void);

TALLOWMERE_API void tallowmere_free(void* text); /* null is allowed */

/* A client. `service` is the path of the service's program, or null: "tallowmere" beside this
 * process's own program, else on PATH. The deadline is that of one request; 0 stands for ten
 * seconds. Starts nothing. Null when memory is short. */
TALLOWMERE_API tallowmere_client* tallowmere_open(const char* service,
                                                  uint32_t deadline_milliseconds);

/* Ends its service. Null is allowed. */
TALLOWMERE_API void tallowmere_close(tallowmere_client* client);

/* Conversions. */

TALLOWMERE_API tallowmere_outcome tallowmere_record_of(tallowmere_client* client, const char* path,
                                                       size_t path_length,
                                                       tallowmere_record* record);
TALLOWMERE_API tallowmere_outcome tallowmere_path_of(tallowmere_client* client,
                                                     const tallowmere_record* record,
                                                     int search_other_volumes, char** path,
                                                     size_t* path_length);
TALLOWMERE_API tallowmere_outcome tallowmere_hfs_path_of(tallowmere_client* client,
                                                         const char* path, size_t path_length,
                                                         char** hfs_path, size_t* hfs_path_length);
TALLOWMERE_API tallowmere_outcome tallowmere_path_of_hfs_path(tallowmere_client* client,
                                                              const char* hfs_path,
                                                              size_t hfs_path_length, char** path,
                                                              size_t* path_length);
TALLOWMERE_API tallowmere_outcome tallowmere_hfs_name_of(tallowmere_client* client,
                                                         const char* path, size_t path_length,
                                                         char** hfs_name, size_t* hfs_name_length);
TALLOWMERE_API tallowmere_outcome tallowmere_path_in_folder(
    tallowmere_client* client, const char* folder, size_t folder_length, const char* hfs_name,
    size_t hfs_name_length, char** path, size_t* path_length);

/* Requests, the raw way. */

TALLOWMERE_API tallowmere_outcome tallowmere_make_full_path(tallowmere_client* client,
                                                            const char* path, size_t path_length,
                                                            char** full_path,
                                                            size_t* full_path_length);
TALLOWMERE_API tallowmere_outcome tallowmere_make_file_ref_from_path(tallowmere_client* client,
                                                                     const char* hfs_path,
                                                                     size_t hfs_path_length,
                                                                     char** path,
                                                                     size_t* path_length);
TALLOWMERE_API tallowmere_outcome tallowmere_get_vol_refnum_by_hfs_name(tallowmere_client* client,
                                                                        const char* name,
                                                                        size_t name_length,
                                                                        int16_t* volume);
TALLOWMERE_API tallowmere_outcome tallowmere_get_hfs_volume_name(tallowmere_client* client,
                                                                 int16_t volume, char** name,
                                                                 size_t* name_length);
TALLOWMERE_API tallowmere_outcome tallowmere_get_hfs_name(tallowmere_client* client,
                                                          const char* path, size_t path_length,
                                                          char** name, size_t* name_length);
TALLOWMERE_API tallowmere_outcome tallowmere_add_hfs_name(tallowmere_client* client,
                                                          const char* folder, size_t folder_length,
                                                          const char* name, size_t name_length,
                                                          char** path, size_t* path_length);
TALLOWMERE_API tallowmere_outcome tallowmere_get_fsspec(tallowmere_client* client, const char* path,
                                                        size_t path_length,
                                                        tallowmere_record* record);
TALLOWMERE_API tallowmere_outcome tallowmere_set_file_ref_from_fsspec_data(
    tallowmere_client* client, const tallowmere_record* record, char** path, size_t* path_length);
TALLOWMERE_API tallowmere_outcome
tallowmere_set_file_ref_from_fsspec(tallowmere_client* client, const tallowmere_record* record,
                                    int search_other_volumes, char** path, size_t* path_length);
/* The rate is in hertz times 65536. The settings are bytes, with no meaning as text.
 * TALLOWMERE_FOUND also where the exporter refuses: `result` is then its result code, and there are
 * no settings. */
TALLOWMERE_API tallowmere_outcome tallowmere_get_aiff_export_settings(
    tallowmere_client* client, uint32_t rate, uint16_t sample_size, uint8_t channels,
    uint32_t format, int16_t* result, char** settings, size_t* settings_length);

/* Records and texts, which ask nobody. TALLOWMERE_INVALID where there is no such record or text. */

/* The record in TALLOWMERE_RECORD_SIZE bytes, and back. */
TALLOWMERE_API tallowmere_outcome tallowmere_decode_record(const void* bytes,
                                                           tallowmere_record* record);
TALLOWMERE_API tallowmere_outcome tallowmere_encode_record(const tallowmere_record* record,
                                                           void* bytes);
/* The record as "volume:parent:name", the name in UTF-8, and back. */
TALLOWMERE_API tallowmere_outcome tallowmere_text_of_record(const tallowmere_record* record,
                                                            char** text, size_t* text_length);
TALLOWMERE_API tallowmere_outcome tallowmere_record_of_text(const char* text, size_t text_length,
                                                            tallowmere_record* record);
/* An HFS name or HFS path as UTF-8, and back. */
TALLOWMERE_API tallowmere_outcome tallowmere_utf8_of_hfs_name(const char* name, size_t name_length,
                                                              char** text, size_t* text_length);
TALLOWMERE_API tallowmere_outcome tallowmere_hfs_name_of_utf8(const char* text, size_t text_length,
                                                              char** name, size_t* name_length);

/* NOLINTEND(modernize-use-using) */

#ifdef __cplusplus
}
#endif

#endif
