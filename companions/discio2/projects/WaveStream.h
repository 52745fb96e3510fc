// The samples of a WAV file.
#pragma once

#include "PcmStream.h"
#include "images/ImageLayout.h"

namespace discio {

class CWaveStream : public IPcmStream {
public:
    // Throws CDiscError unless the file has the format of an audio CD.
    explicit CWaveStream(const std::string& path) : m_file(path), m_data(findWaveData(m_file)) {}

    void open() override { m_position = 0; }
    void close() noexcept override {}
    int32_t getChannelCount() override { return 2; }
    int32_t getSampleRate() override { return kFramesPerSector * kSectorsPerSecond; }
    int64_t getFrameCount() override { return m_data.bytes / kFrameBytes; }
    int64_t getPosition() override { return m_position; }
    int64_t getRepairs() override { return 0; }
    void seek(int64_t frame) override;
    int32_t read(int16_t* samples, int32_t frames) override;

private:
    static constexpr int kFrameBytes = 4;

    CImageFile m_file;
    SWaveData m_data;
    int64_t m_position = 0;
};

} // namespace discio
