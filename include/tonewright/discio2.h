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
/* A disc that is composed in memory and then written. */
typedef struct DISCIO_Project DISCIO_Project;

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
    DISCIO_ERROR_ABORTED = 8,
    DISCIO_ERROR_ALREADY_EXISTS = 9,
    DISCIO_ERROR_NOT_A_FILE = 10,
    DISCIO_ERROR_NOT_A_FOLDER = 11,
    DISCIO_ERROR_UNSUPPORTED_FORMAT = 12,
    DISCIO_ERROR_NOT_PREPARED = 13,
    DISCIO_ERROR_DEVICE = 15,
    DISCIO_ERROR_CANNOT_WRITE = 16,
    DISCIO_ERROR_BUFFER_UNDERRUN = 17,
    DISCIO_ERROR_NO_DISC = 18,
    DISCIO_ERROR_DISC_NOT_VIRTUAL = 19,
    DISCIO_ERROR_DISC_NOT_WRITABLE = 20,
    DISCIO_ERROR_DISC_NOT_ERASABLE = 21,
    DISCIO_ERROR_DISC_LOST = 22,
    DISCIO_ERROR_DISC_CONTENTS_IN_USE = 23,
    DISCIO_ERROR_DISC_EMPTY = 24,
    DISCIO_ERROR_DISC_NOT_EMPTY = 25,
    DISCIO_ERROR_NO_DATA = 26,
    DISCIO_ERROR_NO_AUDIO = 27,
    DISCIO_ERROR_UNSUPPORTED_DISC_TYPE = 29,
    DISCIO_ERROR_NOT_ENOUGH_SPACE = 32,
    DISCIO_ERROR_READ_INPUT = 34,
    DISCIO_ERROR_STREAM_ALREADY_OPEN = 35,
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
    /* The next read starts at that frame. Those of a track's pregap are negative; they can be read on audio
     * discs unless they are before block 0 or in a track of data. */
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
/* Copies bytes of the file at the cursor, from that offset on. Returns how many: fewer than wanted only at
 * the end of the file; -1 for a failure. The cursor stays where it is. */
DISCIO_API int64_t DISCIO_DataCursorRead(DISCIO_DataCursor* cursor, int64_t offset, void* buffer,
                                         int64_t bytes);
DISCIO_API const char16_t* DISCIO_DataCursorGetDiscPathW(DISCIO_DataCursor* cursor);
/* Where a file of a virtual disc comes from; empty for other discs. */
DISCIO_API const char16_t* DISCIO_DataCursorGetFileSourceURIW(DISCIO_DataCursor* cursor);
/* Seconds since 1970, UTC; -1 if unknown. */
DISCIO_API int64_t DISCIO_DataCursorGetCreatedTime(DISCIO_DataCursor* cursor);
DISCIO_API int64_t DISCIO_DataCursorGetLastModifiedTime(DISCIO_DataCursor* cursor);
DISCIO_API int64_t DISCIO_DataCursorGetLastAccessedTime(DISCIO_DataCursor* cursor);

/* --- Projects --------------------------------------------------------------------------------------------
 */

/* An audio CD without tracks, or a data disc without files, to be filled and written. A project, the handles
 * of its disc and their cursors count as one handle: one thread at a time. Released with DISCIO_Release. */
DISCIO_API DISCIO_Project* DISCIO_CreateAudioCDProject(DISCIO_Library* library);
DISCIO_API DISCIO_Project* DISCIO_CreateDataDiscProject(DISCIO_Library* library);
/* The disc of a project, for all functions of discs. Every call returns a new handle to the same disc, which
 * is released with DISCIO_Release and stays usable without the project. DISCIO_DiscIsVirtual is 1 for it; it
 * shows every change at once. The functions below change it; they fail with DISCIO_ERROR_DISC_NOT_VIRTUAL for
 * other discs, and with DISCIO_ERROR_DISC_CONTENTS_IN_USE while the project is being written. */
DISCIO_API DISCIO_Disc* DISCIO_ProjectGetVirtualDisc(DISCIO_Project* project);

/* A stream of samples from functions. The record is copied; its functions are called on the thread that uses
 * the stream or writes the project, and on one of the library while a drive is writing. They may fail with 0,
 * or with a negative length or count. `end` is called once, when neither the handle nor a disc uses the
 * stream any more, and `user` has to stay valid until then. Released with DISCIO_Release, also right after it
 * has been inserted into a disc. */
DISCIO_API DISCIO_PCMAudioStream*
DISCIO_CreatePCMAudioStreamFromFuncs(DISCIO_Library* library, const DISCIO_PCMAudioStreamFuncs* funcs,
                                     void* user);
/* The same from a WAV file: 16-bit stereo PCM at 44100 Hz, otherwise DISCIO_ERROR_UNSUPPORTED_FORMAT. `file`
 * is an absolute path or a file URI. Fails with DISCIO_ERROR_DISC_LOST when the file is changed later. */
DISCIO_API DISCIO_PCMAudioStream* DISCIO_CreatePCMAudioStreamFromFileW(DISCIO_Library* library,
                                                                       const char16_t* file);

/* Inserts a track before the one at `place`; a place equal to the number of tracks, or -1, appends it. The
 * stream may come from any of the functions that create one, including a track of another disc. It is opened
 * once to learn its length: 16-bit stereo at 44100 Hz of at least one frame, otherwise
 * DISCIO_ERROR_UNSUPPORTED_FORMAT. A stream that ends before its length is continued with silence. Each
 * stream can be inserted once. A disc has up to 99 tracks. */
DISCIO_API int32_t DISCIO_DiscAudioInsertSegmentPCMAudioStream(DISCIO_Disc* disc,
                                                               DISCIO_PCMAudioStream* stream, int32_t place);
DISCIO_API int32_t DISCIO_DiscAudioRemoveSegment(DISCIO_Disc* disc, int32_t segment);
/* The silence before a track, in blocks from 0 to 22500; 150 by default. Before the first track it is always
 * 150, which are not part of an image. */
DISCIO_API int32_t DISCIO_DiscAudioSetSegmentPregap(DISCIO_Disc* disc, int32_t segment, int32_t blocks);
/* Texts without control characters, up to 160 of them; empty removes one. DISCIO_TEXT_CODE takes 13 digits
 * for the disc, and an ISRC such as "DEABC2600001" for a track. */
DISCIO_API int32_t DISCIO_DiscAudioSetMetaDataStringW(DISCIO_Disc* disc, int32_t text, const char16_t* value);
DISCIO_API int32_t DISCIO_DiscAudioSetSegmentMetaDataStringW(DISCIO_Disc* disc, int32_t segment, int32_t text,
                                                             const char16_t* value);

/* Adds a file to a folder that exists. `source` is an absolute path or a file URI; an absolute path may also
 * be in the form of a disc's paths, with "\" for every "/". It is read when the project is written, and must
 * not have changed its size until then. Names on a disc have up to 255 bytes in UTF-8 and none of "/", "\"
 * and control characters; Joliet shortens those of more than 103 characters. */
DISCIO_API int32_t DISCIO_DiscDataAddFileW(DISCIO_Disc* disc, const char16_t* path, const char16_t* source);
/* In a folder that exists; DISCIO_ERROR_ALREADY_EXISTS if there is such an entry. */
DISCIO_API int32_t DISCIO_DiscDataCreateFolderW(DISCIO_Disc* disc, const char16_t* path);
/* A file, or a folder with everything in it. */
DISCIO_API int32_t DISCIO_DiscDataRemoveW(DISCIO_Disc* disc, const char16_t* path);

/* --- Writing ---------------------------------------------------------------------------------------------
 */

/* How a project is written; combined with "|". */
enum {
    DISCIO_WRITE_DUMMY = 1, /* with the laser off; drives only */
    DISCIO_WRITE_BLANK =
        2, /* a rewritable medium that is not empty is blanked, or overwritten; drives only */
    DISCIO_WRITE_VERIFY = 4, /* reads a medium back and compares it; images are always compared */
    DISCIO_WRITE_CD_TEXT = 8 /* writes the texts of an audio CD */
};

/* What is being done, for DISCIO_WriteOptions. */
enum {
    DISCIO_PHASE_PREPARE = 0,
    DISCIO_PHASE_BLANK = 1,
    DISCIO_PHASE_WRITE = 2,
    DISCIO_PHASE_FINISH = 3, /* the drive writes the lead-out; the file is flushed to its disk */
    DISCIO_PHASE_VERIFY = 4
};

/* How to write, and who is informed. Without it: DISCIO_WRITE_VERIFY | DISCIO_WRITE_CD_TEXT at full speed. */
typedef struct DISCIO_WriteOptions {
    uint32_t size;  /* of this structure */
    uint32_t flags; /* DISCIO_WRITE_ values */
    double speed;   /* in multiples of the speed of playing, which the drive rounds; 0 for the fastest */
    /* Called often, on the thread that writes, with a DISCIO_PHASE_ value and from 0.0 to 1.0 within it. The
     * result 0 cancels with DISCIO_ERROR_ABORTED. Null if not wanted. */
    int32_t (*onProgress)(void* user, int32_t phase, double fraction);
    void* user;
} DISCIO_WriteOptions;

/* Writes a project to the file `path`: an audio CD to a ".cue" with the samples in a ".bin" of the same name
 * beside it, and with its CD-TEXT in a ".cdt" if all texts are Latin-1; a data disc to an ".iso". Returns
 * when everything has been written, flushed, read back and compared. Existing files are replaced at the end;
 * after a failure they are unchanged and nothing of the new ones is left. `options` may be null. */
DISCIO_API int32_t DISCIO_ProjectWriteImageW(DISCIO_Project* project, const char16_t* path,
                                             const DISCIO_WriteOptions* options);
/* Writes a project to the medium in an optical drive, in one session that is closed. Returns when the drive
 * has finished. Tracks of audio CDs have at least 4 seconds. Fails with DISCIO_ERROR_DISC_NOT_EMPTY,
 * DISCIO_ERROR_DISC_NOT_WRITABLE or DISCIO_ERROR_NOT_ENOUGH_SPACE before anything is written; a later failure
 * spoils a medium that can be written once. The message of a failure, or of DISCIO_ERROR_ABORTED, then ends
 * in "the medium is partly written". A medium that is overwritten in place (DVD+RW, DVD-RAM, BD-RE) and has
 * contents needs DISCIO_WRITE_BLANK. `options` may be null. */
DISCIO_API int32_t DISCIO_ProjectWriteDisc(DISCIO_Project* project, DISCIO_Drive* drive,
                                           const DISCIO_WriteOptions* options);
/* Blanks a CD-RW or another rewritable medium; with `whole` not 0 all of it, which takes long, otherwise its
 * table of contents. Cannot be cancelled: the result of onProgress is ignored. DISCIO_ERROR_NOT_SUPPORTED for
 * media that are overwritten in place, except DVD-RW. `options` may be null. */
DISCIO_API int32_t DISCIO_DriveBlankDisc(DISCIO_Drive* drive, int32_t whole,
                                         const DISCIO_WriteOptions* options);

#ifdef __cplusplus
}
#endif

#endif
