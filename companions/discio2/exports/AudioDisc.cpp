#include "exports/Handles.h"

#include <algorithm>
#include <array>
#include <cstring>

using namespace discio;

namespace {

constexpr int kChannels = 2;
constexpr int kRate = kFramesPerSector * kSectorsPerSecond;

// Delivers a track at any frame from whole sectors.
class CTrackStream {
public:
    CTrackStream(std::shared_ptr<IMedium> medium, const STrack& track)
        : m_medium(std::move(medium)), m_track(track) {}

    int64_t getFrameCount() const { return int64_t{m_track.length} * kFramesPerSector; }
    int64_t getPosition() const { return m_position; }
    int64_t getRepairs() const { return m_reader ? m_reader->getRepairs() : -1; }

    void open() {
        if (!m_reader) m_reader = m_medium->createAudioReader(m_track);
        m_position = 0;
        m_buffered = -1;
    }
    void close() { m_reader.reset(); }

    void seek(int64_t frame) {
        requireOpen();
        if (frame < 0 || frame > getFrameCount())
            throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "frame " + std::to_string(frame));
        m_position = frame;
    }

    int32_t read(int16_t* samples, int32_t frames) {
        requireOpen();
        const auto wanted = static_cast<int32_t>(std::min<int64_t>(frames, getFrameCount() - m_position));
        int32_t done = 0;
        while (done < wanted) {
            const auto sector = static_cast<int32_t>(m_position / kFramesPerSector);
            const auto inside = static_cast<int32_t>(m_position % kFramesPerSector);
            int16_t* const to = samples + size_t{kChannels} * static_cast<size_t>(done);
            int32_t count = (wanted - done) / kFramesPerSector;
            if (inside == 0 && count > 0) {
                m_reader->read(m_track.start + sector, count, to);
                count *= kFramesPerSector;
            } else {
                if (m_buffered != sector) m_reader->read(m_track.start + sector, 1, m_sector.data());
                m_buffered = sector;
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
    void requireOpen() const {
        if (!m_reader) throw CDiscError(DISCIO_ERROR_STREAM_NOT_OPEN, "");
    }

    std::shared_ptr<IMedium> m_medium;
    STrack m_track;
    std::unique_ptr<IAudioReader> m_reader; // while open
    int64_t m_position = 0;
    int32_t m_buffered = -1; // the sector in the buffer
    std::array<int16_t, kAudioSectorBytes / 2> m_sector{};
};

CTrackStream& get(void* user) {
    if (!user) throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
    return *static_cast<CTrackStream*>(user);
}

template <class Body> int32_t succeed(Body body) {
    return barrier<int32_t>(0, [&] {
        body();
        return 1;
    });
}

const DISCIO_PCMAudioStreamFuncs kTrackFuncs{
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

struct STrackHandle : DISCIO_PCMAudioStream {
    STrackHandle(const std::shared_ptr<IMedium>& medium, const STrack& track)
        : DISCIO_PCMAudioStream{static_cast<uint32_t>(EKind::stream), &kTrackFuncs, nullptr},
          stream(medium, track) {
        user = &stream;
    }
    CTrackStream stream;
};

const STrack& requireSegment(const SDisc& disc, int32_t segment) {
    if (disc.segments.empty()) throw CDiscError(DISCIO_ERROR_NO_AUDIO, "");
    if (segment < 0 || segment >= static_cast<int32_t>(disc.segments.size()))
        throw CDiscError(DISCIO_ERROR_NO_SUCH_OBJECT, "track " + std::to_string(segment + 1));
    return disc.segments[static_cast<size_t>(segment)];
}

const std::string& requireText(const Texts& texts, int32_t text) {
    if (text < 0 || text >= static_cast<int32_t>(texts.size()))
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "text " + std::to_string(text));
    return texts[static_cast<size_t>(text)];
}

} // namespace

namespace discio {

void releaseStream(DISCIO_PCMAudioStream* stream) {
    stream->kind = static_cast<uint32_t>(EKind::released);
    delete static_cast<STrackHandle*>(stream);
}

} // namespace discio

int32_t DISCIO_DiscAudioGetSegmentCount(DISCIO_Disc* disc) {
    return barrier<int32_t>(-1, [&] { return require(disc).disc->segments.size(); });
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
        return own.texts.hold(&own.texts, requireText(requireSegment(*own.disc, segment).texts, text));
    });
}

DISCIO_PCMAudioStream* DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(DISCIO_Disc* disc, int32_t segment) {
    return barrier<DISCIO_PCMAudioStream*>(nullptr, [&]() -> DISCIO_PCMAudioStream* {
        const SDisc& own = *require(disc).disc;
        return new STrackHandle(own.medium, requireSegment(own, segment));
    });
}

double DISCIO_PCMAudioStreamGetApproximateLengthSeconds(DISCIO_PCMAudioStream* stream) {
    return barrier(-1.0, [&] {
        const DISCIO_PCMAudioStream& own = require(stream, EKind::stream);
        return own.funcs->getLength(own.user);
    });
}
