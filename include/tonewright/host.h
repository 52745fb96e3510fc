/*
 * libtonewright_host: what a host in C needs beside the 73 functions of tonewright.h.
 *
 * The library stands in front of libtonewright and works on the same handles: text in other encodings, a log
 * as a callback, the reason of a failure, the properties of a file, the capabilities of a target, sources
 * made from memory or from callbacks, reading samples, sound devices, callbacks with user data, all fields of
 * a tag. Unless a function says otherwise, it needs the started library (TONEWRIGHT_InitStartup) and its
 * handles must be destroyed before TONEWRIGHT_DeInitAll.
 *
 * Text is UTF-8 here, except for URIs, which are UTF-16 as in tonewright.h. Paths are bytes and need not be
 * UTF-8. Pointers inside a record that a function fills stay valid as long as the function says; other text
 * that a function returns belongs to the caller and is released by TONEWRIGHT_Host_Free.
 *
 * Records start with their own size, which the caller sets (sizeof), so that a host compiled against an older
 * header still works: fields beyond that size are not written.
 *
 * Failures. No C++ exception leaves a function. Functions with a status return 1 on success and 0 on failure,
 * unless they say otherwise, and TONEWRIGHT_Host_GetLastFailure returns the reason.
 *
 * Threads. Any thread may call; one thread at a time for one object, unless a function says otherwise. A
 * callback must not throw and must not unwind (longjmp) through the library.
 */
#ifndef TONEWRIGHT_HOST_H
#define TONEWRIGHT_HOST_H

#include <tonewright/tonewright.h>

#ifdef __cplusplus
extern "C" {
#endif

/* --- Text ---------------------------------------------------------------------------------------- */

/* Releases memory that a function of this library returned. Null is ignored. */
TONEWRIGHT_API void TONEWRIGHT_Host_Free(void* memory);

/* These need no started library. Null for a null argument and when memory has run out. */

/* UTF-8 of a zero-terminated UTF-16 text; unpaired surrogates become U+FFFD. */
TONEWRIGHT_API char* TONEWRIGHT_Host_ToUTF8(const char16_t* text);
/* UTF-16 of a zero-terminated UTF-8 text. Null, too, for bytes that are not UTF-8. */
TONEWRIGHT_API char16_t* TONEWRIGHT_Host_ToUTF16(const char* text);
/* The "file:" URI of a path; a relative path counts from the current directory. Every byte of the path
 * survives, UTF-8 or not. */
TONEWRIGHT_API char16_t* TONEWRIGHT_Host_PathToURI(const char* path);
/* The path of a "file:" URI. Null for any other URI. */
TONEWRIGHT_API char* TONEWRIGHT_Host_URIToPath(const char16_t* uri);

/* The inline functions of tonewright.h as real ones, for languages that cannot read inline C. */
TONEWRIGHT_API void TONEWRIGHT_Host_DestroyHandle(TONEWRIGHT_Handle handle);
TONEWRIGHT_API const char16_t* TONEWRIGHT_Host_GetText(TONEWRIGHT_Handle handle);
TONEWRIGHT_API size_t TONEWRIGHT_Host_GetTextLength(TONEWRIGHT_Handle handle);

/* --- Log and failures ---------------------------------------------------------------------------- */

typedef enum TONEWRIGHT_LogLevel {
    TONEWRIGHT_LOG_TRACE = 0,
    TONEWRIGHT_LOG_DEBUG = 1,
    TONEWRIGHT_LOG_INFO = 2,
    TONEWRIGHT_LOG_WARNING = 3,
    TONEWRIGHT_LOG_EXCEPTION = 4, /* ranks below an error on purpose */
    TONEWRIGHT_LOG_ERROR = 5
} TONEWRIGHT_LogLevel;

/* One message. All pointers are valid during the call only and never null. */
typedef struct TONEWRIGHT_LogMessage {
    size_t size;
    int32_t level;         /* a TONEWRIGHT_LogLevel */
    const char* component; /* the part of the library that speaks; may be empty */
    const char* text;
    const char* kind; /* of a logged exception: its class, such as "peru::CFileError"; otherwise empty, as are
                         the rest */
    const char* title;
    const char* message;
} TONEWRIGHT_LogMessage;

/* Called on the thread that logs, which may be any, and by several threads at once. Messages that the
 * callback itself causes, on its own thread, are not delivered to it. */
typedef void (*TONEWRIGHT_LogCallback)(const TONEWRIGHT_LogMessage* message, void* user);

/* A log for TONEWRIGHT_AddProxyLogManager that passes messages of `minimumLevel` and above to the callback.
 * Needs no started library: a log added before TONEWRIGHT_InitStartup hears of the start. Once
 * TONEWRIGHT_RemoveProxyLogManager has returned, no further call begins, but one may still be running on
 * another thread. Null for a null callback. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateLog(int32_t minimumLevel,
                                                           TONEWRIGHT_LogCallback callback, void* user);

/* Why a function failed. All pointers are never null; text that is not known is empty. */
typedef struct TONEWRIGHT_Failure {
    size_t size;
    const char* kind;    /* the exception's class, such as "peru::CFileNotFoundError" */
    const char* title;   /* the kind for people, such as "File not found" */
    const char* message; /* a sentence with the reason */
    const char* file; /* the path of the file that it is about, or the URI where that is not a local file */
} TONEWRIGHT_Failure;

/* The last failure of a function of this header or of tonewright.h on the calling thread, since
 * TONEWRIGHT_Host_ClearLastFailure. The pointers stay valid until the next call of either on this thread.
 * Returns 1 when there was one; otherwise 0 and empty text. Needs no started library. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetLastFailure(TONEWRIGHT_Failure* failure);
TONEWRIGHT_API void TONEWRIGHT_Host_ClearLastFailure(void);

/* --- Files --------------------------------------------------------------------------------------- */

/* What the plug-in that reads a file knows about it. The text is zero-terminated and cut where it does not
 * fit. */
typedef struct TONEWRIGHT_MediaInfo {
    size_t size;
    int32_t sampleRate; /* the file's own format, whatever the source delivers */
    int32_t channelCount;
    int32_t bytesPerSample; /* of lossy codecs what the decoder delivers */
    double duration;        /* seconds */
    int64_t bitRate;        /* bits per second on average, 0 when unknown */
    char codec[64];         /* such as "FLAC"; empty when unknown */
    char plugin[64];        /* the plug-in that reads it */
} TONEWRIGHT_MediaInfo;

/* Opens a file in its own format: an open source that converts nothing. Each plug-in for the extension is
 * tried in order. `info` may be null. Null when no plug-in reads the file. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_OpenMedia(const char16_t* uri, TONEWRIGHT_MediaInfo* info);

/* The same facts about a source that exists, which is opened for that if needed and closed again. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetMediaInfo(TONEWRIGHT_Handle source, TONEWRIGHT_MediaInfo* info);

/* Has a source of a file deliver another format, from its beginning. An open source stays open: the file is
 * not opened again. 0 when the file cannot be converted to it, and for other sources. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetSourceFormat(TONEWRIGHT_Handle source, int32_t sampleRate,
                                                       int32_t channelCount, int32_t bytesPerSample);

/* Damaged parts of the file are replaced by silence of the same length instead of failing;
 * TONEWRIGHT_Host_TakeWarnings then says where. 0 for a source that cannot do that. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetSalvage(TONEWRIGHT_Handle source, int32_t salvage);

/* What was noticed while the source was read since the last call, such as clipping or repaired damage: one
 * warning per line, or null when there is none. Some warnings are known only when the source has been closed.
 */
TONEWRIGHT_API char* TONEWRIGHT_Host_TakeWarnings(TONEWRIGHT_Handle source);

/* What a file of a kind can hold. */
typedef struct TONEWRIGHT_Capabilities {
    size_t size;
    uint32_t channelCounts; /* bit n - 1: n channels at some rate and width, for 1 to 32 */
    uint32_t widths;        /* bit n - 1: n bytes per sample, for 1 to 4 */
    int32_t rateCount;
    int32_t rates[32]; /* of the usual rates from 8000 to 384000 Hz those that it takes, ascending */
} TONEWRIGHT_Capabilities;

/* Asks the plug-in that would write the file; nothing is written. 0 when no plug-in writes that kind. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetCapabilities(const char16_t* uri,
                                                       TONEWRIGHT_Capabilities* capabilities);

/* Whether the file can hold exactly this format: 1 or 0. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_CanWrite(const char16_t* uri, int32_t sampleRate, int32_t channelCount,
                                                int32_t bytesPerSample);

/* --- Outputs that appear complete or not at all --------------------------------------------------- */

/* An existing target is replaced by every encoder only once its new content is complete. An output is for
 * results that take several steps, such as a sound and then its tag, or that must not be seen before they are
 * complete: the steps write to a temporary file beside the target, and the last one gives it its name. The
 * host sets the same suffix by TONEWRIGHT_SetTempExtension, so that the extension before it still selects
 * formats and kinds of tag. */

typedef enum TONEWRIGHT_OutputFlags {
    TONEWRIGHT_OUTPUT_REPLACE =
        1, /* the target may exist, and so may a temporary file that a dead process left */
    TONEWRIGHT_OUTPUT_LIVE =
        2 /* the temporary file appears with its first byte and grows, so that what a killed
             process has written can still be used; otherwise it is empty until it is complete */
} TONEWRIGHT_OutputFlags;

/* Prepares a target; symbolic links are followed. Nobody else's file is touched. Null when the target exists
 * and is not to be replaced, cannot be replaced, or is being written by another output, in this process or
 * another. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateOutput(const char* path, const char* suffix,
                                                              int32_t flags);
/* The path of the temporary file, valid until the handle is destroyed. Null for a bad handle. */
TONEWRIGHT_API const char* TONEWRIGHT_Host_GetOutputPath(TONEWRIGHT_Handle output);
/* Writes the temporary file to the disk and gives it the target's name; a target that was there keeps its
 * mode and, where permitted, its owner. 0 leaves the temporary file as it is. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_CommitOutput(TONEWRIGHT_Handle output);
/* Leaves the temporary file where it is when the handle is destroyed; otherwise that removes it. */
TONEWRIGHT_API void TONEWRIGHT_Host_KeepOutput(TONEWRIGHT_Handle output);

/* Copies all fields and pictures of a tag that the target's format can hold. `lost` (may be null) receives
 * the names of those that it cannot, separated by ", ", or null when nothing was lost. 0 when the source's
 * tag cannot be read, -1 when the target's cannot be written, which leaves the target as it was. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_CopyTags(const char16_t* source, const char16_t* target, char** lost);

/* --- Sources of the host's own, and reading ------------------------------------------------------ */

/* Samples from a host. `read` fills up to `frames` frames and returns how many, 0 at the end, -1 on failure.
 * `seek` moves to a frame (1 on success, 0 on failure); it is also called to start again after a close. It
 * may be null: the source can then be read once. `release` (may be null) is called once when nothing uses the
 * source any more. All are called on the thread that uses the source. */
typedef struct TONEWRIGHT_SourceCallbacks {
    size_t size;
    int64_t (*read)(void* user, void* samples, int64_t frames);
    int32_t (*seek)(void* user, int64_t frame);
    void (*release)(void* user);
} TONEWRIGHT_SourceCallbacks;

/* A closed source that reads from callbacks. `frameCount` is its length, or -1 when it is not known, which
 * gives a duration of 0 and no usable progress. Null for invalid numbers; `release` is not called then. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateSourceFromCallbacks(
    int32_t sampleRate, int32_t channelCount, int32_t bytesPerSample, int64_t frameCount,
    const TONEWRIGHT_SourceCallbacks* callbacks, void* user);

/* A closed source of a copy of these samples (interleaved PCM, see tonewright.h). */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateSourceFromMemory(int32_t sampleRate,
                                                                        int32_t channelCount,
                                                                        int32_t bytesPerSample,
                                                                        const void* samples,
                                                                        int64_t frameCount);

/* Reads samples of any source, which the reader keeps alive and nobody else may use meanwhile. A closed
 * source is opened; destroying the reader leaves it open. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateReader(TONEWRIGHT_Handle source);
/* Fills up to `frames` frames. Fewer only at the end; 0 behind it, -1 on failure. */
TONEWRIGHT_API int64_t TONEWRIGHT_Host_ReadFrames(TONEWRIGHT_Handle reader, void* samples, int64_t frames);
/* The next frame that is read is the one at that time, or the first behind it. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_Seek(TONEWRIGHT_Handle reader, double seconds);

/* --- Sound devices ------------------------------------------------------------------------------- */

typedef enum TONEWRIGHT_DeviceDirection {
    TONEWRIGHT_DEVICE_OUTPUT = 0,
    TONEWRIGHT_DEVICE_INPUT = 1
} TONEWRIGHT_DeviceDirection;

typedef struct TONEWRIGHT_DeviceInfo {
    size_t size;
    const char* id; /* valid, as the others, until the list is destroyed */
    const char* name;
    const char* api; /* the sound system that it belongs to */
    int32_t channelCount;
    int32_t isDefault;
} TONEWRIGHT_DeviceInfo;

/* The devices of one direction: a handle of a list, which may be empty. Null when the sound system cannot be
 * reached. The first call reaches for the sound system, which takes some tens of milliseconds. These
 * functions need no started library. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_ListDevices(int32_t direction);
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetDeviceCount(TONEWRIGHT_Handle devices);
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetDevice(TONEWRIGHT_Handle devices, int32_t index,
                                                 TONEWRIGHT_DeviceInfo* info);

/* An input device for TONEWRIGHT_CreateAudioSoureFromAudioInDevice: the one with that id, or the default one
 * for null and for an empty id. Null when there is none. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_OpenInputDevice(const char* id);

/* --- Callbacks with user data -------------------------------------------------------------------- */

/* They work beside the callbacks of tonewright.h; where both are set, both are called. Null removes one. They
 * may be exchanged by any thread while a job runs; a call that is already running still ends on the old one.
 * Threads and restrictions are those of tonewright.h. */

typedef enum TONEWRIGHT_Answer {
    TONEWRIGHT_STOP = 0, /* a normal end: the file holds what was written */
    TONEWRIGHT_CONTINUE = 1,
    TONEWRIGHT_DISCARD = 2 /* ends the job without a result: what stood under the target's name stays */
} TONEWRIGHT_Answer;

/* Progress of an encoder from 0.0 to 1.0. Returns a TONEWRIGHT_Answer. */
typedef int32_t (*TONEWRIGHT_EncoderProgress)(double fraction, void* user);
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetEncoderProgress(TONEWRIGHT_Handle encoder,
                                                          TONEWRIGHT_EncoderProgress callback, void* user);

/* Progress of a player: see TONEWRIGHT_PlayerCallback. */
typedef void (*TONEWRIGHT_PlayerProgress)(double duration, double position, int32_t state, void* user);
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetPlayerProgress(TONEWRIGHT_Handle player,
                                                         TONEWRIGHT_PlayerProgress callback, void* user);

/* Progress and levels of a recording: see TONEWRIGHT_RecordingCallback and
 * TONEWRIGHT_RecordingVolumeCallback. */
typedef int32_t (*TONEWRIGHT_RecordingProgress)(double position,
                                                void* user); /* TONEWRIGHT_STOP or _CONTINUE */
typedef void (*TONEWRIGHT_RecordingLevels)(double left, double right, void* user);
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetRecordingProgress(TONEWRIGHT_Handle source,
                                                            TONEWRIGHT_RecordingProgress callback,
                                                            void* user);
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetRecordingLevels(TONEWRIGHT_Handle source,
                                                          TONEWRIGHT_RecordingLevels callback, void* user);

/* --- What a player program needs ------------------------------------------------------------------ */

/* Any thread, also from the player's progress callback. */

/* Continues at another time, playing or paused; sound that waits in the queue is dropped. On a stopped
 * player: where the next TONEWRIGHT_Player_Play begins. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SeekPlayer(TONEWRIGHT_Handle player, double seconds);
/* A factor on the samples, effective at once; 1.0 leaves them unchanged. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetPlayerVolume(TONEWRIGHT_Handle player, double factor);
/* Has a stopped player use the output device with that id. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetPlayerDevice(TONEWRIGHT_Handle player, const char* id);
/* Plays the source after everything that is queued already, without a gap. 0, and nothing queued, when its
 * format is not the current one's. To be called before the last second of the current source is heard. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_EnqueueSource(TONEWRIGHT_Handle player, TONEWRIGHT_Handle source);
/* How many queued sources have begun to be heard; progress reports are about the one that is heard. -1 on
 * failure. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetPlayerSourceIndex(TONEWRIGHT_Handle player);

/* --- Arrangements -------------------------------------------------------------------------------- */

/* An editor's XML for TONEWRIGHT_CreateAudioSourceFromEditorXml, read from a file: media that it names by
 * relative URIs are those beside the file. Null when it is not XML, has no tracks or a track names no medium.
 */
TONEWRIGHT_API char16_t* TONEWRIGHT_Host_ReadArrangement(const char* path);

#ifdef __cplusplus
} /* extern "C" */
#endif

#endif
