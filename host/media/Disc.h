// Drives and discs for the commands.
#pragma once

#include "library/DiscLibrary.h"

#include <filesystem>
#include <string>
#include <utility>
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
// Whether a name that a user gives, which may be a link, means the drive of that path.
bool isSameDrive(const std::filesystem::path& place, const std::string& drive);
// "CD-ROM" and so on.
std::string describeMedium(int32_t type);

struct SDiscTrack {
    int number = 0;    // of the audio track, as in file names; 0 for data and for the sound before track 1
    int32_t start = 0; // blocks
    int32_t length = 0;
    int32_t pregap = 0;
    std::string title;
    std::string performer;
    std::string code;     // ISRC
    int32_t readable = 0; // blocks of the pregap that have sound

    double getSeconds() const { return static_cast<double>(length) / kBlocksPerSecond; }
};

// Texts for a disc that are not its own. Those of the disc apply where a title, or the performer of the disc,
// is empty.
struct SDiscTexts {
    std::string title;
    std::string performer;
    std::string year;
    std::string genre;
    std::vector<std::pair<std::string, std::string>> tracks; // titles and performers, of tracks of all kinds
};

class CDisc {
public:
    // The medium in a drive, named by its path, or a disc image; without a name, the first drive with a
    // medium.
    explicit CDisc(const std::filesystem::path& place);

    const std::string& getPlace() const { return m_place; }
    DISCIO_Disc* getHandle() const { return m_disc.get(); }
    // A drive that moves a head, unlike an image.
    bool isDevice() const;
    const std::vector<SDiscTrack>& getTracks() const { return m_tracks; }
    // Of the sound before track 1; 0 for none.
    int32_t getHiddenBlocks() const;
    std::string getText(int32_t text) const; // DISCIO_TEXT_TITLE and so on, of the disc
    void setTexts(const SDiscTexts& texts);
    const std::string& getYear() const { return m_texts.year; } // of setTexts()
    const std::string& getGenre() const { return m_texts.genre; }
    int32_t getLeadOut() const; // its start, as that of tracks
    DiscHandle<DISCIO_PCMAudioStream> openTrack(int number) const;

private:
    void readTracks();

    DiscHandle<DISCIO_Library> m_library;
    std::string m_place;
    DiscHandle<DISCIO_Disc> m_disc;
    std::vector<SDiscTrack> m_tracks;
    SDiscTexts m_texts;
};

} // namespace host
