#include "media/PlaySource.h"

#include "base/CancelWatch.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Arrangement.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <stdexcept>
#include <tonewright/host.h>

namespace host {

namespace {

// An arrangement is mixed in steps of this length, and its last step may extend beyond its end.
constexpr int64_t kStepFrames = 4000;
// A player ends with the stated duration of its source, and a stream has none.
constexpr int64_t kEndlessSeconds = 1'000'000'000;

} // namespace

// Reads a part of a source.
class CItemReader {
public:
    CItemReader(const SPlayItem& item, const SSampleFormat& samples, CHandle source, bool isPadded,
                std::shared_ptr<CWebStream> stream)
        : m_file(item.file), m_samples(samples), m_first(toFrames(item.begin)), m_isPadded(isPadded),
          m_stream(std::move(stream)), m_source(std::move(source)),
          m_reader(TONEWRIGHT_Host_CreateReader(m_source.get())) {
        if (!m_reader)
            throw std::runtime_error(takeFailure(tr("host.unreadable", "The file cannot be read"), m_file));
    }

    // Frames from the beginning of the item to its end, where the source has that duration.
    int64_t measure(const SPlayItem& item, double duration) const {
        const auto all = static_cast<int64_t>(std::ceil(duration * m_samples.rate - 1e-3));
        const int64_t end = item.end ? std::min(toFrames(*item.end), all) : all;
        if (end <= m_first && item.track > 0)
            throw std::runtime_error(
                tr("host.Play.beyondEnd", "Track %NUMBER% begins after the end of %FILE%",
                   {{"%NUMBER%", std::to_string(item.track)}, {"%FILE%", item.file.filename().string()}}));
        return end - m_first + (m_isPadded ? kStepFrames : 0);
    }
    const std::shared_ptr<CPlayResult>& getResult() const { return m_result; }

    int64_t read(void* samples, int64_t frames) {
        clearFailure();
        int64_t count = TONEWRIGHT_Host_ReadFrames(m_reader.get(), samples, frames);
        if (count < 0) {
            end(takeFailure(tr("host.unreadable", "The file cannot be read"), m_file));
            return 0;
        }
        if (m_isPadded && count < frames) {
            const auto frameBytes = static_cast<size_t>(m_samples.channels * m_samples.bytesPerSample);
            std::memset(static_cast<char*>(samples) + static_cast<size_t>(count) * frameBytes, 0,
                        static_cast<size_t>(frames - count) * frameBytes);
            count = frames;
        }
        m_position += count;
        if (count == 0) end(m_stream ? m_stream->getFailure() : "");
        return count;
    }
    bool seek(int64_t frame) {
        if (m_stream && frame != m_position) return false;
        if (TONEWRIGHT_Host_Seek(m_reader.get(), static_cast<double>(m_first + frame) / m_samples.rate) != 1)
            return false;
        m_position = frame;
        if (m_result->m_failure.empty()) m_result->m_length = -1;
        return true;
    }

private:
    int64_t toFrames(int64_t cueFrames) const { return cueFrames * m_samples.rate / kCueFrames; }
    void end(const std::string& failure) {
        if (!m_result->m_failure.empty()) return;
        m_result->m_failure = failure;
        m_result->m_length = static_cast<double>(m_position) / m_samples.rate;
    }

    const std::filesystem::path m_file;
    const SSampleFormat m_samples;
    const int64_t m_first;
    const bool m_isPadded; // with silence, to the length of the source
    const std::shared_ptr<CWebStream> m_stream;
    CHandle m_source;
    CHandle m_reader;
    int64_t m_position = 0; // frames from the beginning of the item
    std::shared_ptr<CPlayResult> m_result = std::make_shared<CPlayResult>();
};

namespace {

// Waits for sound; Ctrl-C ends that. The reason of the stream comes before that of its decoder.
SSoundFile openStream(CWebStream& stream) {
    const CCancelWatch watch([&stream] { stream.stop(); });
    try {
        return openSoundPipe(stream.getPath());
    } catch (const std::runtime_error& failure) {
        const std::string reason = stream.getFailure();
        throw std::runtime_error(reason.empty() ? failure.what() : reason);
    }
}

CHandle openInFormat(CLibrary& library, const SPlayItem& item, const SSampleFormat& samples,
                     CWebStream* stream) {
    if (!stream && isArrangement(item.file)) return openArrangement(library, item.file, samples);
    SSoundFile sound = stream ? openStream(*stream) : openSoundFile(item.file);
    if (sound.samples != samples &&
        TONEWRIGHT_Host_SetSourceFormat(sound.source.get(), samples.rate, samples.channels,
                                        samples.bytesPerSample) != 1)
        throw std::runtime_error(
            takeFailure(tr("host.inconvertible", "Cannot be converted from %FROM% to %TO%",
                           {{"%FROM%", describe(sound.samples)}, {"%TO%", describe(samples)}}),
                        item.file));
    return std::move(sound.source);
}

} // namespace

SPlaySource openPlaySource(CLibrary& library, const SPlayItem& item, const SSampleFormat& samples) {
    if (!item.failure.empty()) throw std::runtime_error(item.failure);
    SPlaySource made;
    if (item.isStream) made.stream = std::make_shared<CWebStream>(item.file);
    CHandle opened = openInFormat(library, item, samples, made.stream.get());
    const double duration = item.isStream ? 0 : library.AudioSource_GetDuration(opened.get());
    auto reader = std::make_unique<CItemReader>(item, samples, std::move(opened),
                                                !item.isStream && isArrangement(item.file), made.stream);
    made.result = reader->getResult();
    const int64_t frames = item.isStream  ? kEndlessSeconds * samples.rate
                           : duration > 0 ? reader->measure(item, duration)
                                          : -1;
    if (item.begin > 0 && !reader->seek(0))
        throw std::runtime_error(
            takeFailure(tr("host.Play.seek", "The file cannot be read from that time on"), item.file));
    TONEWRIGHT_SourceCallbacks callbacks = {};
    callbacks.size = sizeof callbacks;
    callbacks.read = [](void* user, void* target, int64_t count) {
        return static_cast<CItemReader*>(user)->read(target, count);
    };
    callbacks.seek = [](void* user, int64_t frame) -> int32_t {
        return static_cast<CItemReader*>(user)->seek(frame) ? 1 : 0;
    };
    callbacks.release = [](void* user) { delete static_cast<CItemReader*>(user); };
    made.source = CHandle(TONEWRIGHT_Host_CreateSourceFromCallbacks(
        samples.rate, samples.channels, samples.bytesPerSample, frames, &callbacks, reader.get()));
    if (!made.source)
        throw std::runtime_error(takeFailure(tr("host.Play.failed", "The file cannot be played"), item.file));
    static_cast<void>(reader.release()); // by the source
    made.duration = item.track > 0 ? static_cast<double>(frames) / samples.rate : duration;
    return made;
}

} // namespace host
