#include "commands/BurnTracks.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Disc.h"
#include "media/SoundFile.h"
#include "media/WholeTag.h"

#include <algorithm>
#include <optional>
#include <sstream>
#include <tonewright/host.h>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr SSampleFormat kCdSamples{kDiscRate, 2, 2};

// "DE-ABC-26-00001" and the like as "DEABC2600001"; empty if it is not an ISRC.
std::string toCode(std::string text) {
    std::erase(text, '-');
    std::erase(text, ' ');
    const bool isCode = text.size() == 12 && std::all_of(text.begin(), text.end(), [](unsigned char c) {
                            return std::isdigit(c) || (c >= 'A' && c <= 'Z');
                        });
    return isCode &&
                   std::all_of(text.begin() + 5, text.end(), [](unsigned char c) { return std::isdigit(c); })
               ? text
               : "";
}

// A text that all tracks have; otherwise empty.
class CCommonText {
public:
    void add(const std::string& text) {
        if (!m_text) m_text = text;
        if (*m_text != text) m_text = "";
    }
    std::string get() const { return m_text.value_or(""); }

private:
    std::optional<std::string> m_text;
};

} // namespace

void CBurnTracks::add(CLibrary& library, CDiscProject& project, const fs::path& file) {
    m_tracks.emplace_back(file);
    try {
        addLast(library, project);
    } catch (...) {
        m_tracks.pop_back();
        throw;
    }
}

void CBurnTracks::addLast(CLibrary& library, CDiscProject& project) {
    STrack& track = m_tracks.back();
    SSoundFile sound = openSoundFile(track.content.getPath());
    clearFailure();
    if (sound.samples != kCdSamples &&
        TONEWRIGHT_Host_SetSourceFormat(sound.source.get(), kCdSamples.rate, kCdSamples.channels,
                                        kCdSamples.bytesPerSample) != 1)
        throw std::runtime_error(
            takeFailure(tr("host.inconvertible", "Cannot be converted from %FROM% to %TO%",
                           {{"%FROM%", describe(sound.samples)}, {"%TO%", describe(kCdSamples)}}),
                        track.file));
    // A disc may have more tracks than files should be open.
    library.AudioSource_Close(sound.source.get());
    project.addTrack(library, sound.source);
    track.source = std::move(sound.source);
}

std::vector<std::pair<fs::path, std::string>> CBurnTracks::setTexts(CDiscProject& project,
                                                                    const std::string& title) const {
    std::vector<std::pair<fs::path, std::string>> problems;
    CCommonText album, artist, albumArtist;
    int number = 0;
    for (const STrack& track : m_tracks) {
        SWholeTag tag;
        try {
            if (canHaveTag(track.content.getPath())) tag = readWholeTag(track.content.getPath());
        } catch (const std::exception& failure) {
            problems.emplace_back(track.file, failure.what());
        }
        const std::string own = tag.getFirst("TITLE");
        project.setText(number, DISCIO_TEXT_TITLE, own.empty() ? track.file.stem().native() : own);
        project.setText(number, DISCIO_TEXT_PERFORMER, tag.getFirst("ARTIST"));
        project.setText(number, DISCIO_TEXT_COMPOSER, tag.getFirst("COMPOSER"));
        project.setText(number, DISCIO_TEXT_CODE, toCode(tag.getFirst("ISRC")));
        album.add(tag.getFirst("ALBUM"));
        artist.add(tag.getFirst("ARTIST"));
        albumArtist.add(tag.getFirst("ALBUMARTIST"));
        ++number;
    }
    project.setText(-1, DISCIO_TEXT_TITLE, title.empty() ? album.get() : title);
    project.setText(-1, DISCIO_TEXT_PERFORMER, albumArtist.get().empty() ? artist.get() : albumArtist.get());
    return problems;
}

std::vector<std::string> CBurnTracks::takeWarnings() {
    std::vector<std::string> warnings;
    for (const STrack& track : m_tracks) {
        char* const lines = TONEWRIGHT_Host_TakeWarnings(track.source.get());
        if (!lines) continue;
        std::istringstream text(lines);
        TONEWRIGHT_Host_Free(lines);
        for (std::string line; std::getline(text, line);)
            warnings.push_back(track.file.string() + ": " + asReason(withPaths(line), track.file));
    }
    return warnings;
}

} // namespace host
