// The disc access library, loaded when a command needs it.
#pragma once

#include <memory>
#include <stdexcept>
#include <string>
#include <tonewright/discio2.h>

namespace host {

// Names of the functions without their prefix.
#define HOST_DISC_FUNCTIONS(X)                                                                               \
    X(CreateEx)                                                                                              \
    X(Release)                                                                                               \
    X(GetLastError)                                                                                          \
    X(GetErrorMessageW)                                                                                      \
    X(EnumerateDrives)                                                                                       \
    X(GetDriveCount)                                                                                         \
    X(OpenDrive)                                                                                             \
    X(DriveCheckDisc)                                                                                        \
    X(DriveOpenDisc)                                                                                         \
    X(DriveGetNameW)                                                                                         \
    X(DriveGetPathW)                                                                                         \
    X(DriveGetRevisionW)                                                                                     \
    X(DiscGetMediumType)                                                                                     \
    X(DiscIsEmpty)                                                                                           \
    X(DiscHasDataComponent)                                                                                  \
    X(DiscGetCapacityBytes)                                                                                  \
    X(DiscGetComponentType)                                                                                  \
    X(DiscGetTrackCount)                                                                                     \
    X(DiscGetTrackLengthBlocks)                                                                              \
    X(DiscGetTrackStartBlocks)                                                                               \
    X(DiscGetTrackPregap)                                                                                    \
    X(DiscAudioGetMetaDataStringW)                                                                           \
    X(DiscAudioGetSegmentMetaDataStringW)                                                                    \
    X(DiscAudioCreatePCMAudioStreamFromSegment)                                                              \
    X(DiscDataGetTitleW)                                                                                     \
    X(DiscDataCreateCursorW)                                                                                 \
    X(DataCursorNext)                                                                                        \
    X(DataCursorIsFolder)                                                                                    \
    X(DataCursorGetDiscPathW)                                                                                \
    X(DataCursorGetNameW)                                                                                    \
    X(DataCursorGetLastModifiedTime)                                                                         \
    X(DataCursorRead)                                                                                        \
    X(DataCursorGetSize)                                                                                     \
    X(DataCursorCreateSubCursor)                                                                             \
    X(ProjectGetVirtualDisc)                                                                                 \
    X(DiscAudioSetSegmentPregap)                                                                             \
    X(DiscAudioSetMetaDataStringW)                                                                           \
    X(DiscAudioSetSegmentMetaDataStringW)                                                                    \
    X(DiscDataSetTitleW)                                                                                     \
    X(DiscDataCreateFolderW)                                                                                 \
    X(DiscDataAddFileW)                                                                                      \
    X(ProjectWriteImageW)                                                                                    \
    X(ProjectWriteDisc)

struct SDiscFunctions {
#define HOST_DECLARE(name) decltype(&::DISCIO_##name) name = nullptr;
    HOST_DISC_FUNCTIONS(HOST_DECLARE)
#undef HOST_DECLARE
};

// From beside the library. Throws std::runtime_error with the loader's reason.
const SDiscFunctions& getDiscFunctions();

// The reason of the disc library's last failure on this thread.
std::runtime_error makeDiscError();

struct SReleaseDiscHandle {
    template <class T> void operator()(T* handle) const { getDiscFunctions().Release(handle); }
};
template <class T> using DiscHandle = std::unique_ptr<T, SReleaseDiscHandle>;

} // namespace host
