#include "commands/Rip.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Parallel.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Disc.h"
#include "media/DiscNames.h"
#include "media/EncodeJob.h"
#include "media/Output.h"
#include "media/TrackReader.h"
#include "media/WholeTag.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <fstream>
#include <mutex>
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

// What becomes one file.
struct SPart {
    SDiscTrack track; // 0 is the sound before track 1
    int64_t gap = 0;  // frames of the next track's pregap at the end
    fs::path file = {};
    std::string report = {};

    int64_t getFrames() const { return int64_t{track.length} * kBlockFrames + gap; }
};

// "MM:SS:FF"
std::string formatPlace(int32_t blocks) {
    char text[32];
    std::snprintf(text, sizeof text, "%02d:%02d:%02d", blocks / kBlocksPerSecond / 60,
                  blocks / kBlocksPerSecond % 60, blocks % kBlocksPerSecond);
    return text;
}

class CRipper {
public:
    CRipper(CLibrary& library, const SRipOptions& options, CDisc disc)
        : m_library(library), m_options(options), m_disc(std::move(disc)), m_progress(options.show),
          m_temporaryEnding(setTemporaryEnding(library)), m_album(m_disc.getText(DISCIO_TEXT_TITLE)),
          m_albumArtist(m_disc.getText(DISCIO_TEXT_PERFORMER)) {
        findParts();
    }

    int run();

private:
    void findParts();
    fs::path getTarget(const SDiscTrack& track) const;
    fs::path getCueTarget() const;
    CNamePattern::Fields getFields(const SDiscTrack& track) const;
    std::unique_ptr<CTrackReader> openPart(const SPart& part);
    bool ripPart(SPart& part);
    bool copyPart(SPart& part, CProgress::Job job);
    void setTags(const SDiscTrack& track, const fs::path& temporary) const;
    void report(SPart& part, const CTrackReader& reader);
    void writeCue() const;

    CLibrary& m_library;
    const SRipOptions& m_options;
    CDisc m_disc;
    CProgress m_progress;
    std::string m_temporaryEnding;
    std::string m_album;
    std::string m_albumArtist;
    std::vector<SPart> m_parts;
    std::mutex m_mutex; // guards the disc, and standard output for the reports
};

// With a cue sheet, the files together hold every sample of the disc: a pregap is at the end of the track
// before, and the sound before track 1 has a file of its own.
void CRipper::findParts() {
    const std::string place = m_disc.getPlace();
    std::set<int> wanted = m_options.tracks;
    const bool isAll = wanted.empty();
    const auto throwMissing = [&](int number) {
        throw std::runtime_error(tr("host.Rip.noTrack", "%DISC% has no audio track %TRACK%",
                                    {{"%DISC%", place}, {"%TRACK%", std::to_string(number)}}));
    };
    if (m_disc.getHiddenBlocks() > 0 && (wanted.contains(0) || (isAll && m_options.writeCue))) {
        SPart part;
        part.track.title = tr("host.Rip.hidden", "Hidden track");
        part.track.length = m_disc.getHiddenBlocks();
        m_parts.push_back(part);
    } else if (wanted.contains(0)) {
        throw std::runtime_error(
            tr("host.Rip.noHidden", "%DISC% has no sound before track 1", {{"%DISC%", place}}));
    }
    wanted.erase(0);
    const std::vector<SDiscTrack>& tracks = m_disc.getTracks();
    for (size_t i = 0; i < tracks.size(); ++i) {
        const SDiscTrack& track = tracks[i];
        if (track.number == 0 || !(isAll || wanted.erase(track.number) > 0)) continue;
        SPart part;
        part.track = track;
        const bool hasNext = i + 1 < tracks.size() && (isAll || wanted.contains(tracks[i + 1].number));
        if (m_options.writeCue && hasNext) part.gap = int64_t{tracks[i + 1].readable} * kBlockFrames;
        m_parts.push_back(part);
    }
    if (!wanted.empty()) throwMissing(*wanted.begin());
    if (m_parts.empty())
        throw std::runtime_error(tr("host.Rip.noTracks", "%DISC% has no audio tracks", {{"%DISC%", place}}));
    std::set<fs::path> taken;
    for (SPart& part : m_parts) {
        part.file = getTarget(part.track);
        if (!taken.insert(part.file.lexically_normal()).second)
            throw std::runtime_error(tr("host.Convert.sameOutput",
                                        "Another input is already converted to %FILE%",
                                        {{"%FILE%", part.file.string()}}));
    }
}

CNamePattern::Fields CRipper::getFields(const SDiscTrack& track) const {
    const std::string title = track.title.empty() ? tr("host.Rip.untitled", "Track %NUMBER%",
                                                       {{"%NUMBER%", std::to_string(track.number)}})
                                                  : track.title;
    return {{"album", m_album},
            {"album-artist", m_albumArtist},
            {"artist", track.performer.empty() ? m_albumArtist : track.performer},
            {"title", title},
            {"track", std::to_string(track.number)},
            {"year", m_disc.getYear()},
            {"genre", m_disc.getGenre()},
            {"name", title}};
}

fs::path CRipper::getTarget(const SDiscTrack& track) const {
    std::string name = m_options.names->expand(getFields(track), "." + m_options.extension);
    if (m_options.writeCue) std::replace(name.begin(), name.end(), '"', '\''); // see quote()
    return m_options.directory / name;
}

fs::path CRipper::getCueTarget() const {
    return m_options.directory /
           CNamePattern("%name%").expand({{"name", m_album.empty() ? "disc" : m_album}}, ".cue");
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

// A line for each track: at once for programs, and in order behind the progress bars otherwise.
void CRipper::report(SPart& part, const CTrackReader& reader) {
    const double peak = reader.getPeak();
    const double seconds = static_cast<double>(part.getFrames()) / kDiscRate;
    if (m_options.show == EOutput::json) {
        std::scoped_lock lock(m_mutex);
        std::printf("%s\n", toLine({{"event", "ripped"},
                                    {"track", part.track.number},
                                    {"output", part.file.native()},
                                    {"crc32", formatCrc(reader.getCrc())},
                                    {"frames", reader.getFrames()},
                                    {"duration", seconds},
                                    {"repairs", reader.getRepairs()},
                                    {"peak", peak},
                                    {"verified", m_options.verify}})
                                .c_str());
        flushEvents();
    } else if (m_options.show == EOutput::normal) {
        char number[16], percent[16];
        std::snprintf(number, sizeof number, "%2d", part.track.number);
        std::snprintf(percent, sizeof percent, "%.1f", peak * 100);
        part.report = tr("host.Rip.report",
                         "track %TRACK%  CRC-32 %CRC%  %DURATION%  %REPAIRS% repaired  peak %PEAK% %",
                         {{"%TRACK%", number},
                          {"%CRC%", formatCrc(reader.getCrc())},
                          {"%DURATION%", formatDuration(seconds)},
                          {"%REPAIRS%", std::to_string(std::max<int64_t>(reader.getRepairs(), 0))},
                          {"%PEAK%", percent}});
        if (m_options.verify) part.report += "  " + tr("host.Rip.verified", "verified");
    }
}

std::unique_ptr<CTrackReader> CRipper::openPart(const SPart& part) {
    std::scoped_lock lock(m_mutex);
    const int number = part.track.number;
    const int64_t frames = int64_t{part.track.length} * kBlockFrames;
    std::vector<CTrackReader::SSection> sections;
    sections.push_back({m_disc.openTrack(std::max(number, 1)), number == 0 ? -frames : 0, frames});
    if (part.gap > 0) sections.push_back({m_disc.openTrack(number + 1), -part.gap, part.gap});
    return std::make_unique<CTrackReader>(std::move(sections));
}

// False if Ctrl-C ended it.
bool CRipper::copyPart(SPart& part, CProgress::Job job) {
    const auto started = std::chrono::steady_clock::now();
    const fs::path& target = part.file;
    createFolders(target.parent_path());
    COutput place(target, m_temporaryEnding, m_options.force);
    const std::unique_ptr<CTrackReader> reader = openPart(part);
    CHandle source = reader->createSource();
    CHandle format = requireFormat(m_library, place.getTemporary(), kCdSamples, m_options, target,
                                   tr("host.Rip.file", "The file"));
    bool done = false;
    try {
        done = encode(m_library, source, format, m_progress, job,
                      {m_disc.getPlace(), place.getTemporary(), target}, m_temporaryEnding);
    } catch (const std::runtime_error&) {
        // The encoder knows only that there are no samples.
        if (!reader->getFailure().empty()) throw std::runtime_error(reader->getFailure());
        throw;
    }
    source.reset();
    format.reset();
    if (!done) return false;
    reader->requireComplete();
    if (m_options.verify && !reader->verify([] { return isCancelled(); })) return false;
    if (canHaveTag(target)) setTags(part.track, place.getTemporary());
    const uint64_t bytes = fs::file_size(place.getTemporary());
    place.commit();
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - started;
    m_progress.finish(
        job, {static_cast<double>(part.getFrames()) / kDiscRate, elapsed.count(), bytes, codecName(target)});
    report(part, *reader);
    return true;
}

// False for a failure, which has been reported.
bool CRipper::ripPart(SPart& part) {
    const CProgress::Job job = m_progress.start(m_disc.getPlace(), part.file, {{"track", part.track.number}});
    try {
        if (!copyPart(part, job)) m_progress.cancel(job);
        return true;
    } catch (const std::exception& failure) {
        m_progress.fail(job,
                        tr("host.Rip.failed", "track %TRACK%: %REASON%",
                           {{"%TRACK%", std::to_string(part.track.number)}, {"%REASON%", failure.what()}}));
        return false;
    }
}

void CRipper::writeCue() const {
    std::string sheet;
    const auto add = [&](const char* command, const std::string& text) {
        if (!text.empty()) sheet += std::string(command) + " " + quote(text) + "\n";
    };
    add("TITLE", m_album);
    add("PERFORMER", m_albumArtist);
    if (const std::string code = m_disc.getText(DISCIO_TEXT_CODE); !code.empty())
        sheet += "CATALOG " + code + "\n";
    const fs::path target = getCueTarget();
    const auto addTrack = [&](const SDiscTrack& track) {
        sheet += "  TRACK " + std::string(track.number < 10 ? "0" : "") + std::to_string(track.number) +
                 " AUDIO\n";
        add("    TITLE", track.title);
        add("    PERFORMER", track.performer);
        if (!track.code.empty()) sheet += "    ISRC " + track.code + "\n";
    };
    bool isStarted = false; // the next track, by its pregap in the file of the one before
    for (size_t i = 0; i < m_parts.size(); ++i) {
        const SPart& part = m_parts[i];
        const fs::path name = part.file.lexically_relative(target.parent_path());
        sheet += "FILE " + quote(name.native()) + " WAVE\n";
        if (part.track.number > 0) {
            if (!isStarted) addTrack(part.track);
            sheet += "    INDEX 01 00:00:00\n";
        }
        const bool isHidden = part.track.number == 0;
        const bool hasNext = i + 1 < m_parts.size() && m_parts[i + 1].track.number == part.track.number + 1;
        isStarted = hasNext && (isHidden || part.gap > 0);
        if (!isStarted) continue;
        addTrack(m_parts[i + 1].track);
        sheet += "    INDEX 00 " + formatPlace(isHidden ? 0 : part.track.length) + "\n";
    }
    COutput place(target, m_temporaryEnding, m_options.force);
    std::ofstream out(place.getTemporary(), std::ios::binary);
    out << sheet;
    out.close();
    if (!out)
        throw std::runtime_error(
            tr("host.Rip.notWritten", "%FILE% could not be written", {{"%FILE%", target.string()}}));
    place.commit();
}

int CRipper::run() {
    // Better known before the tracks are read than behind them.
    if (std::error_code none; m_options.writeCue && !m_options.force && fs::exists(getCueTarget(), none))
        throw std::runtime_error(tr("host.existsForce", "%FILE% exists (--force replaces it)",
                                    {{"%FILE%", getCueTarget().string()}}));
    std::atomic<bool> failed{false};
    // The head of a drive should not have to move between tracks.
    runParallel(m_parts.size(), m_disc.isDevice() ? 1 : m_options.jobs, [&](size_t index) {
        if (!ripPart(m_parts[index])) failed = true;
    });
    for (const SPart& part : m_parts)
        if (!part.report.empty()) std::printf("%s\n", part.report.c_str());
    flushEvents();
    if (isCancelled()) return kExitCancelled;
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
