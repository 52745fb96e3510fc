// Whole sectors of a project's track.
#pragma once

#include "Medium.h"
#include "PcmStream.h"

namespace discio {

class CSegmentReader : public IAudioReader {
public:
    // `frames` is the length that the stream announced when it was inserted. Throws CDiscError.
    CSegmentReader(const std::shared_ptr<IPcmStream>& stream, int64_t frames, const STrack& track);

    // Silence follows the announced length, and what the stream does not deliver. Failures name the track.
    void read(int32_t block, int32_t count, int16_t* samples) override;
    int64_t getRepairs() const override { return m_stream->getRepairs(); }

private:
    STrack m_track;
    int64_t m_frames;
    CStreamUse m_stream;
    int64_t m_position = 0; // of the next frame to be read
    bool m_isAtEnd = false;
};

} // namespace discio
