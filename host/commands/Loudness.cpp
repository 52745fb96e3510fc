#include "commands/Loudness.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Parallel.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/Arrangement.h"
#include "media/Download.h"
#include "media/GainTags.h"
#include "media/InputContent.h"
#include "media/InputFiles.h"
#include "media/PlaySource.h"
#include "media/Playlist.h"
#include "media/SoundFile.h"
#include "media/Warnings.h"
#include "terminal/Progress.h"

#include <atomic>
#include <cstdio>
#include <memory>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <utility>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr SSampleFormat kArrangementFormat{44100, 2, 2};

// One row of the table.
std::string formatRow(const TONEWRIGHT_Loudness& loudness, const SGain& gain, const std::string& name) {
    char row[128];
    const bool isKnown = isMeasurable(loudness), isLimited = isKnown && gain.limited < gain.wanted;
    std::snprintf(row, sizeof row, "%7s %6s %6s %7s %8s  ",
                  isKnown ? formatDecibels(loudness.integrated, false).c_str() : "-",
                  isKnown ? formatDecibels(loudness.range, false).c_str() : "-",
                  loudness.truePeak > 0.0 ? formatDecibels(toDecibels(loudness.truePeak), false).c_str()
                                          : "-",
                  isKnown ? formatDecibels(gain.wanted, true).c_str() : "-",
                  isLimited ? formatDecibels(gain.limited, true).c_str() : "-");
    return row + name;
}

// Values that do not exist are null.
nlohmann::json toJson(const TONEWRIGHT_Loudness& loudness, const SGain& gain) {
    const auto peak = [](double factor) {
        return factor > 0.0 ? nlohmann::json(toDecibels(factor)) : nlohmann::json();
    };
    nlohmann::json values{{"integrated", nullptr},
                          {"range", nullptr},
                          {"true_peak", peak(loudness.truePeak)},
                          {"sample_peak", peak(loudness.samplePeak)},
                          {"gain", nullptr},
                          {"limited_gain", nullptr}};
    if (isMeasurable(loudness))
        values.update({{"integrated", loudness.integrated},
                       {"range", loudness.range},
                       {"gain", gain.wanted},
                       {"limited_gain", gain.limited}});
    return values;
}

class CMeter {
public:
    CMeter(CLibrary& library, const SLoudnessOptions& options, const std::vector<SPlayItem>& items)
        : m_library(library), m_options(options), m_items(items),
          m_progress(options.json ? EOutput::json : EOutput::normal, nullptr), m_measurements(items.size()),
          m_tracks(items.size()), m_rows(items.size()) {}

    // Thread-safe.
    void measure(size_t index);
    // Once all are measured.
    void measureAlbum();
    void writeTags();
    bool hasFailed() const { return m_hasFailed; }

private:
    struct STrack {
        CProgress::Job job;
        TONEWRIGHT_Loudness loudness;
    };

    CHandle measureItem(const SPlayItem& item, CProgress::Job job);
    void printRow(size_t index, std::string row);
    void printLine(const std::string& row);

    CLibrary& m_library;
    const SLoudnessOptions& m_options;
    const std::vector<SPlayItem>& m_items;
    CProgress m_progress;
    std::vector<CHandle> m_measurements;         // empty where there is none, each set by one thread
    std::vector<std::optional<STrack>> m_tracks; // as well
    std::optional<TONEWRIGHT_Loudness> m_album;
    std::atomic<bool> m_hasFailed{false};
    std::mutex m_mutex;                             // guards the members below
    std::vector<std::optional<std::string>> m_rows; // of what is done; empty after a failure
    size_t m_printed = 0;
    bool m_hasHeader = false;
};

std::string describeItem(const SPlayItem& item) {
    const std::string name = toPrintable(item.name.native());
    return item.track == 0 ? name
                           : tr("host.Loudness.track", "%FILE%, track %NUMBER%",
                                {{"%FILE%", name}, {"%NUMBER%", std::to_string(item.track)}});
}

// Rows are printed in the order of the items.
void CMeter::printRow(size_t index, std::string row) {
    std::lock_guard lock(m_mutex);
    m_rows[index] = std::move(row);
    for (; m_printed < m_rows.size() && m_rows[m_printed]; m_rows[m_printed++]->clear())
        if (!m_rows[m_printed]->empty()) printLine(*m_rows[m_printed]);
}

void CMeter::printLine(const std::string& row) {
    if (!std::exchange(m_hasHeader, true))
        m_progress.print(tr("host.Loudness.header", "   LUFS     LU   dBTP    gain  limited  file"));
    m_progress.print(row);
}

CHandle CMeter::measureItem(const SPlayItem& item, CProgress::Job job) {
    if (!item.failure.empty()) throw std::runtime_error(item.failure);
    const auto progress = [&](double fraction) { m_progress.advance(job, fraction); };
    if (isArrangement(item.file))
        return measureLoudness(openArrangement(m_library, item.file, kArrangementFormat), item.file,
                               progress);
    const CInputContent content(item.file);
    if (isCancelled()) return {};
    SSoundFile sound = openSoundFile(content.getPath());
    if (item.track == 0) {
        CHandle measurement = measureLoudness(sound.source, content.getPath(), progress);
        reportWarnings(sound.source, content.getPath(), m_progress, job);
        return measurement;
    }
    sound.source.reset();
    SPlayItem part = item;
    part.file = content.getPath();
    const SPlaySource source = openPlaySource(m_library, part, sound.samples);
    CHandle measurement = measureLoudness(source.source, part.file, progress);
    if (source.result->getLength() >= 0 && !source.result->getFailure().empty())
        throw std::runtime_error(source.result->getFailure());
    return measurement;
}

void CMeter::measure(size_t index) {
    const SPlayItem& item = m_items[index];
    nlohmann::json details = nlohmann::json::object();
    if (item.track > 0) details["track"] = item.track;
    const CProgress::Job job = m_progress.start(item.name, std::nullopt, details);
    std::string row;
    try {
        m_measurements[index] = measureItem(item, job);
        if (!m_measurements[index]) return m_progress.cancel(job);
        const TONEWRIGHT_Loudness loudness = getLoudness({m_measurements[index].get()});
        const SGain gain = findGain(loudness, m_options.target);
        details.update(toJson(loudness, gain));
        m_progress.finishWith(job, details);
        m_tracks[index] = STrack{job, loudness};
        row = formatRow(loudness, gain, describeItem(item));
        if (!m_options.album) m_measurements[index].reset();
    } catch (const std::exception& error) {
        m_measurements[index].reset();
        m_hasFailed = true;
        m_progress.fail(job, error.what());
    }
    printRow(index, std::move(row));
}

void CMeter::measureAlbum() {
    std::vector<TONEWRIGHT_Handle> handles;
    for (const CHandle& measurement : m_measurements)
        if (measurement) handles.push_back(measurement.get());
    if (handles.size() < 2) return;
    const TONEWRIGHT_Loudness loudness = getLoudness(handles);
    m_album = loudness;
    const SGain gain = findGain(loudness, m_options.target);
    nlohmann::json details = toJson(loudness, gain);
    details["files"] = handles.size();
    m_progress.announce("album", details);
    printLine(formatRow(
        loudness, gain,
        tr("host.Loudness.album", "(all %COUNT% together)", {{"%COUNT%", std::to_string(handles.size())}})));
}

// An album of which a file is missing would get a wrong gain.
void CMeter::writeTags() {
    if (m_hasFailed) m_album.reset();
    for (size_t i = 0; i < m_items.size() && !isCancelled(); ++i) {
        if (!m_tracks[i]) continue;
        try {
            const SPlayItem& item = m_items[i];
            if (item.track > 0 || isStandardStream(item.file) || isWebAddress(item.file))
                throw std::runtime_error(tr("host.Loudness.noTag", "Has no tag that could be changed"));
            writeGainTags(item.file, m_tracks[i]->loudness, m_album);
        } catch (const std::exception& error) {
            m_hasFailed = true;
            m_progress.fail(m_tracks[i]->job, error.what());
        }
    }
}

} // namespace

int showLoudness(CLibrary& library, const SLoudnessOptions& options) {
    const std::vector<SPlayItem> items =
        listItems(options.inputs, listReadExtensions(library), options.recursive);
    CMeter meter(library, options, items);
    runParallel(items.size(), options.jobs, [&](size_t index) { meter.measure(index); });
    if (isCancelled()) return kExitCancelled;
    if (options.album) meter.measureAlbum();
    if (options.tag) meter.writeTags();
    return isCancelled() ? kExitCancelled : meter.hasFailed() ? kExitFailure : kExitSuccess;
}

} // namespace host
