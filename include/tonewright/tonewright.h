/*
 * The complete interface of libtonewright: 73 functions, C11 and C++.
 *
 * Calling order. TONEWRIGHT_Init_Crashhandler may come before everything. TONEWRIGHT_InitStartup is first;
 * then, in any order, TONEWRIGHT_InitDiscio, TONEWRIGHT_InitGui, TONEWRIGHT_SetLanguageID,
 * TONEWRIGHT_SetTempExtension and the callbacks; then the object functions; TONEWRIGHT_DeInitAll is last.
 * Functions that need the started library return their failure value before TONEWRIGHT_InitStartup and after
 * TONEWRIGHT_DeInitAll. The library can be started again afterwards.
 *
 * Text is zero-terminated UTF-16. Arguments are read only during the call; a null text counts as empty
 * unless stated otherwise. A URI argument is a complete URI such as "file:///home/me/a%20song.flac".
 *
 * Handles. A returned handle belongs to the caller, who releases it with TONEWRIGHT_DestroyHandle; no other
 * function consumes it. It keeps its object alive; objects created from others (an encoder from its source
 * and format) keep those alive themselves. All handles must be destroyed before TONEWRIGHT_DeInitAll.
 * Passing a null handle or one of another kind is safe: the function returns the value documented for a bad
 * handle.
 *
 * Failures. No C++ exception leaves a function unless its description says so. The reason of a failure is
 * written to the log at its most severe level and to standard error; a host receives it by adding a log of
 * its own with TONEWRIGHT_AddProxyLogManager.
 *
 * Threads. Any thread may call; each object may be used by one thread at a time. Exceptions are documented.
 *
 * Units. Time is in seconds. Sample rates are in frames per second; a frame is one sample of every channel.
 * Samples are little-endian interleaved PCM, 1 byte unsigned or 2 to 4 bytes signed.
 */
#ifndef TONEWRIGHT_TONEWRIGHT_H
#define TONEWRIGHT_TONEWRIGHT_H

#include <stddef.h>
#include <stdint.h>
#ifndef __cplusplus
#include <stdbool.h>
#include <uchar.h>
#endif

#define TONEWRIGHT_API __attribute__((visibility("default")))

#ifdef __cplusplus
extern "C" {
#endif

/* Status results. Each family of functions has its own failure code. */
typedef enum TONEWRIGHT_Status {
    TONEWRIGHT_OK = 0,
    TONEWRIGHT_INIT_FAILED = 1,
    TONEWRIGHT_AUDIO_FAILED = 3, /* audio source, or closing an audio format */
    TONEWRIGHT_AUDIO_CD_PROJECT_FAILED = 4,
    TONEWRIGHT_AUDIO_FORMAT_OPEN_FAILED = 5,
    TONEWRIGHT_DATA_DISC_PROJECT_FAILED = 7,
    TONEWRIGHT_FILE_TAG_FAILED = 8,
    TONEWRIGHT_PLAYER_FAILED = 9,
    TONEWRIGHT_ENCODER_FAILED = 10,    /* bad handle, or setting the callback */
    TONEWRIGHT_ENCODER_RUN_FAILED = 11 /* the job itself */
} TONEWRIGHT_Status;

/* States reported by a player. */
typedef enum TONEWRIGHT_PlayerState {
    TONEWRIGHT_PLAYER_PLAYING = 0,
    TONEWRIGHT_PLAYER_PAUSED = 1,
    TONEWRIGHT_PLAYER_STOPPED = 2
} TONEWRIGHT_PlayerState;

/* Kinds of media: bits of the mask passed to TONEWRIGHT_getValidCodecExtensions. */
typedef enum TONEWRIGHT_CodecType {
    TONEWRIGHT_VIDEO_SOURCE = 1,
    TONEWRIGHT_AUDIO_SOURCE = 2,
    TONEWRIGHT_IMAGE = 4,
    TONEWRIGHT_VIDEO_FORMAT = 8,
    TONEWRIGHT_AUDIO_FORMAT = 16
} TONEWRIGHT_CodecType;

/* --- Handles ------------------------------------------------------------------------------------- */

/* A pointer to a peru::IInstanceWrapper. */
typedef struct TONEWRIGHT_HandleData* TONEWRIGHT_Handle;

/* An X window, or 0. */
typedef uintptr_t TONEWRIGHT_WindowHandle;

/* Memory layout of every handle, and of a text handle: C++ classes of the Itanium ABI. */
struct TONEWRIGHT_HandleData {
    void (*const* operations)(TONEWRIGHT_Handle handle); /* two destructors, then destroy */
};
struct TONEWRIGHT_StringHandleData {
    struct TONEWRIGHT_HandleData handle;
    const char16_t* text;
    size_t length;
};

/* Releases a handle. Null is ignored. The object is destroyed when nothing else refers to it. */
static inline void TONEWRIGHT_DestroyHandle(TONEWRIGHT_Handle handle) {
    if (handle) handle->operations[2](handle);
}

/* The text of a handle documented as a text handle: UTF-16, zero-terminated, valid until the handle is
 * destroyed. Null for a null handle. Must not be called with any other kind of handle. */
static inline const char16_t* TONEWRIGHT_GetText(TONEWRIGHT_Handle handle) {
    return handle ? ((const struct TONEWRIGHT_StringHandleData*)(const void*)handle)->text : NULL;
}

/* The number of UTF-16 units of that text, without the terminator. 0 for a null handle. */
static inline size_t TONEWRIGHT_GetTextLength(TONEWRIGHT_Handle handle) {
    return handle ? ((const struct TONEWRIGHT_StringHandleData*)(const void*)handle)->length : 0;
}

/* --- Callbacks ----------------------------------------------------------------------------------- */

/* A drive changed: the disc library's drive handle (a DISCIO_Drive of tonewright/discio2.h, valid during the
 * call) and the event (1 medium inserted, 2 medium did not become ready within 30 seconds, 3 medium ready, 4
 * medium removed). Called on the drive watcher's thread. */
typedef void (*TONEWRIGHT_DriveChangedCallback)(void* driveHandle, int32_t event);

/* Progress of a player: duration and position in seconds (0.0 once stopped) and a TONEWRIGHT_PlayerState.
 * Called at least twice a second on the thread in TONEWRIGHT_Player_Play, and on the thread in
 * TONEWRIGHT_Player_Pause; must not call the player. If it throws a C++ exception, that call fails. */
typedef void (*TONEWRIGHT_PlayerCallback)(double duration, double position, int32_t state);

/* Progress of a recording in seconds, once per block of sound. Returning false, or throwing a C++ exception,
 * ends the recording after that block. Called on the device's thread; must be quick and must not call the
 * source. */
typedef bool (*TONEWRIGHT_RecordingCallback)(double position);

/* The levels of the last recorded block, left and right, from 0.0 to 1.0. Called on the device's thread; must
 * be quick and must not call the source. If it throws a C++ exception, the recording ends with the next
 * block. */
typedef void (*TONEWRIGHT_RecordingVolumeCallback)(double first, double second);

/* Progress of an encoder, 0.0 to 1.0, and a reserved 0. Returning false stops the job, which is a normal end.
 * Called on the thread in TONEWRIGHT_AudioEncoder_Encode. If it throws a C++ exception, the job fails. */
typedef bool (*TONEWRIGHT_EncoderCallback)(double fraction, int32_t reserved);

/* A block of samples for a waveform: the source, the position of the block's last step as a fraction of the
 * duration, `count` floats from -1.0 to 1.0 (100 steps, interleaved channels) valid during the call, and the
 * callback's user data. Returning false ends the fetch. Called on the thread in
 * TONEWRIGHT_AudioSource_FetchStreamSamples. */
typedef bool (*TONEWRIGHT_SamplesCallback)(TONEWRIGHT_Handle source, double fraction, const float* samples,
                                           int32_t count, void* user);

/* Progress of a loudness measurement, 0.0 to 1.0. Returning false ends it with the result so far. Called on
 * the thread in TONEWRIGHT_INORMALIZE_processAudioSource. */
typedef bool (*TONEWRIGHT_NormalizeCallback)(double fraction);

/* An event of the cover editor's wizard: codes 1 to 7, and a value that depends on the code. Called on the
 * window thread. */
typedef void (*TONEWRIGHT_CoverEditorCallback)(int32_t code, intptr_t value);

/* --- Start-up and environment -------------------------------------------------------------------- */

/* Starts the library: media contexts and plug-in handlers. A missing plug-in is only logged. Result: 0, or 1
 * (whatever was created before the failure stays until TONEWRIGHT_DeInitAll). Must not be called from two
 * threads at once. */
TONEWRIGHT_API int32_t TONEWRIGHT_InitStartup(void);

/* Sets the cover editor's user data path to `userDataPath`, a platform path, plus "/covereditor". The other
 * arguments are ignored. Result: 0, or 1 when not started. */
TONEWRIGHT_API int32_t TONEWRIGHT_InitGui(const char16_t* a, const char16_t* b, const char16_t* c,
                                          int32_t flag, const char16_t* userDataPath, const char16_t* f);

/* Installs the crash handler for the whole process: on a fatal signal or an exception that leaves a thread it
 * writes a text report and a minidump, then calls the previously installed handlers. `application` is the
 * host's name and version, `report` the path of the report, `dump` the path of the dump without ".dmp". May
 * be called before TONEWRIGHT_InitStartup; a later call changes the names. */
TONEWRIGHT_API void TONEWRIGHT_Init_Crashhandler(const char16_t* application, const char16_t* report,
                                                 const char16_t* dump);

/* Notifies the library that the host's main window is shown. Has no effect. Result: 0. */
TONEWRIGHT_API uint8_t TONEWRIGHT_OnWindowShown(TONEWRIGHT_WindowHandle window);

/* Shuts the library down: drive watching, plug-ins, contexts and all singletons. All handles must have been
 * destroyed, and no other thread may be inside the library. Harmless when not started. */
TONEWRIGHT_API void TONEWRIGHT_DeInitAll(void);

/* Sets the language of all messages from now on: language and country, such as "en-US" or "deu-AT". Where the
 * country has no translation, that of another country in the same language is used, otherwise English. Null
 * is ignored; an unknown text is logged and leaves the language unchanged. Call it on one thread at a time;
 * other threads may use the library meanwhile. */
TONEWRIGHT_API void TONEWRIGHT_SetLanguageID(const char16_t* language);

/* Writes the feature record, exactly 9 bytes: its size as a 32-bit number (9) and five one-byte flags. A null
 * `buffer` is ignored. */
TONEWRIGHT_API void TONEWRIGHT_fillFeatures(void* buffer);

/* Creates the disc library, once, instead of with the first use of a drive or disc. `flag` has no effect.
 * Throws a C++ exception if the library is missing. */
TONEWRIGHT_API void TONEWRIGHT_InitDiscio(uint8_t flag);

/* Sets the suffix of the temporary names that a host gives to output files until they are complete, such as
 * ".part". It is removed from a name before the extension selects a format or a kind of tag, so that a tag
 * can be stored before the file has its final name. An empty text removes the suffix. Must not be called
 * while another thread creates formats or tags. */
TONEWRIGHT_API void TONEWRIGHT_SetTempExtension(const char16_t* extension);

/* Starts watching the optical drives and the folders in TONEWRIGHT_DRIVE_FOLDERS; null stops it. The callback
 * must stay valid until then. A drive that is connected later is not found before the next start of the
 * library. Call it on one thread at a time. */
TONEWRIGHT_API void TONEWRIGHT_SetDriveChangedCallback(TONEWRIGHT_DriveChangedCallback callback);

/* Adds the host's own log, a handle of a peru::ILogManager, which receives every message from now on. The
 * library holds a reference until it is removed. A bad handle is ignored.
 *
 * The log is called on whichever thread logs, the library's own threads included, by one thread at a time and
 * with locks of the library held. It must therefore return soon, must not throw, must not call the library
 * except for handles' texts, and must not wait for a thread that may be inside the library. */
TONEWRIGHT_API void TONEWRIGHT_AddProxyLogManager(TONEWRIGHT_Handle log);

/* Removes a log added with TONEWRIGHT_AddProxyLogManager; it is not called any more once this has returned.
 * An unknown log or a bad handle is ignored. */
TONEWRIGHT_API void TONEWRIGHT_RemoveProxyLogManager(TONEWRIGHT_Handle log);

/* The file extensions that can be read or written, for a mask of TONEWRIGHT_CodecType: a list handle, or null
 * when not started. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_getValidCodecExtensions(int32_t types);

/* The number of entries of that list. Bad handle: 0. */
TONEWRIGHT_API int32_t TONEWRIGHT_getExtensionCount(TONEWRIGHT_Handle extensions);

/* An entry of that list, such as "flac", as a text handle. Null for a bad handle or an index out of range. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_getExtension(TONEWRIGHT_Handle extensions, int32_t index);

/* --- Audio sources ------------------------------------------------------------------------------- */

/* A source that decodes a file to the requested format; all three numbers must be greater than 0. Each
 * plug-in for the extension is tried by actually opening the file. Result: a source, left open if
 * `keepOpened` is not 0 and closed again otherwise; null if no plug-in reads the file, with the reasons in
 * the log. Concurrent calls are serialized. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSourceFromURI(const char16_t* uri, int32_t sampleRate,
                                                                     int32_t channelCount,
                                                                     int32_t bytesPerSample,
                                                                     int32_t keepOpened);

/* A closed source that mixes the tracks described by an editor's XML; meant for 16-bit samples. Null for
 * malformed XML and for invalid numbers or URIs in it. Files are opened shortly before they are due: one that
 * cannot be read fails the call that reads the source, and the log names it. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSourceFromEditorXml(const char16_t* xml,
                                                                           int32_t sampleRate,
                                                                           int32_t channelCount,
                                                                           int32_t bytesPerSample);

/* A closed source that records from a device, a handle of a peru::media::IAudioInDevice, which it keeps
 * alive. Opening it starts the recording at time 0; closing it ends the recording. Sound is queued until it
 * is read, usually by an encoder. That job ends, with everything that was recorded, when the recording
 * callback returns false, when the device disappears, and when the device has delivered nothing for 15
 * seconds. Another thread may also close the source, which drops unread sound. Two channels are recorded and
 * converted to the requested format, of 1 to 4 bytes per sample. Null for a bad handle or a device without a
 * suitable format. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSoureFromAudioInDevice(TONEWRIGHT_Handle device,
                                                                              int32_t sampleRate,
                                                                              int32_t channelCount,
                                                                              int32_t bytesPerSample);

/* 1 if the source is open. Bad handle or failure: 0. This and the next three functions are mutually exclusive
 * across all sources and threads. */
TONEWRIGHT_API uint8_t TONEWRIGHT_AudioSource_IsOpened(TONEWRIGHT_Handle source);

/* Opens the source, from its beginning. Result: 0 or 3. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioSource_Open(TONEWRIGHT_Handle source);

/* Closes the source. Result: 0 or 3. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioSource_Close(TONEWRIGHT_Handle source);

/* The duration in seconds; for a recording the largest finite double. Bad handle or failure: -1.0. */
TONEWRIGHT_API double TONEWRIGHT_AudioSource_GetDuration(TONEWRIGHT_Handle source);

/* Sets or (null) removes the progress callback of a recording. Other sources and bad handles are ignored. */
TONEWRIGHT_API void TONEWRIGHT_AudioSource_SetRecordingCallback(TONEWRIGHT_Handle source,
                                                                TONEWRIGHT_RecordingCallback callback);

/* Sets or (null) removes the level callback of a recording. Other sources and bad handles are ignored. */
TONEWRIGHT_API void
TONEWRIGHT_AudioSource_SetRecordingVolumeCallback(TONEWRIGHT_Handle source,
                                                  TONEWRIGHT_RecordingVolumeCallback callback);

/* Reads the rest of a source for a waveform: one frame per `secondsPerStep`, in blocks of 100 steps; an
 * incomplete last block is not delivered. Opens the source if necessary and leaves it open. Result: 1 at the
 * end of the source; 0 if the callback ended it, for a bad handle, a failure, a null callback, a step below
 * one frame, or a source with other than 2 bytes per sample. */
TONEWRIGHT_API uint8_t TONEWRIGHT_AudioSource_FetchStreamSamples(TONEWRIGHT_Handle source,
                                                                 TONEWRIGHT_SamplesCallback callback,
                                                                 double secondsPerStep, void* user);

/* --- Audio formats and encoders ------------------------------------------------------------------ */

/* A closed format that writes a file of the type selected by its extension, from audio with the given
 * numbers. `quality`, from 0.0 to 1.0, is set if greater than 0.0; the bit rates, in bits per second with 0
 * for unspecified, are set if any is greater than 0. Null if no plug-in writes that type. The file is not
 * created before the format is opened. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioFormatFromURI(const char16_t* uri, int32_t sampleRate,
                                                                     int32_t channelCount,
                                                                     int32_t bytesPerSample, double quality,
                                                                     int32_t nominalBitRate,
                                                                     int32_t minBitRate, int32_t maxBitRate);

/* 1 if the format is open. Bad handle or failure: 0. */
TONEWRIGHT_API uint8_t TONEWRIGHT_AudioFormat_IsOpened(TONEWRIGHT_Handle format);

/* Starts writing. A new file is created and grows in place, so that it can be played even if the process is
 * killed; an existing file keeps its content until the format is closed. Result: 0 or 5. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioFormat_Open(TONEWRIGHT_Handle format);

/* Completes the file; an existing one is replaced as a whole, keeping its mode and links to it. Result: 0
 * or 3.
 */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioFormat_Close(TONEWRIGHT_Handle format);

/* The estimated size in bytes of a file with `duration` seconds of audio. Bad handle or failure: -1. */
TONEWRIGHT_API int64_t TONEWRIGHT_AudioFormat_GetEstiamtedFileSize(TONEWRIGHT_Handle format, double duration);

/* An encoder from a source to a format; it keeps both alive. Null for a bad handle. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioEncoder(TONEWRIGHT_Handle source,
                                                               TONEWRIGHT_Handle format);

/* Runs the whole job on the calling thread and closes source and format. Result: 0, also if the callback
 * stopped it (the file then holds what was written); 11 if the job failed, 10 for a bad handle. A failed job
 * leaves an existing target as it was and removes a new one. Jobs whose source is their own target, under any
 * name, or whose source and format differ in sample rate, channels or bytes per sample, fail before anything
 * is written. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioEncoder_Encode(TONEWRIGHT_Handle encoder);

/* Sets or (null) removes the progress callback. Any thread may do so while the job runs; a call already under
 * way still completes on the old callback. Result: 0, or 10 for a bad handle. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioEncoder_SetCallback(TONEWRIGHT_Handle encoder,
                                                           TONEWRIGHT_EncoderCallback callback);

/* --- Player -------------------------------------------------------------------------------------- */

/* A stopped player of a file on the default output device, at 44100 Hz, 2 channels, 2 bytes per sample or the
 * nearest format that the device supports. Null if the device or the file cannot be used. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreatePlayerFromURI(const char16_t* uri);

/* A stopped player of a source, in the source's own format: nothing is converted, so the device must support
 * that format. The source must not be used otherwise while it plays. Null as above or for a bad handle. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreatePlayerFromAudioSource(TONEWRIGHT_Handle source);

/* All player functions may be called from any thread at any time. The player stays alive while one runs, even
 * if its handle is destroyed meanwhile; destroying the last handle ends the sound. */

/* Plays from the beginning. Returns at the end, with the source closed again, or after a stop from another
 * thread. A source that was already open when the player was created is first played from its current
 * position. Up to half a minute of sound is read ahead. Result: 0; 9 after a failure of source, device or
 * callback. While another thread plays this player, returns 9 at once and does not disturb it. */
TONEWRIGHT_API int32_t TONEWRIGHT_Player_Play(TONEWRIGHT_Handle player);

/* Pauses or resumes; called from another thread while TONEWRIGHT_Player_Play runs. If nothing is playing it
 * starts the device, and nothing is heard. Result: 0 or 9. */
TONEWRIGHT_API int32_t TONEWRIGHT_Player_Pause(TONEWRIGHT_Handle player);

/* Stops and waits until TONEWRIGHT_Player_Play, on another thread, has finished, which usually takes half a
 * second. Result: 0, at once if nothing is playing; 9 if it has not finished within 10 seconds, which is also
 * the result of the first stop after TONEWRIGHT_Player_Play has failed during playback. */
TONEWRIGHT_API int32_t TONEWRIGHT_Player_Stop(TONEWRIGHT_Handle player);

/* Sets or (null) removes the progress callback. A call already under way still completes on the old callback.
 * Result: 0, or 9 for a bad handle. */
TONEWRIGHT_API int32_t TONEWRIGHT_Player_SetCallback(TONEWRIGHT_Handle player,
                                                     TONEWRIGHT_PlayerCallback callback);

/* --- File tags ----------------------------------------------------------------------------------- */

/* The tag of an audio file, read immediately: mp3, wav, flac, ogg, wma or asf by extension, ignoring case.
 * Null, with nothing in the log, for any other extension; null with the reason in the log for a file that
 * cannot be read or whose content does not match its extension. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateFileTag(const char16_t* uri);

/* Writes the changed tag to its file atomically; all other content of the file is kept. The tag cannot be
 * stored again: create a new one for that. Result: 0, or 8 with the file unchanged. */
TONEWRIGHT_API int32_t TONEWRIGHT_StoreFileTag(TONEWRIGHT_Handle tag);

/* A field of a tag as a text handle, with an empty text if the tag does not have it. Bad handle or failure:
 * null. Track number and year are texts too, such as "3/12" and "1999-04-01", and are not parsed. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetArtist(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetAlbumArtist(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetTitle(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetAlbum(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetTrackNumber(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetYear(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetGenre(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetComment(TONEWRIGHT_Handle tag);

/* Changes a field in memory; an empty text, or null, removes it. A kind of tag that cannot store the field
 * (album and album artist in wav) ignores it, and its getter stays empty. A bad handle is ignored. */
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetArtist(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetAlbumArtist(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetTitle(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetAlbum(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetTrackNumber(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetYear(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetGenre(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetComment(TONEWRIGHT_Handle tag, const char16_t* text);

/* --- Disc projects ------------------------------------------------------------------------------- */

/* Projects are created with TONEWRIGHT_Host_CreateAudioCDProject and ..._CreateDataDiscProject (host.h), and
 * written with the functions of discio2.h. One thread at a time for a project. */

/* Inserts a source before the track at `place` of an audio CD project, counted from 0; -1 appends it. The
 * source must deliver 16-bit stereo at 44100 Hz. The project keeps it alive and reads it, from its beginning,
 * whenever the project is written or the track is read; it must not be used otherwise. A source that ends
 * before its duration is continued with silence. Result: 0; 3 for a bad source; 4 for a bad project or if the
 * project refuses the track. Also 0, without a track, if the source cannot be opened: that is only visible in
 * the log and the last failure. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(TONEWRIGHT_Handle project,
                                                                         TONEWRIGHT_Handle source,
                                                                         int32_t place);

/* Adds the file with that URI to a data disc project. `discPath` is its path on the disc, such as
 * u"Music/Song.flac", as URI text: "%", "?" and "#" in names are escaped. Missing folders of the path are
 * created. The file is read when the project is written. Result: 0 or 7. */
TONEWRIGHT_API int32_t TONEWRIGHT_DataDiscProject_AddFileFromAudioSource(TONEWRIGHT_Handle project,
                                                                         const char16_t* discPath,
                                                                         const char16_t* sourceUri);

/* --- Normalization ------------------------------------------------------------------------------- */

/* Measures the integrated loudness (EBU R 128) of a source from its current position and returns the gain, as
 * a factor, that brings it to `targetLevel` LUFS; 1.0 for silence. Opens the source if necessary and leaves
 * it open. If the callback, which may be null, returns false, the measurement ends early with the gain of the
 * part measured. Bad handle: 3.0, also a possible gain. Failure: 0.0. */
TONEWRIGHT_API double TONEWRIGHT_INORMALIZE_processAudioSource(TONEWRIGHT_Handle source, double targetLevel,
                                                               TONEWRIGHT_NormalizeCallback callback);

/* --- Cover editor -------------------------------------------------------------------------------- */
/* One editor at a time; all calls on the host's window thread. */

/* Creates the editor in a child window of `parent`. Result: the child window, which the host positions, or 0.
 * The callback may be null. The first call loads the cover editor's module, which is a package of its own;
 * if it is missing or of another version, that is the last failure. */
TONEWRIGHT_API TONEWRIGHT_WindowHandle TONEWRIGHT_CreateCoverEditorHandle(
    TONEWRIGHT_WindowHandle parent, const char16_t* userDataPath, TONEWRIGHT_CoverEditorCallback callback);

/* Destroys the editor and its window; the argument is ignored. Harmless without an editor. */
TONEWRIGHT_API void TONEWRIGHT_ReleaseCoverEditorHandle(TONEWRIGHT_WindowHandle window);

/* Starts a new project; `value` is passed to the wizard. False without an editor or on failure, as for the
 * next five functions. */
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_NewProject(int32_t value);
/* Go to the next or previous page of the wizard; true on success. */
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoNextPage(void);
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoPrevPage(void);
/* Whether the page is complete. */
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_CanGotoNextPage(void);
/* The current position of the wizard. */
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_IsLastPage(void);
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_IsFirstPage(void);
/* The number of pages, and the zero-based index of the current one. 0 without an editor or on failure. */
TONEWRIGHT_API int32_t TONEWRIGHT_EMBEDDEDCOVEREDITOR_GetTotalPageCount(void);
TONEWRIGHT_API int32_t TONEWRIGHT_EMBEDDEDCOVEREDITOR_GetCurrentPageIndex(void);

/* Sets the background color behind the pages, each component from 0 to 255. Ignored without an editor. */
TONEWRIGHT_API void TONEWRIGHT_EMBEDDEDCOVEREDITOR_SetBackgroundColor(int32_t red, int32_t green,
                                                                      int32_t blue);
/* Shows the help of the current page. Ignored without an editor. */
TONEWRIGHT_API void TONEWRIGHT_EMBEDDEDCOVEREDITOR_ShowHelp(void);
/* Runs the editor's pending events; call it when the host is idle. Ignored without an editor. */
TONEWRIGHT_API void TONEWRIGHT_EMBEDDEDCOVEREDITOR_Idle(void);

#ifdef __cplusplus
} /* extern "C" */
#endif

#endif
