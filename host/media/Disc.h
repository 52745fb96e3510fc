// Drives and discs for the commands.
#pragma once

#include "library/DiscLibrary.h"

#include <filesystem>
#include <vector>

namespace host {

constexpr int kDiscRate = 44100;
constexpr int kBlockFrames = 588;
constexpr int kBlocksPerSecond = 75;

// All functions throw std::runtime_error.

struct SDrive {
    DiscHandle<DISCIO_Drive> handle;
    std::string path;
    std::string name;
    std::string revision;
};
// Of the machine.
std::vector<SDrive> findDrives();
// "CD-ROM" and so on.
std::string describeMedium(int32_t type);

struct SDiscTrack {
    int number = 0;    // of the audio track, as in file names; 0 for data
    int32_t start = 0; // blocks
    int32_t length = 0;
    int32_t pregap = 0;
    std::string title;
    std::string performer;
    std::string code; // ISRC

    double getSeconds() const { return static_cast<double>(length) / kBlocksPerSecond; }
};

class CDisc {
public:
    // The medium in a drive, named by its path, or a disc image; without a name, the first drive with a
    // medium.
    explicit CDisc(const std::filesystem::path& place);

    const std::string& getPlace() const { return m_place; }
    DISCIO_Disc* getHandle() const { return m_disc.get(); }
    const std::vector<SDiscTrack>& getTracks() const { return m_tracks; }
    std::string getText(int32_t text) const; // DISCIO_TEXT_TITLE and so on, of the disc
    DiscHandle<DISCIO_PCMAudioStream> openTrack(int number) const;

private:
    void readTracks();

    DiscHandle<DISCIO_Library> m_library;
    std::string m_place;
    DiscHandle<DISCIO_Disc> m_disc;
    std::vector<SDiscTrack> m_tracks;
};

} // namespace host
