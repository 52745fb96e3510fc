#include "exports/Handles.h"

#include <algorithm>
#include <array>
#include <cstring>

using namespace discio;

namespace {

constexpr int kChannels = 2;
constexpr int kRate = kFramesPerSector * kSectorsPerSecond;

// Delivers a track at any frame from whole sectors.
class CTrackStream : public IPcmStream {
public:
    CTrackStream(std::shared_ptr<IMedium> medium, const STrack& track)
        : m_medium(std::move(medium)), m_track(track) {}

    int32_t getChannelCount() override { return kChannels; }
    int32_t getSampleRate() override { return kRate; }
    int64_t getFrameCount() override { return int64_t{m_track.length} * kFramesPerSector; }
    int64_t getPosition() override { return m_position; }
    int64_t getRepairs() override { return m_reader ? m_reader->getRepairs() : -1; }
    bool isInsertable() const override { return !m_medium->isVirtual(); }

    void open() override {
        if (!m_reader) m_reader = m_medium->createAudioReader(m_track);
        m_position = 0;
        m_buffered = kNoSector;
    }
    void close() noexcept override { m_reader.reset(); }

    void seek(int64_t frame) override {
        requireOpen();
        if (frame < -int64_t{getPregap()} * kFramesPerSector || frame > getFrameCount())
            throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "frame " + std::to_string(frame));
        m_position = frame;
    }

    int32_t read(int16_t* samples, int32_t frames) override {
        requireOpen();
        const auto wanted = static_cast<int32_t>(std::min<int64_t>(frames, getFrameCount() - m_position));
        int32_t done = 0;
        while (done < wanted) {
            const int64_t behind = m_position + int64_t{getPregap()} * kFramesPerSector; // not negative
            const auto sector = static_cast<int32_t>(behind / kFramesPerSector) - getPregap();
            const auto inside = static_cast<int32_t>(behind % kFramesPerSector);
            int16_t* const to = samples + size_t{kChannels} * static_cast<size_t>(done);
            int32_t count = (wanted - done) / kFramesPerSector;
            if (inside == 0 && count > 0) {
                m_reader->read(m_track.start + sector, count, to);
                count *= kFramesPerSector;
            } else {
                if (m_buffered != sector) {
                    m_buffered = kNoSector; // a read that fails may have changed it
                    m_reader->read(m_track.start + sector, 1, m_sector.data());
                    m_buffered = sector;
                }
                count = std::min(wanted - done, kFramesPerSector - inside);
                std::memcpy(to, m_sector.data() + kChannels * inside,
                            static_cast<size_t>(count) * kChannels * sizeof(int16_t));
            }
            done += count;
            m_position += count;
        }
        return done;
    }

private:
    static constexpr int32_t kNoSector = INT32_MIN;

    int32_t getPregap() const { return m_track.getReadablePregap(); }
    void requireOpen() const {
        if (!m_reader) throw CDiscError(DISCIO_ERROR_STREAM_NOT_OPEN, "");
    }

    std::shared_ptr<IMedium> m_medium;
    STrack m_track;
    std::unique_ptr<IAudioReader> m_reader; // while open
    int64_t m_position = 0;
    int32_t m_buffered = kNoSector; // the sector in the buffer
    std::array<int16_t, kAudioSectorBytes / 2> m_sector{};
};

IPcmStream& get(void* user) {
    if (!user) throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
    return *static_cast<IPcmStream*>(user);
}

template <class Body> int32_t succeed(Body body) {
    return barrier<int32_t>(0, [&] {
        body();
        return 1;
    });
}

} // namespace

const DISCIO_PCMAudioStreamFuncs discio::kStreamFuncs{
    [](void* user) {
        return barrier(-1.0, [&] { return static_cast<double>(get(user).getFrameCount()) / kRate; });
    },
    nullptr,
    [](void* user) { return succeed([&] { get(user).open(); }); },
    [](void* user) { succeed([&] { get(user).close(); }); },
    [](void*) { return int32_t{kChannels}; },
    [](void*) { return int32_t{kRate}; },
    [](void* user) { return barrier<int64_t>(-1, [&] { return get(user).getFrameCount(); }); },
    [](void* user) { return succeed([&] { get(user).seek(0); }); },
    [](void*) {},
    [](void*) { return int32_t{1}; },
    [](void* user, void* pcm, int32_t frames, int32_t* delivered) {
        if (delivered) *delivered = 0;
        return succeed([&] {
            if (!pcm || !delivered || frames < 0) throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
            *delivered = get(user).read(static_cast<int16_t*>(pcm), frames);
        });
    },
    [](void* user) { return barrier<int64_t>(-1, [&] { return get(user).getRepairs(); }); },
    [](void* user, int64_t frame) { return succeed([&] { get(user).seek(frame); }); },
    [](void* user) { return barrier<int64_t>(-1, [&] { return get(user).getPosition(); }); },
    [](void*) {},
};

namespace {

const std::string& requireText(const Texts& texts, int32_t text) {
    if (text < 0 || text >= static_cast<int32_t>(texts.size()))
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "text " + std::to_string(text));
    return texts[static_cast<size_t>(text)];
}

} // namespace

namespace discio {

int32_t SDisc::countSegments() const {
    const auto& tracks = medium->getContents().tracks;
    return static_cast<int32_t>(
        std::count_if(tracks.begin(), tracks.end(), [](const STrack& track) { return track.isAudio; }));
}

const STrack& SDisc::requireSegment(int32_t segment) const {
    if (!medium->hasComponent(true)) throw CDiscError(DISCIO_ERROR_NO_AUDIO, "");
    int32_t index = 0;
    for (const STrack& track : medium->getContents().tracks)
        if (track.isAudio && index++ == segment) return track;
    throw CDiscError(DISCIO_ERROR_NO_SUCH_OBJECT, "track " + std::to_string(segment + 1));
}

void releaseStream(DISCIO_PCMAudioStream* stream) {
    stream->kind = static_cast<uint32_t>(EKind::released);
    delete static_cast<SStreamHandle*>(stream);
}

} // namespace discio

int32_t DISCIO_DiscAudioGetSegmentCount(DISCIO_Disc* disc) {
    return barrier<int32_t>(-1, [&] { return require(disc).disc->countSegments(); });
}

const char16_t* DISCIO_DiscAudioGetMetaDataStringW(DISCIO_Disc* disc, int32_t text) {
    return barrier<const char16_t*>(nullptr, [&] {
        DISCIO_Disc& own = require(disc);
        const Texts& texts = own.disc->medium->getContents().texts;
        return own.texts.hold(&own.disc, requireText(texts, text));
    });
}

const char16_t* DISCIO_DiscAudioGetSegmentMetaDataStringW(DISCIO_Disc* disc, int32_t segment, int32_t text) {
    return barrier<const char16_t*>(nullptr, [&] {
        DISCIO_Disc& own = require(disc);
        return own.texts.hold(&own.texts, requireText(own.disc->requireSegment(segment).texts, text));
    });
}

DISCIO_PCMAudioStream* DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(DISCIO_Disc* disc, int32_t segment) {
    return barrier<DISCIO_PCMAudioStream*>(nullptr, [&]() -> DISCIO_PCMAudioStream* {
        const SDisc& own = *require(disc).disc;
        return new SStreamHandle(std::make_shared<CTrackStream>(own.medium, own.requireSegment(segment)));
    });
}

double DISCIO_PCMAudioStreamGetApproximateLengthSeconds(DISCIO_PCMAudioStream* stream) {
    return barrier(-1.0, [&] {
        const DISCIO_PCMAudioStream& own = require(stream, EKind::stream);
        return own.funcs->getLength(own.user);
    });
}
