/*
 * libtonewright_host: what a host in C needs in addition to the 73 functions of tonewright.h.
 *
 * The library works on the same handles as libtonewright and offers text in other encodings, log callbacks,
 * the reasons of failures, the properties of files, the capabilities of targets, sources that read from
 * memory or from callbacks, reading samples, sound devices, callbacks with user data, all fields of a tag,
 * disc projects, look-ups of discs, and downloads. Unless documented otherwise, a function requires the
 * started library (TONEWRIGHT_InitStartup), and its handles must be destroyed before TONEWRIGHT_DeInitAll.
 *
 * Text is UTF-8 here, except for URIs, which are UTF-16 as in tonewright.h. Paths are bytes and need not be
 * UTF-8. Pointers in a record that a function fills stay valid for the time documented there; other text that
 * a function returns belongs to the caller, who releases it with TONEWRIGHT_Host_Free.
 *
 * Each record starts with its own size, which the caller sets (sizeof), so that a host compiled against an
 * older header still works: fields beyond that size are not written.
 *
 * Failures. No C++ exception leaves a function. Functions with a status return 1 on success and 0 on failure,
 * unless documented otherwise, and TONEWRIGHT_Host_GetLastFailure returns the reason.
 *
 * Threads. Functions may be called on any thread, but on one at a time for the same object, unless documented
 * otherwise. A callback must not throw and must not unwind (longjmp) through the library.
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

/* These do not require the started library. Null for a null argument and if memory is exhausted. */

/* UTF-8 of a zero-terminated UTF-16 text; unpaired surrogates become U+FFFD. */
TONEWRIGHT_API char* TONEWRIGHT_Host_ToUTF8(const char16_t* text);
/* UTF-16 of a zero-terminated UTF-8 text. Also null for bytes that are not UTF-8. */
TONEWRIGHT_API char16_t* TONEWRIGHT_Host_ToUTF16(const char* text);
/* The "file:" URI of a path; a relative path starts at the current directory. Every byte of the path
 * is preserved, UTF-8 or not. */
TONEWRIGHT_API char16_t* TONEWRIGHT_Host_PathToURI(const char* path);
/* The path of a "file:" URI. Null for any other URI. */
TONEWRIGHT_API char* TONEWRIGHT_Host_URIToPath(const char16_t* uri);

/* The inline functions of tonewright.h as exported ones, for languages that cannot use inline C. */
TONEWRIGHT_API void TONEWRIGHT_Host_DestroyHandle(TONEWRIGHT_Handle handle);
TONEWRIGHT_API const char16_t* TONEWRIGHT_Host_GetText(TONEWRIGHT_Handle handle);
TONEWRIGHT_API size_t TONEWRIGHT_Host_GetTextLength(TONEWRIGHT_Handle handle);

/* --- Language ------------------------------------------------------------------------------------ */

/* Sets the language of all texts from now on, by the name of a locale such as "de", "de-AT" or
 * "de_AT.UTF-8"; null for that of the environment (LC_ALL, LC_MESSAGES, LANG). TONEWRIGHT_SetLanguageID does
 * the same for "de-AT". English needs no language files and costs nothing. 0 if there is no such language or
 * no translation; with null the texts stay English then, and the result is 1. Does not require the started
 * library. One thread at a time; other threads may use the library meanwhile. TONEWRIGHT_DeInitAll resets the
 * language. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetLanguage(const char* locale);

/* The translation of a host's own text, or `defaultText` if there is none; the caller releases it. Keys are
 * dotted names; host.* are those of the program tonewright. `placeholders` are names and values in turn, up
 * to a null pointer, such as {"%FILE%", path, NULL}, and are filled in afterwards; null for none. Does not
 * require the started library. Any thread. Null for a null argument and if memory is exhausted. */
TONEWRIGHT_API char* TONEWRIGHT_Host_Localize(const char* key, const char* defaultText,
                                              const char* const* placeholders);

/* --- Log and failures ---------------------------------------------------------------------------- */

/* Levels of messages, in the order of their rank. */
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
    const char* component; /* the part of the library that logs; may be empty */
    const char* text;
    const char* kind; /* the class of a logged exception, such as "peru::CFileError"; otherwise this and the
                         following members are empty */
    const char* title;
    const char* message;
} TONEWRIGHT_LogMessage;

/* Called on the thread that logs, which may be any thread, by one thread at a time and with locks of the
 * library held: see TONEWRIGHT_AddProxyLogManager. Messages caused by the callback itself, on its own thread,
 * are not delivered to it. */
typedef void (*TONEWRIGHT_LogCallback)(const TONEWRIGHT_LogMessage* message, void* user);

/* A log for TONEWRIGHT_AddProxyLogManager that passes messages of `minimumLevel` and above to the callback.
 * Does not require the started library: a log added before TONEWRIGHT_InitStartup receives the messages of
 * the start. Once TONEWRIGHT_RemoveProxyLogManager has returned, the callback is not called any more. Null
 * for a null callback. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateLog(int32_t minimumLevel,
                                                           TONEWRIGHT_LogCallback callback, void* user);

/* Why a function failed. The pointers are never null; unknown text is empty. */
typedef struct TONEWRIGHT_Failure {
    size_t size;
    const char* kind;    /* the exception's class, such as "peru::CFileNotFoundError" */
    const char* title;   /* the kind in words, such as "File not found" */
    const char* message; /* a sentence with the reason */
    const char* file;    /* the path of the file concerned, or its URI if that is not a local file */
} TONEWRIGHT_Failure;

/* The last failure of a function of this header or of tonewright.h on the calling thread, since
 * TONEWRIGHT_Host_ClearLastFailure. The pointers stay valid until the next call of either on this thread.
 * Returns 1 if there was one; otherwise 0 and empty text. Does not require the started library. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetLastFailure(TONEWRIGHT_Failure* failure);
TONEWRIGHT_API void TONEWRIGHT_Host_ClearLastFailure(void);

/* --- Files --------------------------------------------------------------------------------------- */

/* Properties of a file as reported by the plug-in that reads it. Text is zero-terminated and truncated if it
 * does not fit. */
typedef struct TONEWRIGHT_MediaInfo {
    size_t size;
    int32_t sampleRate; /* the file's own format, whatever the source delivers */
    int32_t channelCount;
    int32_t bytesPerSample; /* for lossy codecs the width that the decoder delivers */
    double duration;        /* seconds */
    int64_t bitRate;        /* bits per second on average, 0 when unknown */
    char codec[64];         /* such as "FLAC"; empty when unknown */
    char plugin[64];        /* the plug-in that reads it */
} TONEWRIGHT_MediaInfo;

/* Opens a file in its own format: an open source that converts nothing. An encoder writes the floating-point
 * samples of such a source unchanged if the target has 4 bytes per sample and holds them (WAV, AIFF, AU, CAF,
 * W64, RF64); otherwise they become integers. The plug-ins for the extension are tried in order. `info` may
 * be null. Null if no plug-in can read the file. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_OpenMedia(const char16_t* uri, TONEWRIGHT_MediaInfo* info);

/* The same properties for an existing source, which is opened for this if necessary and closed again. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetMediaInfo(TONEWRIGHT_Handle source, TONEWRIGHT_MediaInfo* info);

/* Has a source of a file deliver another format, from its beginning. An open source stays open: the file is
 * not opened again. 0 when the file cannot be converted to it, and for other sources. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetSourceFormat(TONEWRIGHT_Handle source, int32_t sampleRate,
                                                       int32_t channelCount, int32_t bytesPerSample);

/* With a nonzero `salvage`, damaged parts of the file are replaced by silence of the same length instead of
 * failing; TONEWRIGHT_Host_TakeWarnings then reports where. 0 for a source that does not support this. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetSalvage(TONEWRIGHT_Handle source, int32_t salvage);

/* With a nonzero `prevent`, a file of floating-point samples that exceed full scale is made quieter as a
 * whole instead of clipping when it is delivered as integers; TONEWRIGHT_Host_TakeWarnings then reports by
 * how much. Such a file is read twice. Other files are not changed. 0 for a source that does not support
 * this. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetClippingPrevention(TONEWRIGHT_Handle source, int32_t prevent);

/* Warnings about the sound read since the last call, such as clipping or repaired damage: one per line, or
 * null if there are none. Some warnings are known only after the source has been closed. */
TONEWRIGHT_API char* TONEWRIGHT_Host_TakeWarnings(TONEWRIGHT_Handle source);

/* Settings of TONEWRIGHT_CreateAudioFormatFromURI that a type of file may ignore. */
typedef enum TONEWRIGHT_Setting {
    TONEWRIGHT_SETTING_QUALITY = 1,
    TONEWRIGHT_SETTING_BIT_RATE = 2, /* and its limits */
    TONEWRIGHT_SETTING_WIDTH = 4     /* files store samples of that width; lossy codecs do not */
} TONEWRIGHT_Setting;

/* What files of a type can hold. */
typedef struct TONEWRIGHT_Capabilities {
    size_t size;
    uint32_t channelCounts; /* bit n - 1: n channels at some rate and width, for 1 to 32 */
    uint32_t widths;        /* bit n - 1: n bytes per sample, for 1 to 4 */
    int32_t rateCount;
    int32_t rates[32]; /* those of the usual rates from 8000 to 384000 Hz that are accepted, ascending */
    uint32_t settings; /* the TONEWRIGHT_Setting bits that have an effect; all of them if the plug-in does not
                          report it */
} TONEWRIGHT_Capabilities;

/* Asks the plug-in that would write the file; nothing is written. 0 if no plug-in writes that type. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetCapabilities(const char16_t* uri,
                                                       TONEWRIGHT_Capabilities* capabilities);

/* The plug-in that is asked first for a type of file. */
typedef struct TONEWRIGHT_PluginInfo {
    size_t size;
    int32_t isBoxed; /* nonzero if it runs in a process of its own */
    char plugin[64]; /* its name, such as "sonora2_flac" */
} TONEWRIGHT_PluginInfo;

/* For files with that extension (without the point): which plug-in reads them (`type` is
 * TONEWRIGHT_AUDIO_SOURCE, or 1 for video) or writes them (TONEWRIGHT_AUDIO_FORMAT). `info` may be
 * null. No file is opened and no process started. 0 if there is none. Any thread. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetPlugin(const char16_t* extension, int32_t type,
                                                 TONEWRIGHT_PluginInfo* info);

/* Whether the file can hold exactly this format: 1 or 0. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_CanWrite(const char16_t* uri, int32_t sampleRate, int32_t channelCount,
                                                int32_t bytesPerSample);

/* --- Outputs that appear complete or not at all --------------------------------------------------- */

/* Every encoder replaces an existing target only once the new content is complete. An output is for results
 * that take several steps, such as a sound and then its tag, or that must not be visible before they are
 * complete: the steps write to a temporary file beside the target, and the last step renames it to the
 * target. The host passes the same suffix to TONEWRIGHT_SetTempExtension, so that the extension before it
 * still selects the format and the kind of tag. */

/* Bits of the flags of an output. */
typedef enum TONEWRIGHT_OutputFlags {
    TONEWRIGHT_OUTPUT_REPLACE =
        1, /* the target may exist, and so may a temporary file left by a process that ended */
    TONEWRIGHT_OUTPUT_LIVE =
        2 /* the encoder creates the temporary file and it grows, so that what a killed process has
             written can still be used; otherwise it is empty until it is complete */
} TONEWRIGHT_OutputFlags;

/* Prepares a target; symbolic links are followed. Files of other jobs are left alone. Null if the target
 * exists and TONEWRIGHT_OUTPUT_REPLACE is not set, if it cannot be replaced, or if another output is writing
 * it, in this process or another. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateOutput(const char* path, const char* suffix,
                                                              int32_t flags);
/* The path of the temporary file, valid until the handle is destroyed. Null for a bad handle. */
TONEWRIGHT_API const char* TONEWRIGHT_Host_GetOutputPath(TONEWRIGHT_Handle output);
/* Writes the temporary file to the disk and renames it to the target; the mode of an existing target and,
 * where permitted, its owner are preserved. 0 on failure; the temporary file then remains until the handle is
 * destroyed. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_CommitOutput(TONEWRIGHT_Handle output);
/* Keeps the temporary file, which destroying the handle would otherwise remove. */
TONEWRIGHT_API void TONEWRIGHT_Host_KeepOutput(TONEWRIGHT_Handle output);

/* Copies all fields and pictures of a tag that the target's format can hold. `lost` (may be null) receives
 * the names of the others, separated by ", ", or null if nothing was lost. 0 if the source's tag cannot be
 * read; -1 if the target's tag cannot be written, in which case the target is unchanged. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_CopyTags(const char16_t* source, const char16_t* target, char** lost);

/* --- Tags: all fields and pictures of all formats -------------------------------------------------- */

/* The functions TONEWRIGHT_FileTag_... access eight fields of the formats of TONEWRIGHT_CreateFileTag. These
 * access every field and picture, in every format that TONEWRIGHT_Host_GetTagSupport reports. Names of fields
 * are the same for all formats: TITLE, ARTIST, ALBUM, ALBUMARTIST, TRACKNUMBER, DATE, GENRE, COMMENT,
 * COMPOSER and so on; a name without an equivalent in the format is stored as it is where the format allows
 * that. */

/* Which tags of a type can be read and written. */
typedef enum TONEWRIGHT_TagSupport {
    TONEWRIGHT_TAG_FIELDS = 1,   /* these functions read and write fields */
    TONEWRIGHT_TAG_PICTURES = 2, /* ... and pictures */
    TONEWRIGHT_TAG_EXPORTS = 4   /* TONEWRIGHT_CreateFileTag also supports the file */
} TONEWRIGHT_TagSupport;

/* What is supported for files with that extension: bits of TONEWRIGHT_TagSupport, 0 for none. The file is not
 * accessed. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetTagSupport(const char16_t* uri);

/* Reads a file's tag: a handle to a copy of its content, or null if the file cannot be read or its content
 * has no known format. A file without a tag has a copy without entries. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_ReadTags(const char16_t* uri);
/* The number of entries: the values of all fields, sorted by name, and then data that has no text form. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetTagEntryCount(TONEWRIGHT_Handle tags);
/* The texts are valid until the handle is destroyed. A field with several values has several entries of one
 * name. The value of data without a text form is null, and its name is the format's own, such as "PRIV". */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetTagEntry(TONEWRIGHT_Handle tags, int32_t index, const char** name,
                                                   const char** value);

/* A picture of a tag. */
typedef struct TONEWRIGHT_TagPicture {
    size_t size;
    const void* data; /* a picture file */
    size_t dataSize;
    const char* mimeType;
    const char* description;
    int32_t
        type; /* the number of the ID3v2 APIC frame: 3 is the front cover, 4 the back cover, 0 any other */
    int32_t width; /* in pixels, like the height; 0 when unknown */
    int32_t height;
} TONEWRIGHT_TagPicture;

/* The number of pictures; 0 for an invalid handle. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetTagPictureCount(TONEWRIGHT_Handle tags);
/* The pointers are valid until the handle is destroyed. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetTagPicture(TONEWRIGHT_Handle tags, int32_t index,
                                                     TONEWRIGHT_TagPicture* picture);

/* A set of changes, at first empty, that can be applied to any number of files. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateTagChange(void);
/* Replaces the values of a field by this one; calls with the same name add further values. A null or empty
 * value removes the field, and drops the values of earlier calls. Names consist of printable ASCII characters
 * except '=' and '~', in either case; 0 for others. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_ChangeTagField(TONEWRIGHT_Handle change, const char* name,
                                                      const char* value);
/* Removes the pictures of a type, or all for -1, before others are added. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_RemoveTagPictures(TONEWRIGHT_Handle change, int32_t type);
/* Adds a copy of the picture in front of the others. If its MIME type is null or empty it is detected, and if
 * its size in pixels is 0 it is read from the data. 0 if the type cannot be detected. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_AddTagPicture(TONEWRIGHT_Handle change,
                                                     const TONEWRIGHT_TagPicture* picture);
/* Makes all changes to a file or none. Returns 1 if the file was changed, 0 if it was like that already, and
 * -1 on failure, also if the format cannot hold a field or picture. Other processes that change the same file
 * through this library meanwhile lose nothing. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_ApplyTagChange(TONEWRIGHT_Handle change, const char16_t* uri);

/* --- Host-defined sources, and reading ----------------------------------------------------------- */

/* Samples from a host. `read` reads up to `frames` frames and returns their number, 0 at the end, -1 on
 * failure. `seek` moves to a frame (1 on success, 0 on failure) and is also called to restart after a close;
 * if it is null, the source can be read only once. `release` (may be null) is called once, when the source is
 * no longer used. All are called on the thread that uses the source. */
typedef struct TONEWRIGHT_SourceCallbacks {
    size_t size;
    int64_t (*read)(void* user, void* samples, int64_t frames);
    int32_t (*seek)(void* user, int64_t frame);
    void (*release)(void* user);
} TONEWRIGHT_SourceCallbacks;

/* A closed source that reads from callbacks. `frameCount` is its length, or -1 if unknown, in which case the
 * duration is 0 and progress is not meaningful. Null for invalid numbers; `release` is then not called. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateSourceFromCallbacks(
    int32_t sampleRate, int32_t channelCount, int32_t bytesPerSample, int64_t frameCount,
    const TONEWRIGHT_SourceCallbacks* callbacks, void* user);

/* A closed source that reads a copy of these samples (interleaved PCM, see tonewright.h). */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateSourceFromMemory(int32_t sampleRate,
                                                                        int32_t channelCount,
                                                                        int32_t bytesPerSample,
                                                                        const void* samples,
                                                                        int64_t frameCount);

/* Reads the samples of any source. The reader keeps the source alive; it must not be used otherwise during
 * that time. A closed source is opened; destroying the reader leaves it open. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateReader(TONEWRIGHT_Handle source);
/* Reads up to `frames` frames and returns their number: fewer only at the end, then 0; -1 on failure. */
TONEWRIGHT_API int64_t TONEWRIGHT_Host_ReadFrames(TONEWRIGHT_Handle reader, void* samples, int64_t frames);
/* Reading continues with the frame at that time, or the first one after it. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_Seek(TONEWRIGHT_Handle reader, double seconds);

/* --- Loudness and gain ---------------------------------------------------------------------------- */

/* The loudness of sound. */
typedef struct TONEWRIGHT_Loudness {
    size_t size;
    double integrated; /* LUFS, as in EBU R 128; negative infinity if nothing was louder than -70 LUFS for 400
                          ms */
    double truePeak;   /* the highest value of the curve through the samples (ITU-R BS.1770), as a factor of
                          full scale; floating-point samples may exceed 1.0 */
    double samplePeak; /* the highest sample */
    double range;      /* loudness range in LU, as in EBU Tech 3342; 0 for less than 3 seconds */
} TONEWRIGHT_Loudness;

/* Progress of a measurement from 0.0 to 1.0. Returns a TONEWRIGHT_Answer: after TONEWRIGHT_STOP the part read
 * so far counts, after TONEWRIGHT_DISCARD there is no result. */
typedef int32_t (*TONEWRIGHT_LoudnessProgress)(double fraction, void* user);

/* Reads a source to its end, from its current position if it is open, and closes it. Opened again, it starts
 * at its beginning; one that can be read only once is used up. Floating-point samples of a file are measured
 * unclipped. The callback may be null. Returns a handle to the measurement; null on failure and after
 * TONEWRIGHT_DISCARD. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_MeasureLoudness(TONEWRIGHT_Handle source,
                                                                 TONEWRIGHT_LoudnessProgress callback,
                                                                 void* user);

/* The result of a measurement, or of several together, such as the tracks of an album. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetLoudness(const TONEWRIGHT_Handle* measurements, int32_t count,
                                                   TONEWRIGHT_Loudness* loudness);

/* A source that delivers another one with its samples multiplied by `gain`, and with `bytesPerSample`; with 0
 * it has the width of the other source, and passes floating-point samples on like
 * TONEWRIGHT_Host_OpenMedia. Samples are calculated in double precision and rounded once; those beyond full
 * scale clip unless they stay floating-point. The new source is as open as the other one, which it keeps
 * alive and which must not be used otherwise. Null for a gain that is negative or not finite. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateGainSource(TONEWRIGHT_Handle source, double gain,
                                                                  int32_t bytesPerSample);

/* --- Sound devices ------------------------------------------------------------------------------- */

/* What a device does. */
typedef enum TONEWRIGHT_DeviceDirection {
    TONEWRIGHT_DEVICE_OUTPUT = 0,
    TONEWRIGHT_DEVICE_INPUT = 1
} TONEWRIGHT_DeviceDirection;

/* Properties of a sound device. */
typedef struct TONEWRIGHT_DeviceInfo {
    size_t size;
    const char* id; /* like the other strings valid until the list is destroyed */
    const char* name;
    const char* api; /* the sound system to which it belongs */
    int32_t channelCount;
    int32_t isDefault;
} TONEWRIGHT_DeviceInfo;

/* The devices of one direction: a handle to a list, which may be empty. Null if the sound system cannot be
 * reached. The first call connects to the sound system, which takes some tens of milliseconds. These
 * functions do not require the started library. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_ListDevices(int32_t direction);
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetDeviceCount(TONEWRIGHT_Handle devices);
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetDevice(TONEWRIGHT_Handle devices, int32_t index,
                                                 TONEWRIGHT_DeviceInfo* info);

/* An input device for TONEWRIGHT_CreateAudioSoureFromAudioInDevice: the one with that id, or the default one
 * if the id is null or empty. Null if there is none. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_OpenInputDevice(const char* id);

/* --- Callbacks with user data -------------------------------------------------------------------- */

/* Set in addition to the callbacks of tonewright.h; if both are set, both are called. Null removes a
 * callback. Any thread may replace one while a job runs; a call already in progress still completes on the
 * old callback. Threads and restrictions are those of tonewright.h. */

/* What a callback asks of the job. */
typedef enum TONEWRIGHT_Answer {
    TONEWRIGHT_STOP = 0, /* ends the job normally: the file holds what was written */
    TONEWRIGHT_CONTINUE = 1,
    TONEWRIGHT_DISCARD = 2 /* ends the job without a result: an existing target is unchanged */
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

/* --- Player control ------------------------------------------------------------------------------- */

/* May be called on any thread, also in the player's progress callback. */

/* Moves to another time, playing or paused; queued sound is dropped. For a stopped player, sets where the
 * next TONEWRIGHT_Player_Play begins. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SeekPlayer(TONEWRIGHT_Handle player, double seconds);
/* A factor applied to the samples, effective at once; 1.0 leaves them unchanged. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetPlayerVolume(TONEWRIGHT_Handle player, double factor);
/* Selects the output device of a stopped player by its id. Without it, each TONEWRIGHT_Player_Play uses the
 * device that is the default one at that time. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_SetPlayerDevice(TONEWRIGHT_Handle player, const char* id);
/* Plays the source after everything already queued, without a gap. If its format differs from that of the
 * current source, the result is 0 and nothing is queued. Must be called before the last second of the current
 * source is heard. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_EnqueueSource(TONEWRIGHT_Handle player, TONEWRIGHT_Handle source);
/* The number of queued sources whose playback has begun; progress refers to the source that is heard. -1 on
 * failure. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetPlayerSourceIndex(TONEWRIGHT_Handle player);

/* --- Arrangements -------------------------------------------------------------------------------- */

/* Reads an editor's XML for TONEWRIGHT_CreateAudioSourceFromEditorXml from a file and resolves relative URIs
 * against the file's folder. Null if the file is not XML, has no tracks, or a track has no URI. */
TONEWRIGHT_API char16_t* TONEWRIGHT_Host_ReadArrangement(const char* path);

/* --- Disc projects -------------------------------------------------------------------------------- */

/* An empty project, for TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource or
 * TONEWRIGHT_DataDiscProject_AddFileFromAudioSource. Loads the disc library; no drive is touched. Null on
 * failure. One thread at a time for a project. Destroying the handle releases the project and the sources of
 * its tracks, unless a handle of discio2.h to its disc still exists. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateAudioCDProject(void);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateDataDiscProject(void);

/* See discio2.h. */
struct DISCIO_Project;
/* The same project for the functions of discio2.h, which set its texts and pauses, list its contents and
 * write it. It belongs to the handle: valid until that is destroyed, and not to be released. Null for another
 * handle. */
TONEWRIGHT_API struct DISCIO_Project* TONEWRIGHT_Host_GetDiscProject(TONEWRIGHT_Handle project);

/* The URI of a project's disc. With "Track01.cda" and so on appended, it is the URI of a track for
 * TONEWRIGHT_CreateAudioSourceFromURI, as long as the project exists. Null for another handle. */
TONEWRIGHT_API char16_t* TONEWRIGHT_Host_GetDiscProjectURI(TONEWRIGHT_Handle project);

/* --- Look-up of discs (CDDB) --------------------------------------------------------------------- */

/* Album and track titles of an audio CD from a server that speaks the CDDB protocol over HTTP. No server is
 * built in. Positions on a disc are in frames of 1/75 second and include the pre-gap, as CDDB states them:
 * the first track of most discs starts at 150. */

/* Bits of the flags of a look-up. */
typedef enum TONEWRIGHT_CDDBFlags {
    TONEWRIGHT_CDDB_REFRESH =
        1 /* asks the server even if the answer is in the cache, and replaces it there */
} TONEWRIGHT_CDDBFlags;

/* The server, and what it is told about the client. Numbers that are 0 and pointers that are null have the
 * default named here. Text is copied. */
typedef struct TONEWRIGHT_CDDBSettings {
    size_t size;
    const char* host;       /* name or address of the server; required */
    int32_t port;           /* 80 */
    const char* path;       /* "/~cddb/cddb.cgi" */
    const char* clientName; /* of the application; required, like its version */
    const char* clientVersion;
    const char* user;        /* "anon" */
    const char* userHost;    /* "anon" */
    const char* proxy;       /* "host", "host:port" or a URI, where the port is 80 unless stated; null: the
                                proxy of the system; empty: none */
    const char* noProxy;     /* hosts that `proxy` does not serve, in the form of no_proxy; none */
    int32_t connectTimeout;  /* milliseconds until the connection is made; 10000 */
    int32_t silenceTimeout;  /* milliseconds without a byte; 30000 */
    int32_t totalTimeout;    /* milliseconds for each request; unlimited */
    const char* codePage;    /* encoding of replies that are not UTF-8, by its name for iconv; the one that
                                the server states, otherwise Windows-1252 */
    const char* cacheFolder; /* folder for answers, created when needed; null: "tonewright/cddb" in
                                $XDG_CACHE_HOME; empty: none */
    uint32_t flags;          /* bits of TONEWRIGHT_CDDBFlags */
} TONEWRIGHT_CDDBSettings;

/* The id of a disc with `count` tracks (1 to 99), from their offsets and that of the lead-out. Returns 0 and
 * leaves `id` unchanged if the offsets do not ascend. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetCDDBDiscId(const int32_t* offsets, int32_t count, int32_t leadOut,
                                                     uint32_t* id);

/* A client; nothing is sent. Null for missing settings. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateCDDB(const TONEWRIGHT_CDDBSettings* settings);

/* The outcome of a query. */
typedef enum TONEWRIGHT_CDDBResult {
    TONEWRIGHT_CDDB_FAILED = -1, /* the server cannot be reached or reports a failure, or it was cancelled */
    TONEWRIGHT_CDDB_NO_MATCH = 1,
    TONEWRIGHT_CDDB_EXACT = 2,  /* one or more candidates are the disc */
    TONEWRIGHT_CDDB_INEXACT = 3 /* candidates are similar discs only */
} TONEWRIGHT_CDDBResult;

/* Asks which records fit a disc, and waits for the answer. Returns a TONEWRIGHT_CDDBResult. The candidates
 * replace those of the last query. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_QueryCDDB(TONEWRIGHT_Handle cddb, const int32_t* offsets,
                                                 int32_t count, int32_t leadOut);

/* A record that fits. The text is valid until the next query or until the handle is destroyed. */
typedef struct TONEWRIGHT_CDDBCandidate {
    size_t size;
    const char* category;
    uint32_t id;       /* of the record, which need not be that of the disc */
    const char* title; /* usually artist and album */
} TONEWRIGHT_CDDBCandidate;

/* The number of records that the last query has found; 0 for an invalid handle. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetCDDBCandidateCount(TONEWRIGHT_Handle cddb);
/* Fills the record with that index, from 0: 1, or 0 for an invalid handle or index. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetCDDBCandidate(TONEWRIGHT_Handle cddb, int32_t index,
                                                        TONEWRIGHT_CDDBCandidate* candidate);

/* Reads the record of a candidate, and waits for it: a handle that is independent of the client, or null on
 * failure. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_ReadCDDB(TONEWRIGHT_Handle cddb, int32_t index);

/* A disc. Text is never null and valid until the record is destroyed; what the record does not have is
 * empty. */
typedef struct TONEWRIGHT_CDDBRecord {
    size_t size;
    const char* artist;
    const char* title;
    const char* year;
    const char* genre;
    const char* notes; /* may have several lines */
    int32_t trackCount;
} TONEWRIGHT_CDDBRecord;

/* A track of a record. The texts are valid until the record is destroyed. */
typedef struct TONEWRIGHT_CDDBTrack {
    size_t size;
    const char* artist; /* empty unless the disc is a compilation */
    const char* title;
    const char* notes;
} TONEWRIGHT_CDDBTrack;

/* Fills what a record says of the disc: 1, or 0 for an invalid handle. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetCDDBRecord(TONEWRIGHT_Handle record, TONEWRIGHT_CDDBRecord* disc);
/* Fills what a record says of the track with that index, from 0: 1, or 0 for an invalid handle or index. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_GetCDDBTrack(TONEWRIGHT_Handle record, int32_t index,
                                                    TONEWRIGHT_CDDBTrack* track);

/* Ends the call of this client that is running, at once, and all later ones when they begin. Any thread. */
TONEWRIGHT_API void TONEWRIGHT_Host_CancelCDDB(TONEWRIGHT_Handle cddb);

/* --- Downloads ----------------------------------------------------------------------------------- */

/* A download of a resource with an "http" URI, to which redirections are followed; nothing is sent. The proxy
 * is that of the system. Null for another kind of URI. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_Host_CreateDownload(const char16_t* uri);
/* Bytes received so far, and in total or -1 if that is unknown. Called on the thread of the download; returns
 * TONEWRIGHT_CONTINUE, or TONEWRIGHT_STOP to cancel it. */
typedef int32_t (*TONEWRIGHT_DownloadProgress)(int64_t received, int64_t total, void* user);
/* Writes the resource to a file, which is created or overwritten; the path of an output (see above) makes the
 * result appear complete or not at all. Can be called once. `progress` may be null. 0 on failure, also for a
 * status other than 200 to 299 and for a body shorter than announced; the file is then incomplete. */
TONEWRIGHT_API int32_t TONEWRIGHT_Host_RunDownload(TONEWRIGHT_Handle download, const char* path,
                                                   TONEWRIGHT_DownloadProgress progress, void* user);
/* Ends the download at once, or when it begins. Any thread. */
TONEWRIGHT_API void TONEWRIGHT_Host_CancelDownload(TONEWRIGHT_Handle download);

#ifdef __cplusplus
} /* extern "C" */
#endif

#endif
