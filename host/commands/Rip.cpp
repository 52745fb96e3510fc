#include "commands/Rip.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "library/Failure.h"
#include "media/Disc.h"
#include "media/DiscNames.h"
#include "media/EncodeJob.h"
#include "media/Output.h"
#include "media/TrackReader.h"
#include "media/WholeTag.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr SSampleFormat kCdSamples{kDiscRate, 2, 2};

std::string formatCrc(uint32_t crc) {
    char text[9];
    std::snprintf(text, sizeof text, "%08X", crc);
    return text;
}

// In a cue sheet: quotation marks cannot be escaped.
std::string quote(std::string text) {
    std::replace(text.begin(), text.end(), '"', '\'');
    std::replace(text.begin(), text.end(), '\n', ' ');
    return "\"" + text + "\"";
}

class CRipper {
public:
    CRipper(CLibrary& library, const SRipOptions& options, CDisc disc)
        : m_library(library), m_options(options), m_disc(std::move(disc)), m_progress(options.show),
          m_temporaryEnding(setTemporaryEnding(library)) {
        for (const SDiscTrack& track : m_disc.getTracks())
            if (track.number > 0 && (options.tracks.empty() || options.tracks.contains(track.number)))
                m_tracks.push_back(track);
        for (const int number : options.tracks)
            if (std::none_of(m_tracks.begin(), m_tracks.end(),
                             [&](const SDiscTrack& track) { return track.number == number; }))
                throw std::runtime_error(m_disc.getPlace() + " has no audio track " + std::to_string(number));
        if (m_tracks.empty()) throw std::runtime_error(m_disc.getPlace() + " has no audio tracks");
    }

    int run();

private:
    struct SDone {
        SDiscTrack track;
        fs::path file;
    };

    fs::path getTarget(const SDiscTrack& track) const;
    CNamePattern::Fields getFields(const SDiscTrack& track) const;
    bool ripTrack(const SDiscTrack& track, const fs::path& target, CProgress::Job job);
    void setTags(const SDiscTrack& track, const fs::path& temporary) const;
    void report(const SDiscTrack& track, const fs::path& target, const CTrackReader& reader) const;
    void writeCue() const;

    CLibrary& m_library;
    const SRipOptions& m_options;
    CDisc m_disc;
    CProgress m_progress;
    std::string m_temporaryEnding;
    std::vector<SDiscTrack> m_tracks;
    std::vector<SDone> m_done;
};

CNamePattern::Fields CRipper::getFields(const SDiscTrack& track) const {
    const std::string album = m_disc.getText(DISCIO_TEXT_TITLE);
    const std::string albumArtist = m_disc.getText(DISCIO_TEXT_PERFORMER);
    const std::string title = track.title.empty() ? "Track " + std::to_string(track.number) : track.title;
    return {{"album", album},
            {"album-artist", albumArtist},
            {"artist", track.performer.empty() ? albumArtist : track.performer},
            {"title", title},
            {"track", std::to_string(track.number)},
            {"year", m_disc.getYear()},
            {"genre", m_disc.getGenre()},
            {"name", title}};
}

fs::path CRipper::getTarget(const SDiscTrack& track) const {
    return m_options.directory / m_options.names->expand(getFields(track), "." + m_options.extension);
}

// The fields that the disc itself has; the missing title is not made up.
void CRipper::setTags(const SDiscTrack& track, const fs::path& temporary) const {
    CTagChange change;
    CNamePattern::Fields fields = getFields(track);
    fields["title"] = track.title;
    fields.erase("name");
    for (const auto& [name, text] : fields)
        if (!text.empty()) setTagText(change, temporary, name, text);
    change.apply(temporary);
}

void CRipper::report(const SDiscTrack& track, const fs::path& target, const CTrackReader& reader) const {
    const double peak = reader.getPeak();
    if (m_options.show == EOutput::json)
        std::printf("%s\n", toLine({{"event", "ripped"},
                                    {"track", track.number},
                                    {"output", target.native()},
                                    {"crc32", formatCrc(reader.getCrc())},
                                    {"frames", reader.getFrames()},
                                    {"duration", track.getSeconds()},
                                    {"repairs", reader.getRepairs()},
                                    {"peak", peak},
                                    {"verified", m_options.verify}})
                                .c_str());
    else if (m_options.show == EOutput::normal)
        std::printf("track %2d  CRC-32 %s  %s  %lld repaired  peak %.1f %%%s\n", track.number,
                    formatCrc(reader.getCrc()).c_str(), formatDuration(track.getSeconds()).c_str(),
                    static_cast<long long>(std::max<int64_t>(reader.getRepairs(), 0)), peak * 100,
                    m_options.verify ? "  verified" : "");
    flushEvents();
}

// False if Ctrl-C ended it.
bool CRipper::ripTrack(const SDiscTrack& track, const fs::path& target, CProgress::Job job) {
    const auto started = std::chrono::steady_clock::now();
    if (target.has_parent_path()) fs::create_directories(target.parent_path());
    COutput place(target, m_temporaryEnding, m_options.force);
    CTrackReader reader(m_disc.openTrack(track.number));
    CHandle source = reader.createSource();
    CHandle format =
        requireFormat(m_library, place.getTemporary(), kCdSamples, m_options, target, "The file");
    bool done = false;
    try {
        done = encode(m_library, source, format, m_progress, job,
                      {m_disc.getPlace(), place.getTemporary(), target}, m_temporaryEnding);
    } catch (const std::runtime_error&) {
        // The encoder knows only that there are no samples.
        if (!reader.getFailure().empty()) throw std::runtime_error(reader.getFailure());
        throw;
    }
    source.reset();
    format.reset();
    if (!done) return false;
    reader.requireComplete();
    if (m_options.verify && !reader.verify([] { return isCancelled(); })) return false;
    if (canHaveTag(target)) setTags(track, place.getTemporary());
    const uint64_t bytes = fs::file_size(place.getTemporary());
    place.commit();
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - started;
    m_progress.finish(job, {track.getSeconds(), elapsed.count(), bytes, codecName(target)});
    report(track, target, reader);
    return true;
}

void CRipper::writeCue() const {
    std::string sheet;
    const auto add = [&](const char* command, const std::string& text) {
        if (!text.empty()) sheet += std::string(command) + " " + quote(text) + "\n";
    };
    add("TITLE", m_disc.getText(DISCIO_TEXT_TITLE));
    add("PERFORMER", m_disc.getText(DISCIO_TEXT_PERFORMER));
    if (const std::string code = m_disc.getText(DISCIO_TEXT_CODE); !code.empty())
        sheet += "CATALOG " + code + "\n";
    const std::string album = m_disc.getText(DISCIO_TEXT_TITLE);
    const fs::path target = m_options.directory /
                            CNamePattern("%name%").expand({{"name", album.empty() ? "disc" : album}}, ".cue");
    for (const SDone& done : m_done) {
        const fs::path name = done.file.lexically_relative(target.parent_path());
        sheet += "FILE " + quote(name.native()) + " WAVE\n";
        sheet += "  TRACK " + std::string(done.track.number < 10 ? "0" : "") +
                 std::to_string(done.track.number) + " AUDIO\n";
        add("    TITLE", done.track.title);
        add("    PERFORMER", done.track.performer);
        if (!done.track.code.empty()) sheet += "    ISRC " + done.track.code + "\n";
        sheet += "    INDEX 01 00:00:00\n";
    }
    COutput place(target, m_temporaryEnding, m_options.force);
    std::ofstream out(place.getTemporary(), std::ios::binary);
    out << sheet;
    out.close();
    if (!out) throw std::runtime_error(target.string() + " could not be written");
    place.commit();
}

int CRipper::run() {
    bool failed = false;
    for (const SDiscTrack& track : m_tracks) {
        if (isCancelled()) return kExitCancelled;
        const fs::path target = getTarget(track);
        const CProgress::Job job = m_progress.start(m_disc.getPlace(), target, {{"track", track.number}});
        try {
            if (!ripTrack(track, target, job)) {
                m_progress.cancel(job);
                return kExitCancelled;
            }
            m_done.push_back({track, target});
        } catch (const std::exception& failure) {
            m_progress.fail(job, "track " + std::to_string(track.number) + ": " + failure.what());
            failed = true;
        }
    }
    if (!failed && m_options.writeCue) writeCue();
    return failed ? kExitFailure : kExitSuccess;
}

} // namespace

int rip(CLibrary& library, const SRipOptions& options) {
    const fs::path example = "x." + options.extension;
    requireEffect(options, example);
    CDisc disc(options.place);
    if (options.cddb)
        if (const int code = nameDisc(disc, *options.cddb, options.pick); code != kExitSuccess) return code;
    return CRipper(library, options, std::move(disc)).run();
}

} // namespace host
