/*
 * Drives and discs: the interface of libdiscio2, C11 and C++.
 *
 * Conventions. Functions that return int32_t return 1 on success unless stated otherwise; pointers are null
 * on failure. The reason of a failure is then available from DISCIO_GetLastError on the same thread. A null
 * or wrong handle fails with DISCIO_ERROR_INVALID_PARAM. Texts are UTF-16, end with a zero and belong to the
 * handle they were read from: they stay valid until it is released, or until the same function is called with
 * it again. Every handle may be used by one thread at a time; different handles are independent of each
 * other. Handles may be released in any order. Indices count from 0. Blocks are CD sectors, 75 per second;
 * for audio each has 588 frames of 16-bit stereo at 44100 Hz.
 */
#ifndef TONEWRIGHT_DISCIO2_H
#define TONEWRIGHT_DISCIO2_H

#include <stdint.h>
#ifndef __cplusplus
#include <uchar.h>
#endif

#define DISCIO_API __attribute__((visibility("default")))

#ifdef __cplusplus
extern "C" {
#endif

/* The drives that were found. Like all handles, released with DISCIO_Release. */
typedef struct DISCIO_Library DISCIO_Library;
/* A drive, with or without a medium. */
typedef struct DISCIO_Drive DISCIO_Drive;
/* A medium, with the table of contents that was read when it was opened. */
typedef struct DISCIO_Disc DISCIO_Disc;
/* A position in the files of a data disc. */
typedef struct DISCIO_DataCursor DISCIO_DataCursor;

/* --- Library ---------------------------------------------------------------------------------------------
 */

/* The version of this interface, for DISCIO_CreateEx. */
enum { DISCIO_API_VERSION = 1 };

/* The codes of failures. */
enum {
    DISCIO_ERROR_NONE = 0,
    DISCIO_ERROR_INTERNAL = 1,
    DISCIO_ERROR_UNSUPPORTED_API_VERSION = 2,
    DISCIO_ERROR_OUT_OF_MEMORY = 3,
    DISCIO_ERROR_INVALID_PARAM = 4,
    DISCIO_ERROR_NO_SUCH_OBJECT = 5,
    DISCIO_ERROR_NOT_FOUND = 6,
    DISCIO_ERROR_NOT_SUPPORTED = 7,
    DISCIO_ERROR_NOT_A_FILE = 10,
    DISCIO_ERROR_NOT_A_FOLDER = 11,
    DISCIO_ERROR_UNSUPPORTED_FORMAT = 12,
    DISCIO_ERROR_NOT_PREPARED = 13,
    DISCIO_ERROR_DEVICE = 15,
    DISCIO_ERROR_NO_DISC = 18,
    DISCIO_ERROR_DISC_NOT_VIRTUAL = 19,
    DISCIO_ERROR_DISC_LOST = 22,
    DISCIO_ERROR_DISC_EMPTY = 24,
    DISCIO_ERROR_NO_DATA = 26,
    DISCIO_ERROR_NO_AUDIO = 27,
    DISCIO_ERROR_READ_INPUT = 34,
    DISCIO_ERROR_STREAM_NOT_OPEN = 36,
    DISCIO_ERROR_BROKEN_FILE_SYSTEM = 38
};

/* What DISCIO_CreateEx works on. */
typedef struct DISCIO_Options {
    uint32_t size;         /* of this structure */
    uint32_t flags;        /* 0 */
    const char16_t* image; /* path of a disc image that is the only drive, always with a medium; null for the
                              drives of the machine */
} DISCIO_Options;

/* The drives of the machine: optical drives, and the folders in TONEWRIGHT_DRIVE_FOLDERS (absolute paths,
 * separated by colons), whose first disc image in alphabetical order is their medium. No drive is touched. */
DISCIO_API DISCIO_Library* DISCIO_Create(void);
DISCIO_API DISCIO_Library* DISCIO_CreateEx(uint32_t apiVersion, const DISCIO_Options* options);
/* Releases a handle of any kind. */
DISCIO_API int32_t DISCIO_Release(void* handle);
/* The code of the last failure on this thread; a successful call leaves it unchanged. `library` may be null.
 */
DISCIO_API int32_t DISCIO_GetLastError(DISCIO_Library* library);
/* The English text of a code. For the last failure on this thread with its details. Valid until the next call
 * on this thread. */
DISCIO_API const char16_t* DISCIO_GetErrorMessageW(DISCIO_Library* library, int32_t code);

/* --- Drives ----------------------------------------------------------------------------------------------
 */

/* Searches the machine, once; later calls change nothing. */
DISCIO_API int32_t DISCIO_EnumerateDrives(DISCIO_Library* library);
DISCIO_API int32_t DISCIO_GetDriveCount(DISCIO_Library* library);
DISCIO_API DISCIO_Drive* DISCIO_OpenDrive(DISCIO_Library* library, int32_t index);
/* Whether a usable medium is in the drive: waits for one that is getting ready for at most that many
 * milliseconds. `flags` is 0. */
DISCIO_API int32_t DISCIO_DriveCheckDisc(DISCIO_Drive* drive, int32_t milliseconds, int32_t flags);
/* Reads the table of contents. Fails with DISCIO_ERROR_NO_DISC if there is no medium. */
DISCIO_API DISCIO_Disc* DISCIO_DriveOpenDisc(DISCIO_Drive* drive);
DISCIO_API int32_t DISCIO_DriveOpenTray(DISCIO_Drive* drive);
DISCIO_API int32_t DISCIO_DriveCloseTray(DISCIO_Drive* drive);
DISCIO_API const char16_t* DISCIO_DriveGetNameW(DISCIO_Drive* drive); /* vendor and model */
/* Such as "/dev/sr0"; the folder of a folder drive, the file of an image. */
DISCIO_API const char16_t* DISCIO_DriveGetPathW(DISCIO_Drive* drive);
DISCIO_API const char16_t* DISCIO_DriveGetRevisionW(DISCIO_Drive* drive); /* of the firmware; may be empty */
DISCIO_API const char16_t* DISCIO_DriveGetDriverDescriptionW(DISCIO_Drive* drive);
/* In multiples of the speed of playing, fastest first, ended by 0; null if unknown. */
DISCIO_API const double* DISCIO_DriveGetReadSpeedList(DISCIO_Drive* drive);

/* --- Discs -----------------------------------------------------------------------------------------------
 */

/* 0 none, 1 CD-ROM, 2 CD-R, 3 CD-RW, 4 DVD-ROM, 5 DVD-RAM, 6 DVD-R, 7 DVD-RW, 8 DVD+R, 9 DVD+RW, 10 DVD+R DL,
 * 11 DVD-R DL, 12 BD-ROM, 13 BD-R, 14 BD-RE, -1 unknown or a failure. */
DISCIO_API int32_t DISCIO_DiscGetMediumType(DISCIO_Disc* disc);
/* These are 1 for yes and 0 for no. */
DISCIO_API int32_t DISCIO_DiscIsEmpty(DISCIO_Disc* disc);
DISCIO_API int32_t DISCIO_DiscIsErasable(DISCIO_Disc* disc);
DISCIO_API int32_t DISCIO_DiscIsVirtual(DISCIO_Disc* disc);
DISCIO_API int32_t DISCIO_DiscIsWritable(DISCIO_Disc* disc);
DISCIO_API int32_t DISCIO_DiscHasAudioComponent(DISCIO_Disc* disc);
DISCIO_API int32_t DISCIO_DiscHasDataComponent(DISCIO_Disc* disc);
/* Of the whole medium with 2048 bytes per block; -1 for a failure. */
DISCIO_API int64_t DISCIO_DiscGetCapacityBytes(DISCIO_Disc* disc);
/* From 0.0 to 1.0; negative for a failure. */
DISCIO_API double DISCIO_DiscGetFreeSpaceFraction(DISCIO_Disc* disc);
/* Every track is a component: 1 audio, 2 data. -1 for a failure. */
DISCIO_API int32_t DISCIO_DiscGetComponentCount(DISCIO_Disc* disc);
DISCIO_API int32_t DISCIO_DiscGetComponentType(DISCIO_Disc* disc, int32_t index);
/* Tracks of all kinds; -1 for a failure. */
DISCIO_API int32_t DISCIO_DiscGetTrackCount(DISCIO_Disc* disc);
/* Up to the pregap of the next track, as a player counts it; -1 for a failure. */
DISCIO_API int32_t DISCIO_DiscGetTrackLengthBlocks(DISCIO_Disc* disc, int32_t index);
/* Block 0 is 2 seconds behind the start of the program area; INT32_MIN for a failure. With the index equal to
 * the number of tracks, the start of the lead-out. */
DISCIO_API int32_t DISCIO_DiscGetTrackStartBlocks(DISCIO_Disc* disc, int32_t index);
/* Blocks between the end of the previous track and the start of this one; 150 are normal before the first
 * track, and more than that are a hidden track. -1 for a failure. */
DISCIO_API int32_t DISCIO_DiscGetTrackPregap(DISCIO_Disc* disc, int32_t index);

/* --- Audio discs -----------------------------------------------------------------------------------------
 */

/* Texts of CD-TEXT and of the subchannel. */
enum {
    DISCIO_TEXT_TITLE = 0,
    DISCIO_TEXT_PERFORMER = 1,
    DISCIO_TEXT_SONGWRITER = 2,
    DISCIO_TEXT_COMPOSER = 3,
    DISCIO_TEXT_ARRANGER = 4,
    DISCIO_TEXT_MESSAGE = 5,
    DISCIO_TEXT_DISC_ID = 6,
    DISCIO_TEXT_GENRE = 7,
    DISCIO_TEXT_CODE = 14 /* catalogue number of the disc, ISRC of a track */
};

/* Segments are the audio tracks. -1 for a failure. */
DISCIO_API int32_t DISCIO_DiscAudioGetSegmentCount(DISCIO_Disc* disc);
/* Empty if the disc has no such text. */
DISCIO_API const char16_t* DISCIO_DiscAudioGetMetaDataStringW(DISCIO_Disc* disc, int32_t text);
DISCIO_API const char16_t* DISCIO_DiscAudioGetSegmentMetaDataStringW(DISCIO_Disc* disc, int32_t segment,
                                                                     int32_t text);

/* A source of interleaved PCM in 16 bits. Every function receives the stream's user data first. */
typedef struct DISCIO_PCMAudioStreamFuncs {
    double (*getLength)(void* user); /* seconds; -1.0 for a failure */
    void* reserved;                  /* null */
    int32_t (*open)(void* user);
    void (*close)(void* user);
    int32_t (*getChannelCount)(void* user);
    int32_t (*getSampleRate)(void* user);
    int64_t (*getFrameCount)(void* user); /* exact */
    int32_t (*rewind)(void* user);
    void (*flush)(void* user);
    int32_t (*canSeek)(void* user);
    /* Delivers up to `frames` frames; 0 of them at the end. Returns 0 if they cannot be read. */
    int32_t (*read)(void* user, void* pcm, int32_t frames, int32_t* delivered);
    /* Places read more than once since open because the drive's data were in doubt; -1 if unknown. */
    int64_t (*getRepairs)(void* user);
    /* The next read starts at that frame. */
    int32_t (*seek)(void* user, int64_t frame);
    int64_t (*getPosition)(void* user); /* the frame of the next read; -1 for a failure */
    void (*end)(void* user);
} DISCIO_PCMAudioStreamFuncs;

/* A stream of samples: 16 bits, interleaved, in the byte order of the machine. */
typedef struct DISCIO_PCMAudioStream {
    uint32_t kind; /* private */
    const DISCIO_PCMAudioStreamFuncs* funcs;
    void* user;
} DISCIO_PCMAudioStream;

/* The exact samples of an audio track. Reading fails with DISCIO_ERROR_DISC_LOST once the disc has been taken
 * out or exchanged. Released with DISCIO_Release. */
DISCIO_API DISCIO_PCMAudioStream* DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(DISCIO_Disc* disc,
                                                                                  int32_t segment);
DISCIO_API double DISCIO_PCMAudioStreamGetApproximateLengthSeconds(DISCIO_PCMAudioStream* stream);

/* --- Data discs ------------------------------------------------------------------------------------------
 */

/* ISO 9660 with Joliet and Rock Ridge, or UDF. Paths have "\" between their names; the root is "" or "\". */
DISCIO_API const char16_t* DISCIO_DiscDataGetTitleW(DISCIO_Disc* disc);
/* Only virtual discs can be changed. */
DISCIO_API int32_t DISCIO_DiscDataSetTitleW(DISCIO_Disc* disc, const char16_t* title);
/* Stands before the first entry of the folder. */
DISCIO_API DISCIO_DataCursor* DISCIO_DiscDataCreateCursorW(DISCIO_Disc* disc, const char16_t* folder);
DISCIO_API int32_t DISCIO_DiscDataFolderExistsW(DISCIO_Disc* disc, const char16_t* folder);
/* 0 behind the last entry, and for a failure. */
DISCIO_API int32_t DISCIO_DataCursorNext(DISCIO_DataCursor* cursor);
DISCIO_API int32_t DISCIO_DataCursorReset(DISCIO_DataCursor* cursor);
/* For the folder at the cursor. */
DISCIO_API DISCIO_DataCursor* DISCIO_DataCursorCreateSubCursor(DISCIO_DataCursor* cursor);
DISCIO_API int32_t DISCIO_DataCursorIsFile(DISCIO_DataCursor* cursor);
DISCIO_API int32_t DISCIO_DataCursorIsFolder(DISCIO_DataCursor* cursor);
DISCIO_API const char16_t* DISCIO_DataCursorGetNameW(DISCIO_DataCursor* cursor);
DISCIO_API int64_t DISCIO_DataCursorGetSize(DISCIO_DataCursor* cursor); /* bytes; -1 for a failure */
DISCIO_API const char16_t* DISCIO_DataCursorGetDiscPathW(DISCIO_DataCursor* cursor);
/* Where a file of a virtual disc comes from; empty for other discs. */
DISCIO_API const char16_t* DISCIO_DataCursorGetFileSourceURIW(DISCIO_DataCursor* cursor);
/* Seconds since 1970, UTC; -1 if unknown. */
DISCIO_API int64_t DISCIO_DataCursorGetCreatedTime(DISCIO_DataCursor* cursor);
DISCIO_API int64_t DISCIO_DataCursorGetLastModifiedTime(DISCIO_DataCursor* cursor);
DISCIO_API int64_t DISCIO_DataCursorGetLastAccessedTime(DISCIO_DataCursor* cursor);

#ifdef __cplusplus
}
#endif

#endif
