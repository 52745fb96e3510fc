#include "media/Disc.h"

#include "base/Text.h"
#include "base/Translation.h"

#include <algorithm>
#include <iterator>
#include <optional>

namespace host {

namespace fs = std::filesystem;

namespace {

DiscHandle<DISCIO_Library> createLibrary(const std::u16string& image) {
    const SDiscFunctions& functions = getDiscFunctions();
    const DISCIO_Options options{sizeof options, 0, image.empty() ? nullptr : image.c_str()};
    DiscHandle<DISCIO_Library> library(functions.CreateEx(DISCIO_API_VERSION, &options));
    if (!library || functions.EnumerateDrives(library.get()) != 1) throw makeDiscError();
    return library;
}

std::vector<SDrive> openDrives(DISCIO_Library* library) {
    const SDiscFunctions& functions = getDiscFunctions();
    std::vector<SDrive> drives;
    for (int32_t i = 0; i < functions.GetDriveCount(library); ++i) {
        SDrive drive;
        drive.handle.reset(functions.OpenDrive(library, i));
        if (!drive.handle) throw makeDiscError();
        drive.path = toUTF8(functions.DriveGetPathW(drive.handle.get()));
        drive.name = toUTF8(functions.DriveGetNameW(drive.handle.get()));
        drive.revision = toUTF8(functions.DriveGetRevisionW(drive.handle.get()));
        drives.push_back(std::move(drive));
    }
    return drives;
}

} // namespace

// fs::equivalent is not defined for devices.
bool isSameDrive(const fs::path& place, const std::string& drive) {
    std::error_code none;
    const fs::path resolved = fs::canonical(place, none);
    return place == drive || (!resolved.empty() && resolved == fs::canonical(drive, none));
}

std::vector<SDrive> findDrives() {
    return openDrives(createLibrary({}).get());
}

std::string describeMedium(int32_t type) {
    static constexpr const char* kNames[] = {"none",     "CD-ROM",   "CD-R",   "CD-RW", "DVD-ROM",
                                             "DVD-RAM",  "DVD-R",    "DVD-RW", "DVD+R", "DVD+RW",
                                             "DVD+R DL", "DVD-R DL", "BD-ROM", "BD-R",  "BD-RE"};
    return type >= 0 && type < static_cast<int32_t>(std::size(kNames)) ? kNames[type] : "unknown";
}

CDisc::CDisc(const fs::path& place) {
    const SDiscFunctions& functions = getDiscFunctions();
    std::error_code none;
    const bool isImage = fs::is_regular_file(place, none);
    std::optional<std::u16string> image;
    if (isImage && !(image = toUTF16(fs::absolute(place).native())))
        throw std::runtime_error(
            tr("host.Disc.badName", "%FILE%: the name is not valid UTF-8", {{"%FILE%", place.string()}}));
    m_library = createLibrary(image.value_or(u""));
    std::vector<SDrive> drives = openDrives(m_library.get());
    if (drives.empty() && place.empty())
        throw std::runtime_error(tr("host.Disc.noDrive", "There is no drive"));
    const SDrive* chosen = nullptr;
    if (isImage) {
        chosen = &drives.front();
    } else if (place.empty()) {
        for (const SDrive& drive : drives)
            if (!chosen && functions.DriveCheckDisc(drive.handle.get(), 1000, 0) == 1) chosen = &drive;
        if (!chosen) throw std::runtime_error(tr("host.Disc.noDisc", "There is no disc in any drive"));
    } else {
        for (const SDrive& drive : drives)
            if (isSameDrive(place, drive.path)) chosen = &drive;
        if (!chosen)
            throw std::runtime_error(tr("host.Disc.notADisc", "%FILE% is neither a drive nor a disc image",
                                        {{"%FILE%", place.string()}}));
    }
    m_place = chosen->path;
    m_disc.reset(functions.DriveOpenDisc(chosen->handle.get()));
    if (!m_disc) throw makeDiscError();
    readTracks();
}

void CDisc::readTracks() {
    const SDiscFunctions& functions = getDiscFunctions();
    DISCIO_Disc* disc = m_disc.get();
    const int32_t count = functions.DiscGetTrackCount(disc);
    int32_t segment = 0;
    for (int32_t i = 0; i < count; ++i) {
        SDiscTrack track;
        track.start = functions.DiscGetTrackStartBlocks(disc, i);
        track.length = functions.DiscGetTrackLengthBlocks(disc, i);
        track.pregap = functions.DiscGetTrackPregap(disc, i);
        const bool isAudio = functions.DiscGetComponentType(disc, i) == 1;
        if (isAudio) {
            const auto getText = [&](int32_t text) {
                return toUTF8(functions.DiscAudioGetSegmentMetaDataStringW(disc, segment, text));
            };
            track.title = getText(DISCIO_TEXT_TITLE);
            track.performer = getText(DISCIO_TEXT_PERFORMER);
            track.code = getText(DISCIO_TEXT_CODE);
            track.number = ++segment;
            // Before block 0 nothing can be read, and a pregap behind data is not sound.
            if (i == 0 || m_tracks.back().number > 0)
                track.readable = std::clamp(track.pregap, 0, std::max(track.start, 0));
        }
        m_tracks.push_back(std::move(track));
    }
}

void CDisc::setTexts(const SDiscTexts& texts) {
    m_texts = texts;
    for (size_t i = 0; i < std::min(m_tracks.size(), texts.tracks.size()); ++i) {
        const auto& [title, performer] = texts.tracks[i];
        if (title.empty()) continue;
        m_tracks[i].title = title;
        m_tracks[i].performer = performer;
    }
}

int32_t CDisc::getLeadOut() const {
    return getDiscFunctions().DiscGetTrackStartBlocks(m_disc.get(), static_cast<int32_t>(m_tracks.size()));
}

bool CDisc::isDevice() const {
    std::error_code none;
    return fs::is_block_file(m_place, none);
}

int32_t CDisc::getHiddenBlocks() const {
    return m_tracks.empty() || m_tracks.front().number == 0 ? 0 : m_tracks.front().readable;
}

std::string CDisc::getText(int32_t text) const {
    if (text == DISCIO_TEXT_TITLE && !m_texts.title.empty()) return m_texts.title;
    if (text == DISCIO_TEXT_PERFORMER && !m_texts.performer.empty()) return m_texts.performer;
    return toUTF8(getDiscFunctions().DiscAudioGetMetaDataStringW(m_disc.get(), text));
}

DiscHandle<DISCIO_PCMAudioStream> CDisc::openTrack(int number) const {
    DiscHandle<DISCIO_PCMAudioStream> stream(
        getDiscFunctions().DiscAudioCreatePCMAudioStreamFromSegment(m_disc.get(), number - 1));
    if (!stream || stream->funcs->open(stream->user) != 1) throw makeDiscError();
    return stream;
}

} // namespace host
