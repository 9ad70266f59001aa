#ifndef ZULMETADATA_C_H
#define ZULMETADATA_C_H

/*
 * Recordings for programs that are not written in C++. The caller passes a function that reads bytes at a position, so
 * that a recording may be a file, a slice of something larger, or anything else.
 *
 *     ZulmRecording* recording = zulm_open(readAt, &file, size, "Recording.mp4");
 *     if (!recording)
 *         return complain(zulm_last_error());
 *     ZulmEntries* entries = zulm_read_entries(recording, "cursorLocation");
 *     for (size_t i = 0; entries && i < zulm_entry_count(entries); ++i)
 *         move(zulm_entry_times(entries)[i], ((const int32_t*)zulm_column(entries, 0)->values)[i]);
 *     zulm_free_entries(entries);
 *     zulm_close(recording);
 *
 * No exception leaves these functions. Those that return a pointer return null if they fail, and `zulm_last_error` then
 * returns the reason. One thread at a time may use a recording and what was read from it.
 */

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* NOLINTBEGIN(modernize-use-using): C has no other. */

typedef struct ZulmRecording ZulmRecording;
typedef struct ZulmEntries ZulmEntries;
typedef struct ZulmText ZulmText;

/* Reads `size` bytes from `position` on. Returns the number of bytes read, which is smaller only at the end, or -1 if
   reading failed. */
typedef int64_t (*ZulmReadAt)(void* context, uint64_t position, void* bytes, size_t size);

/* Returns what went wrong in the last call that failed, as a sentence for people. Valid until the next call that
   fails. */
const char* zulm_last_error(void);

/* The first bytes say what the recording is; the extension of `name` counts only if they say nothing. `size` counts all
   bytes. */
ZulmRecording* zulm_open(ZulmReadAt readAt, void* context, uint64_t size, const char* name);
void zulm_close(ZulmRecording* recording);

/* Returns "movie", "RIFF" or "stream". */
const char* zulm_container(const ZulmRecording* recording);

/* Returns seconds; not a number if the recording does not say how long it is. */
double zulm_duration(const ZulmRecording* recording);

typedef struct {
    const char* kind; /* its name, or its identifier if it has none */
    const char* uuid;
    int32_t version;
    uint64_t entries; /* 0 if they cannot be decoded */
    uint64_t bytes;   /* that the file declares, header included */
    uint64_t offset;  /* of its header in the file */
    double first;     /* seconds, of the first and the last entry with a finite time; not a number without any */
    double last;
    int32_t isKnown; /* whether its entries can be decoded */
} ZulmStream;

size_t zulm_stream_count(const ZulmRecording* recording);
const ZulmStream* zulm_stream(const ZulmRecording* recording, size_t index);

/* Streams that the file holds and no reader finds, in the order of the file: a later stream of the same kind hides
   them, or they follow damage. All other functions are about the streams that readers find. */
size_t zulm_hidden_count(const ZulmRecording* recording);
const ZulmStream* zulm_hidden(const ZulmRecording* recording, size_t index);

typedef enum {
    ZulmInt32 = 0,  /* int32_t */
    ZulmUInt64 = 1, /* uint64_t */
    ZulmReal = 2,   /* double */
    ZulmTexts = 3,  /* uint32_t, the number of a text among the distinct ones, in UTF-8 */
    ZulmBytes = 4,  /* the same for bytes, or ZulmNothing */
    ZulmUInt32 = 5  /* uint32_t */
} ZulmColumnType;

#define ZulmNothing UINT32_MAX

typedef struct {
    const char* name;
    ZulmColumnType type;
    const void* values; /* one per entry */

    /* The distinct texts or bytes: number i goes from ends[i - 1], or 0, to ends[i]. */
    const char* pool;
    const uint64_t* ends;
    size_t distinct;
} ZulmColumn;

/* Return the whole entries of a stream, which is chosen by its kind or its identifier, or by its number. */
ZulmEntries* zulm_read_entries(ZulmRecording* recording, const char* kind);
ZulmEntries* zulm_read_hidden(ZulmRecording* recording, size_t index);

/* Returns what holds at each of these times, in seconds. The columns are "x" and "y" of the cursor, "cursor_id",
   "hotspot_x", "hotspot_y" and "picture" of what it looks like, "opacity", "buttons" and "modifiers" (names with "+"
   between two, such as "shift+ctrl"), "window_x" to "window_height", "title", "application", "slide_title",
   "slide_text", "slide_comment", "hover_x" to "hover_height", "region_x" to "region_height", "scale" and "cpu". A
   number that is not known is not a number, a text that is not known is ZulmNothing. If `interpolates` is 0, the cursor
   is where the last entry says; otherwise it moves between two entries, but rests while nothing was recorded. */
ZulmEntries* zulm_states(ZulmRecording* recording, const double* times, size_t count, int32_t interpolates);

/* Returns what follows from the recording: "clicks", "captions", "idle", "chapters", "zooms", "cursor_path",
   "cursor_speed", "camera", "activity" or "applications". `parameters` is null or a list such as "least=3". The
   captions have one row for each key: "label" is its text, with a bullet in place of what was typed unless
   "shows_keys=1", or "shows_shortcuts=1" for what was typed with Control, Windows or Command; "is_typed" is 1 if it
   makes words with its neighbours; "first" is the row that begins its caption, and "end" the time until which the
   caption is shown. The activity is one row for the span from "start" up to "end", and the applications are those that
   were on top in it. */
ZulmEntries* zulm_insight(ZulmRecording* recording, const char* name, const char* parameters);

/* Returns the streams for a movie that was cut by an edit list: one row for each, with "kind" and all its "bytes".
   "is_copied" is 1 if the bytes are those of the recording; otherwise "moved", "carried", "added" and "left_out" count
   its entries. `edits` is the text of a list in any form that the library reads. `name` is null or the file that it
   comes from: its extension says the form if the text does not. `frameRate` is null or such as "30000/1001", for lists
   that count frames. */
ZulmEntries* zulm_retime(ZulmRecording* recording, const char* edits, const char* name, const char* frameRate);

void zulm_free_entries(ZulmEntries* entries);

size_t zulm_entry_count(const ZulmEntries* entries);
const double* zulm_entry_times(const ZulmEntries* entries); /* seconds */
size_t zulm_column_count(const ZulmEntries* entries);
const ZulmColumn* zulm_column(const ZulmEntries* entries, size_t index);

/* Return sentences about what is missing in states, insights and retimed streams because of the file. */
size_t zulm_warning_count(const ZulmEntries* entries);
const char* zulm_warning(const ZulmEntries* entries, size_t index);

/* What the tool prints as JSON: the file's object of `zulm info` and of `zulm verify`, and all that `zulm dump` prints.
   `kinds` is a list separated by commas, or null for every stream. */
ZulmText* zulm_info(ZulmRecording* recording);
ZulmText* zulm_verify(ZulmRecording* recording);
ZulmText* zulm_dump(ZulmRecording* recording, const char* kinds);

const char* zulm_text_bytes(const ZulmText* text);
size_t zulm_text_size(const ZulmText* text);
void zulm_free_text(ZulmText* text);

/* NOLINTEND(modernize-use-using) */

#ifdef __cplusplus
}
#endif

#endif
