// What is in a drive.
#pragma once

#include "Error.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace discio {

constexpr int kFramesPerSector = 588;
constexpr int kAudioSectorBytes = 2352;
constexpr int kDataSectorBytes = 2048;
constexpr int kSectorsPerSecond = 75;
constexpr int kLeadInSectors = 150; // the pause before the first track, not counted in block numbers
constexpr int kMaxTracks = 99;

// In UTF-8, by the numbers of the public header (DISCIO_TEXT_TITLE, ...).
using Texts = std::array<std::string, 16>;

struct STrack {
    int number = 0; // on the disc, from 1 to 99
    bool isAudio = false;
    int32_t start = 0;  // block
    int32_t length = 0; // up to the next track's pregap
    int32_t pregap = 0; // blocks before `start` that belong to this track
    Texts texts = {};

    int32_t end() const { return start + length; }
    // Nobody can read the pause before block 0.
    int32_t getReadablePregap() const { return std::clamp(pregap, 0, std::max(start, 0)); }
};

struct STableOfContents {
    std::vector<STrack> tracks;
    int32_t leadOut = 0;
    int32_t lastSession = 0; // block; 0 for a single session, or if nothing is known about sessions
    Texts texts = {};
};

// Values of DISCIO_DiscGetMediumType.
enum class EMediumType { unknown = -1, none = 0, cdRom = 1, cdR = 2, cdRw = 3, dvdRom = 4 };

struct SMediumState {
    EMediumType type = EMediumType::unknown;
    bool isEmpty = false;
    bool isErasable = false;
    bool isWritable = false;
    int64_t capacityBytes = 0;
    double freeFraction = 0;
};

// Reads audio from a medium in order. Belongs to one thread.
class IAudioReader {
public:
    virtual ~IAudioReader() = default;
    // Whole sectors of native 16-bit samples. Throws CDiscError.
    virtual void read(int32_t block, int32_t count, int16_t* samples) = 0;
    virtual int64_t getRepairs() const = 0; // -1: unknown
};

// Reads data from a medium. Belongs to one thread at a time.
class IDataReader {
public:
    virtual ~IDataReader() = default;
    // Blocks of 2048 bytes. Throws CDiscError.
    virtual void read(int32_t block, int32_t count, void* to) = 0;
    virtual std::string getName() const = 0; // of the medium, for messages
};

// Any thread.
class IMedium : public std::enable_shared_from_this<IMedium> {
public:
    virtual ~IMedium() = default;
    virtual const STableOfContents& getContents() const = 0;
    virtual SMediumState getState() const = 0;
    // The disc of a project.
    virtual bool isVirtual() const { return false; }
    // Whether there are tracks of that kind. A project has its component before it has tracks.
    virtual bool hasComponent(bool isAudio) const {
        const auto& tracks = getContents().tracks;
        return std::any_of(tracks.begin(), tracks.end(),
                           [&](const STrack& track) { return track.isAudio == isAudio; });
    }
    // For the blocks of one track. Throws CDiscError.
    virtual std::unique_ptr<IAudioReader> createAudioReader(const STrack& track) const = 0;
    // The track with the file system to read: that of the last session, otherwise the first one. Null if
    // there is none.
    const STrack* findDataTrack() const {
        const STableOfContents& contents = getContents();
        const STrack* found = nullptr;
        for (const STrack& track : contents.tracks)
            if (!track.isAudio &&
                (!found || (contents.lastSession > 0 && track.start == contents.lastSession)))
                found = &track;
        return found;
    }
    // The file or device that starts with that track. Empty if it starts elsewhere. Throws CDiscError.
    virtual std::string getDataPath() const = 0;
    // Throws CDiscError.
    virtual std::unique_ptr<IDataReader> createDataReader() const {
        throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, "the data has not been written to a disc");
    }
};

class IDrive {
public:
    virtual ~IDrive() = default;
    virtual std::string getName() const = 0;
    virtual std::string getPath() const = 0;
    virtual std::string getRevision() const = 0;
    virtual std::string getDriverDescription() const = 0;
    virtual std::vector<double> getReadSpeeds() const = 0; // fastest first
    virtual bool checkMedium(int milliseconds) = 0;
    virtual std::shared_ptr<IMedium> openMedium() = 0; // throws CDiscError
    virtual void moveTray(bool open) = 0;              // throws CDiscError
    // Its path is a device that may be able to write.
    virtual bool isOptical() const { return false; }
};

} // namespace discio
