// Host-defined sources, and reading the samples of any source.
#include "host_support/Guard.h"
#include "host_support/HostSource.h"
#include "peru/strings/LocalizedFormat.h"

#include <limits>
#include <memory>
#include <vector>

using namespace tonewright::host_support;
using sonora2::common::IAudioSource;

namespace {

constexpr int64_t kMostFrames = INT64_C(1) << 48; // of a call; more does not fit into memory

// Shared by the read and seek functions of one source.
struct SUser {
    TONEWRIGHT_SourceCallbacks callbacks = {};
    void* user = nullptr;
    ~SUser() {
        if (callbacks.release) callbacks.release(user);
    }
};

class CReader : public peru::CObject {
public:
    explicit CReader(const P<IAudioSource>& source) : m_source(source) {
        if (!source->isOpened()) source->open();
        m_frameBytes = source->getChannelCount() * source->getBytesPerSample();
    }
    ~CReader() override = default;

    int64_t read(uint8_t* target, int64_t frames) {
        int64_t missing = frames * m_frameBytes;
        while (missing > 0 && fetch()) {
            const int64_t size = std::min<int64_t>(missing, m_chunk->getSize() - m_taken);
            std::memcpy(target, m_chunk->getData() + m_taken, static_cast<size_t>(size));
            m_taken += static_cast<uint32_t>(size);
            target += size;
            missing -= size;
        }
        return frames - (missing + m_frameBytes - 1) / m_frameBytes;
    }

    void seek(double seconds) {
        m_chunk.reset();
        m_source->skipToTime(seconds);
    }

private:
    // Gets the next chunk if the current one is used up. False at the end of the source.
    bool fetch() {
        while (!m_chunk || m_taken >= m_chunk->getSize()) {
            m_chunk = m_source->getNextAudioChunk();
            m_taken = 0;
            if (m_chunk) continue;
            if (m_source->isEOF()) return false;
            throw peru::CError(peru::localize("tonewright.Samples.stuck",
                                              "The source delivers nothing although it is not at its end"));
        }
        return true;
    }

    P<IAudioSource> m_source;
    P<sonora2::audio::IAudioChunk> m_chunk;
    uint32_t m_taken = 0; // bytes of the chunk
    int m_frameBytes = 1;
};

} // namespace

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateSourceFromCallbacks(int32_t sampleRate, int32_t channelCount,
                                                            int32_t bytesPerSample, int64_t frameCount,
                                                            const TONEWRIGHT_SourceCallbacks* callbacks,
                                                            void* user) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        const SHostSamples format{sampleRate, channelCount, bytesPerSample, frameCount};
        format.check();
        if (!callbacks || callbacks->size < sizeof(*callbacks) || !callbacks->read)
            throw peru::CError(
                peru::localize("tonewright.Samples.noReadFunction", "A source needs a read function"));
        const auto owner = std::make_shared<SUser>();
        owner->user = user;
        CHostSource::Seek seek;
        if (callbacks->seek)
            seek = [owner](int64_t frame) { return owner->callbacks.seek(owner->user, frame) == 1; };
        const auto source = peru::make<CHostSource>(
            format,
            [owner](void* samples, int64_t frames) {
                return owner->callbacks.read(owner->user, samples, frames);
            },
            std::move(seek));
        owner->callbacks = *callbacks; // from here on the destructor calls release
        return wrap(source);
    });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateSourceFromMemory(int32_t sampleRate, int32_t channelCount,
                                                         int32_t bytesPerSample, const void* samples,
                                                         int64_t frameCount) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        const SHostSamples format{sampleRate, channelCount, bytesPerSample, frameCount};
        format.check();
        const int64_t frameBytes = static_cast<int64_t>(channelCount) * bytesPerSample;
        if (frameCount < 0 || frameCount > std::numeric_limits<int64_t>::max() / frameBytes ||
            (!samples && frameCount > 0))
            throw peru::CError(peru::localize("tonewright.Samples.noSamples",
                                              "A source from memory needs samples and their number"));
        struct SCopy {
            std::vector<uint8_t> bytes;
            int64_t position = 0;
        };
        const auto copy = std::make_shared<SCopy>();
        const auto* first = static_cast<const uint8_t*>(samples);
        copy->bytes.assign(first, first + frameCount * frameBytes);
        return wrap(peru::make<CHostSource>(
            format,
            [copy, frameBytes](void* target, int64_t frames) {
                std::memcpy(target, copy->bytes.data() + copy->position,
                            static_cast<size_t>(frames * frameBytes));
                copy->position += frames * frameBytes;
                return frames;
            },
            [copy, frameBytes](int64_t frame) {
                copy->position = frame * frameBytes;
                return true;
            }));
    });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateReader(TONEWRIGHT_Handle source) {
    return guard<TONEWRIGHT_Handle>(
        nullptr, [&] { return wrap(peru::make<CReader>(require<IAudioSource>(source, "an audio source"))); });
}

int64_t TONEWRIGHT_Host_ReadFrames(TONEWRIGHT_Handle reader, void* samples, int64_t frames) {
    return guard<int64_t>(-1, [&] {
        const P<CReader> object = require<CReader>(reader, "a reader");
        if (frames < 0 || frames > kMostFrames || (!samples && frames > 0))
            throw peru::CError(peru::localize("tonewright.Samples.invalidBuffer",
                                              "The buffer or the number of frames is invalid"));
        return object->read(static_cast<uint8_t*>(samples), frames);
    });
}

int32_t TONEWRIGHT_Host_Seek(TONEWRIGHT_Handle reader, double seconds) {
    return guard(0, [&] {
        const P<CReader> object = require<CReader>(reader, "a reader");
        if (!(seconds >= 0.0))
            throw peru::CError(
                peru::localize("tonewright.Samples.invalidTime", "The time to seek to is invalid"));
        object->seek(seconds);
        return 1;
    });
}
