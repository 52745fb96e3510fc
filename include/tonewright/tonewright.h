/*
 * The whole interface of libtonewright: 73 functions, C11 and C++.
 *
 * Calling order. TONEWRIGHT_Init_Crashhandler may come before everything. TONEWRIGHT_InitStartup is first;
 * then, in any order, TONEWRIGHT_InitDiscio, TONEWRIGHT_InitGui, TONEWRIGHT_SetLanguageID,
 * TONEWRIGHT_SetTempExtension and the callbacks; then the object functions; TONEWRIGHT_DeInitAll is last.
 * A function that needs the started library gives its failure value before InitStartup and after DeInitAll,
 * and the library can then be started again.
 *
 * Text is zero-terminated UTF-16. Arguments are read during the call only; a null text is an empty one
 * unless told otherwise. A URI argument is a complete URI such as "file:///home/me/a%20song.flac".
 *
 * Handles. A handle that a function returns belongs to the caller, who ends it with TONEWRIGHT_DestroyHandle;
 * no other function consumes it. It keeps its object alive; objects that are made of others (an encoder of
 * its source and format) keep those alive themselves. All handles must be destroyed before
 * TONEWRIGHT_DeInitAll. A null handle, or one of another kind, is no error of memory: the function gives
 * the value told for a bad handle.
 *
 * Failures. No C++ exception leaves a function, except where it says so. The reason of a failure goes to
 * the log at its severest level and to standard error; a host sees it by adding a log of its own with
 * TONEWRIGHT_AddProxyLogManager.
 *
 * Threads. Any thread may call, one thread at a time for one object; what differs says so.
 *
 * Units. Time is in seconds; sample rates are frames per second, a frame being one sample of every channel;
 * samples are little-endian interleaved PCM, 1 byte unsigned or 2 to 4 bytes signed.
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

/* What status results mean. Every family has its own code and no other. */
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

/* States that a player reports. */
typedef enum TONEWRIGHT_PlayerState {
    TONEWRIGHT_PLAYER_PLAYING = 0,
    TONEWRIGHT_PLAYER_PAUSED = 1,
    TONEWRIGHT_PLAYER_STOPPED = 2
} TONEWRIGHT_PlayerState;

/* Kinds of media, bits of TONEWRIGHT_getValidCodecExtensions. */
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

/* How the library lays out every handle, and one that holds a text. C++ classes of the Itanium ABI. */
struct TONEWRIGHT_HandleData {
    void (*const* operations)(TONEWRIGHT_Handle handle); /* two destructors, then destroy */
};
struct TONEWRIGHT_StringHandleData {
    struct TONEWRIGHT_HandleData handle;
    const char16_t* text;
    size_t length;
};

/* Ends a handle. Null is ignored. The object goes when nothing else holds it. */
static inline void TONEWRIGHT_DestroyHandle(TONEWRIGHT_Handle handle) {
    if (handle) handle->operations[2](handle);
}

/* The text of a handle that a function described as a text handle returned: UTF-16, zero-terminated, valid
 * until the handle is destroyed. Null for a null handle. Any other kind of handle must not be passed. */
static inline const char16_t* TONEWRIGHT_GetText(TONEWRIGHT_Handle handle) {
    return handle ? ((const struct TONEWRIGHT_StringHandleData*)(const void*)handle)->text : NULL;
}

/* The number of UTF-16 units of that text, without the terminator. 0 for a null handle. */
static inline size_t TONEWRIGHT_GetTextLength(TONEWRIGHT_Handle handle) {
    return handle ? ((const struct TONEWRIGHT_StringHandleData*)(const void*)handle)->length : 0;
}

/* --- Callbacks ----------------------------------------------------------------------------------- */

/* A drive changed: the disc library's handle of the drive and what happened (1 a medium arrives, 2 it never
 * got ready, 3 it is ready, 4 it was removed). Called on the drive watcher's thread. */
typedef void (*TONEWRIGHT_DriveChangedCallback)(void* driveHandle, int32_t event);

/* Progress of a player: duration and position in seconds (0.0 once stopped) and a TONEWRIGHT_PlayerState.
 * Called on the thread in TONEWRIGHT_Player_Play, at least twice a second, and on the one in _Pause; must not
 * call the player. A C++ exception from it ends the playing, or the pause, as a failed one. */
typedef void (*TONEWRIGHT_PlayerCallback)(double duration, double position, int32_t state);

/* Progress of a recording in seconds, once for every block of sound; false ends the recording after that
 * block, and so does a C++ exception. Called on the device's thread. Must be quick and must not call the
 * source. */
typedef bool (*TONEWRIGHT_RecordingCallback)(double position);

/* The levels of the last recorded block, left and right from 0.0 to 1.0. Called on the device's thread. Must
 * be quick and must not call the source; a C++ exception from it ends the recording with the next block. */
typedef void (*TONEWRIGHT_RecordingVolumeCallback)(double first, double second);

/* Progress of an encoder, 0.0 to 1.0, and a reserved 0; false asks it to stop, which is a normal end. Called
 * on the thread in TONEWRIGHT_AudioEncoder_Encode. A C++ exception from it ends the job as a failed one. */
typedef bool (*TONEWRIGHT_EncoderCallback)(double fraction, int32_t reserved);

/* A block of samples for a wave-form: the source, the fraction of the duration where the block's last step
 * stands, `count` floats from -1.0 to 1.0 (100 steps, interleaved channels) valid during the call, and the
 * caller's word. False ends the fetch. Called on the thread in TONEWRIGHT_AudioSource_FetchStreamSamples. */
typedef bool (*TONEWRIGHT_SamplesCallback)(TONEWRIGHT_Handle source, double fraction, const float* samples,
                                           int32_t count, void* user);

/* Progress of a loudness measurement, 0.0 to 1.0; false ends it with what was measured so far. Called on the
 * thread in TONEWRIGHT_INORMALIZE_processAudioSource. */
typedef bool (*TONEWRIGHT_NormalizeCallback)(double fraction);

/* An event of the cover editor's wizard: codes 1 to 7, and a value that depends on the code. Called on the
 * window thread. */
typedef void (*TONEWRIGHT_CoverEditorCallback)(int32_t code, intptr_t value);

/* --- Start-up and environment -------------------------------------------------------------------- */

/* Starts the library: media contexts and plug-in handlers. A plug-in that is missing costs a line of the log.
 * Result: 0, or 1 (what was made before the failure stays until TONEWRIGHT_DeInitAll).
 * Not to be called from two threads at once. */
TONEWRIGHT_API int32_t TONEWRIGHT_InitStartup(void);

/* Sets the cover editor's user data path: "/covereditor" below `userDataPath`, a platform path. The other
 * arguments are accepted for the host's convenience and not used. Result: 0, or 1 when not started. */
TONEWRIGHT_API int32_t TONEWRIGHT_InitGui(const char16_t* a, const char16_t* b, const char16_t* c,
                                          int32_t flag, const char16_t* userDataPath, const char16_t* f);

/* Installs the crash handler for the whole process: on a fatal signal or an exception that leaves a thread it
 * writes a text report and a minidump, then goes on to the handlers that stood before. `application` is the
 * host's name and version, `report` the path of the report, `dump` that of the dump without its ".dmp". May
 * be called before TONEWRIGHT_InitStartup; another call changes the names. */
TONEWRIGHT_API void TONEWRIGHT_Init_Crashhandler(const char16_t* application, const char16_t* report,
                                                 const char16_t* dump);

/* Tells that the host's main window is shown. No effect. Result: 0. */
TONEWRIGHT_API uint8_t TONEWRIGHT_OnWindowShown(TONEWRIGHT_WindowHandle window);

/* Ends the library: drive watching, plug-ins, contexts and every singleton. All handles must have been
 * destroyed, and no other thread may be inside the library. Harmless when not started. */
TONEWRIGHT_API void TONEWRIGHT_DeInitAll(void);

/* Sets the language of the interface: language and country, as "en-US" or "deu-AT". Null is ignored; an
 * unknown text is logged and leaves the language as it was. */
TONEWRIGHT_API void TONEWRIGHT_SetLanguageID(const char16_t* language);

/* Writes the feature record: its size as a 32-bit number, which is 9, and five flags of one byte. `buffer`
 * takes exactly 9 bytes; null is ignored. */
TONEWRIGHT_API void TONEWRIGHT_fillFeatures(void* buffer);

/* Makes the disc library, once; `flag` is handed to it. Needed before drives and discs. Without
 * one it logs a line and does nothing. */
TONEWRIGHT_API void TONEWRIGHT_InitDiscio(uint8_t flag);

/* Sets the ending of the temporary names under which a host has output files written until they are
 * complete, such as ".part": it is cut off a name before the extension selects a format or a kind of tag, so
 * that a tag can be stored before the file has its final name. Empty ends that. Not to be called while
 * another thread makes formats or tags. */
TONEWRIGHT_API void TONEWRIGHT_SetTempExtension(const char16_t* extension);

/* Watches the optical drives, or stops that with null. The callback must stay valid until then. */
TONEWRIGHT_API void TONEWRIGHT_SetDriveChangedCallback(TONEWRIGHT_DriveChangedCallback callback);

/* Adds the host's own log, a handle around a peru::ILogManager: from now on it gets every message. The
 * library keeps a reference until it is removed. A bad handle is ignored. */
TONEWRIGHT_API void TONEWRIGHT_AddProxyLogManager(TONEWRIGHT_Handle log);

/* Removes it again. An unknown log or a bad handle is ignored. */
TONEWRIGHT_API void TONEWRIGHT_RemoveProxyLogManager(TONEWRIGHT_Handle log);

/* The file extensions that can be read, for a mask of TONEWRIGHT_CodecType: a handle of a list, or null when
 * not started. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_getValidCodecExtensions(int32_t types);

/* The number of entries of that list. Bad handle: 0. */
TONEWRIGHT_API int32_t TONEWRIGHT_getExtensionCount(TONEWRIGHT_Handle extensions);

/* An entry of that list, such as "flac": a text handle. Null for a bad handle or an index outside the list.
 */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_getExtension(TONEWRIGHT_Handle extensions, int32_t index);

/* --- Audio sources ------------------------------------------------------------------------------- */

/* A source that decodes a file to the wanted format; all three numbers must be greater than 0. Each plug-in
 * for the extension is tried by really opening the file. Result: a source, left open when `keepOpened` is
 * not 0 and else closed again; null when no plug-in reads the file, with the reasons in the log. Calls of
 * several threads wait for each other. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSourceFromURI(const char16_t* uri, int32_t sampleRate,
                                                                     int32_t channelCount,
                                                                     int32_t bytesPerSample,
                                                                     int32_t keepOpened);

/* A closed source that mixes the track list told by an editor's XML, 16-bit samples as a rule. Null for a
 * text that is no XML, and for numbers or URIs in it that are none. Files are opened when their time comes:
 * one that cannot be read fails the call that reads the source, and the log tells which one it is. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSourceFromEditorXml(const char16_t* xml,
                                                                           int32_t sampleRate,
                                                                           int32_t channelCount,
                                                                           int32_t bytesPerSample);

/* A closed source that records from a device, a handle around a peru::media::IAudioInDevice, which it keeps
 * alive. Opening it starts the recording, at time 0, and closing it ends it. What the device delivers is kept
 * until it is read, by an encoder as a rule: that job ends, with all that was recorded, when the recording
 * callback answers false, when the device has gone, and when it has delivered nothing for 15 seconds. Another
 * thread may also close the source, which drops what was not read yet. Two channels are recorded and
 * converted to what is wanted; where anything has to be converted the source can have 1 or 2 bytes per
 * sample. Null for a bad handle or a device that has no fitting format. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSoureFromAudioInDevice(TONEWRIGHT_Handle device,
                                                                              int32_t sampleRate,
                                                                              int32_t channelCount,
                                                                              int32_t bytesPerSample);

/* 1 when the source is open. Bad handle or failure: 0. This and the next three functions exclude each other
 * over all sources and threads. */
TONEWRIGHT_API uint8_t TONEWRIGHT_AudioSource_IsOpened(TONEWRIGHT_Handle source);

/* Opens the source, from its beginning. Result: 0 or 3. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioSource_Open(TONEWRIGHT_Handle source);

/* Closes the source. Result: 0 or 3. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioSource_Close(TONEWRIGHT_Handle source);

/* The duration in seconds; of a recording the greatest finite double. Bad handle or failure: -1.0. */
TONEWRIGHT_API double TONEWRIGHT_AudioSource_GetDuration(TONEWRIGHT_Handle source);

/* Sets or (null) removes the progress callback of a recording. Other sources and bad handles are ignored. */
TONEWRIGHT_API void TONEWRIGHT_AudioSource_SetRecordingCallback(TONEWRIGHT_Handle source,
                                                                TONEWRIGHT_RecordingCallback callback);

/* Sets or (null) removes the level callback of a recording. Other sources and bad handles are ignored. */
TONEWRIGHT_API void
TONEWRIGHT_AudioSource_SetRecordingVolumeCallback(TONEWRIGHT_Handle source,
                                                  TONEWRIGHT_RecordingVolumeCallback callback);

/* Reads the rest of a source for a wave-form: one frame of every `secondsPerStep`, in blocks of 100 steps;
 * the steps of a last incomplete block are not delivered. Opens the source where needed and leaves it open.
 * Result: 1 when the end was reached; 0 when the callback ended it, for a bad handle, a failure, a null
 * callback, a step below one frame, or a source of other than 2 bytes per sample. */
TONEWRIGHT_API uint8_t TONEWRIGHT_AudioSource_FetchStreamSamples(TONEWRIGHT_Handle source,
                                                                 TONEWRIGHT_SamplesCallback callback,
                                                                 double secondsPerStep, void* user);

/* --- Audio formats and encoders ------------------------------------------------------------------ */

/* A closed format that writes a file of the kind that its extension tells, from audio of the given numbers.
 * `quality` from 0.0 to 1.0 is set when greater than 0.0; the bit rates, in bits per second with 0 for open,
 * are set when one is greater than 0. Null when no plug-in writes that kind. No file is made before it is
 * opened. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioFormatFromURI(const char16_t* uri, int32_t sampleRate,
                                                                     int32_t channelCount,
                                                                     int32_t bytesPerSample, double quality,
                                                                     int32_t nominalBitRate,
                                                                     int32_t minBitRate, int32_t maxBitRate);

/* 1 when the format is open. Bad handle or failure: 0. */
TONEWRIGHT_API uint8_t TONEWRIGHT_AudioFormat_IsOpened(TONEWRIGHT_Handle format);

/* Makes the file. Result: 0 or 5. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioFormat_Open(TONEWRIGHT_Handle format);

/* Finishes the file. Result: 0 or 3. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioFormat_Close(TONEWRIGHT_Handle format);

/* The expected size in bytes of a file with `duration` seconds of audio. Bad handle or failure: -1. */
TONEWRIGHT_API int64_t TONEWRIGHT_AudioFormat_GetEstiamtedFileSize(TONEWRIGHT_Handle format, double duration);

/* An encoder from a source to a format, both of which it keeps alive. Null for a bad handle. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateAudioEncoder(TONEWRIGHT_Handle source,
                                                               TONEWRIGHT_Handle format);

/* Runs the whole job on the calling thread and closes both ends. Result: 0, also when the callback stopped it
 * (the file then holds what was written); 11 when the job failed, 10 for a bad handle. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioEncoder_Encode(TONEWRIGHT_Handle encoder);

/* Sets or (null) removes the progress callback; any thread may do so while the job runs, and a call already
 * under way still ends on the old one. Result: 0, or 10 for a bad handle. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioEncoder_SetCallback(TONEWRIGHT_Handle encoder,
                                                           TONEWRIGHT_EncoderCallback callback);

/* --- Player -------------------------------------------------------------------------------------- */

/* A stopped player of a file on the default output device, at 44100 Hz, 2 channels, 2 bytes per sample or the
 * nearest that the device takes. Null when the device or the file does not serve. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreatePlayerFromURI(const char16_t* uri);

/* A stopped player of a source, in the source's own format: nothing is converted, and a device that does not
 * take that format does not serve. Nobody else may use the source while it plays. Null as above or for a bad
 * handle. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreatePlayerFromAudioSource(TONEWRIGHT_Handle source);

/* All functions of a player may be called by any thread at any time. The player stays alive while one runs,
 * also when its handle is destroyed meanwhile; destroying the last one ends the sound. */

/* Plays from the beginning; returns at the end, when the source is closed again, or after a stop from another
 * thread. A source that was open when it was handed in is played from where it stands the first time. Up to
 * half a minute of sound is read ahead. Result: 0; 9 after a failure of source, device or callback, and at
 * once, with nothing disturbed, while another thread plays this player. */
TONEWRIGHT_API int32_t TONEWRIGHT_Player_Play(TONEWRIGHT_Handle player);

/* Pauses or goes on, for another thread while TONEWRIGHT_Player_Play runs. Without a playing thread it starts
 * the device, and nothing is heard. Result: 0 or 9. */
TONEWRIGHT_API int32_t TONEWRIGHT_Player_Pause(TONEWRIGHT_Handle player);

/* Stops and waits until TONEWRIGHT_Player_Play, in another thread, has ended its work, which takes half a
 * second as a rule. Result: 0, at once where nothing plays; 9 when it has not ended in 10 seconds, which is
 * also what comes of the first stop after TONEWRIGHT_Player_Play has failed while it played. */
TONEWRIGHT_API int32_t TONEWRIGHT_Player_Stop(TONEWRIGHT_Handle player);

/* Sets or (null) removes the progress callback; a call already under way still ends on the old one. Result:
 * 0, or 9 for a bad handle. */
TONEWRIGHT_API int32_t TONEWRIGHT_Player_SetCallback(TONEWRIGHT_Handle player,
                                                     TONEWRIGHT_PlayerCallback callback);

/* --- File tags ----------------------------------------------------------------------------------- */

/* The tag of an audio file, read at once: mp3, wav, flac, ogg, wma or asf by the name's extension in any
 * case. Null, with nothing in the log, for any other extension; null with the reason in the log for a file
 * that cannot be read or whose content does not fit its extension. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_CreateFileTag(const char16_t* uri);

/* Writes the changed tag to its file, which is then the new one, whole; other content of the file stays. The
 * handle is used up: another store needs a tag that was made anew. Result: 0, or 8 with the file as it was.
 */
TONEWRIGHT_API int32_t TONEWRIGHT_StoreFileTag(TONEWRIGHT_Handle tag);

/* A field of a tag: a text handle, with an empty text where the tag has none. Bad handle or failure: null.
 * Track number and year are texts too, such as "3/12" and "1999-04-01"; nothing parses them. */
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetArtist(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetAlbumArtist(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetTitle(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetAlbum(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetTrackNumber(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetYear(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetGenre(TONEWRIGHT_Handle tag);
TONEWRIGHT_API TONEWRIGHT_Handle TONEWRIGHT_FileTag_GetComment(TONEWRIGHT_Handle tag);

/* Changes a field in memory; an empty text, or null, removes it. A kind of tag that does not have the field
 * (album and album artist in wav) ignores it: its getter stays empty. A bad handle is ignored. */
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetArtist(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetAlbumArtist(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetTitle(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetAlbum(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetTrackNumber(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetYear(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetGenre(TONEWRIGHT_Handle tag, const char16_t* text);
TONEWRIGHT_API void TONEWRIGHT_FileTag_SetComment(TONEWRIGHT_Handle tag, const char16_t* text);

/* --- Disc projects ------------------------------------------------------------------------------- */

/* Adds a source as the track at `place` of an audio CD project, a handle around a
 * disciopp::CAudioCDDiscProject, which keeps the source alive. Result: 0; 3 for a bad source; 4 for a bad
 * project or when the project refuses. After an exception 0 too: look at the log. */
TONEWRIGHT_API int32_t TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(TONEWRIGHT_Handle project,
                                                                         TONEWRIGHT_Handle source,
                                                                         int32_t place);

/* Adds a file, told by its URI, under a path of a data disc project, a handle around a
 * disciopp::CDataDiscProject; folders on the way are made. Result: 0 or 7. */
TONEWRIGHT_API int32_t TONEWRIGHT_DataDiscProject_AddFileFromAudioSource(TONEWRIGHT_Handle project,
                                                                         const char16_t* discPath,
                                                                         const char16_t* sourceUri);

/* --- Normalization ------------------------------------------------------------------------------- */

/* Measures a source from where it stands and tells the gain, as a factor, that brings it to `targetLevel`
 * decibels. Opens the source where needed and leaves it open. A false result of the callback ends the
 * measurement early, with the gain of what was measured. Bad handle: 3.0. Failure: 0.0. */
TONEWRIGHT_API double TONEWRIGHT_INORMALIZE_processAudioSource(TONEWRIGHT_Handle source, double targetLevel,
                                                               TONEWRIGHT_NormalizeCallback callback);

/* --- Cover editor -------------------------------------------------------------------------------- */
/* One editor at a time; everything on the host's window thread. */

/* Makes the editor in a child window of `parent`; the text is the user data path. Result: the child window,
 * which the host places, or 0. The callback may be null. */
TONEWRIGHT_API TONEWRIGHT_WindowHandle TONEWRIGHT_CreateCoverEditorHandle(
    TONEWRIGHT_WindowHandle parent, const char16_t* userDataPath, TONEWRIGHT_CoverEditorCallback callback);

/* Ends the editor and its window; the argument is not read. Harmless without an editor. */
TONEWRIGHT_API void TONEWRIGHT_ReleaseCoverEditorHandle(TONEWRIGHT_WindowHandle window);

/* Starts a new project; `value` is handed on to the wizard. False without an editor or on failure, as in the
 * next five. */
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_NewProject(int32_t value);
/* Go to the neighbouring page of the wizard: true when it did. */
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoNextPage(void);
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoPrevPage(void);
/* Whether the page is complete. */
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_CanGotoNextPage(void);
/* Where the wizard stands. */
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_IsLastPage(void);
TONEWRIGHT_API bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_IsFirstPage(void);
/* The number of pages, and the index of the current one from 0. 0 without an editor or on failure. */
TONEWRIGHT_API int32_t TONEWRIGHT_EMBEDDEDCOVEREDITOR_GetTotalPageCount(void);
TONEWRIGHT_API int32_t TONEWRIGHT_EMBEDDEDCOVEREDITOR_GetCurrentPageIndex(void);

/* The background behind the pages, each part from 0 to 255. Ignored without an editor. */
TONEWRIGHT_API void TONEWRIGHT_EMBEDDEDCOVEREDITOR_SetBackgroundColor(int32_t red, int32_t green,
                                                                      int32_t blue);
/* Shows the help of the current page. Ignored without an editor. */
TONEWRIGHT_API void TONEWRIGHT_EMBEDDEDCOVEREDITOR_ShowHelp(void);
/* Runs the editor's pending events; to be called from the host's idle time. Ignored without an editor. */
TONEWRIGHT_API void TONEWRIGHT_EMBEDDEDCOVEREDITOR_Idle(void);

#ifdef __cplusplus
} /* extern "C" */
#endif

#endif
