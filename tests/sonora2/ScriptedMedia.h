// A source and a format that follow a test's script and record what is done to them.
#pragma once

#include "peru/Errors.h"
#include "sonora2/encoding/IEncodeListener.h"
#include "support/Files.h"
#include "support/MediaBase.h"

#include <cstring>
#include <deque>
#include <functional>
#include <string>
#include <vector>

namespace tests {

inline P<sonora2::audio::CAudioChunk> makeChunk(double timestamp, const std::string& bytes) {
    P<peru::IMemoryBlock> block = peru::make<peru::CMemoryBlock>(static_cast<int64_t>(bytes.size()));
    std::memcpy(block->getData(), bytes.data(), bytes.size());
    return peru::make<sonora2::audio::CAudioChunk>(timestamp, block);
}

// Delivers its media in chunks of the given sizes (bytes), repeatedly; a size of 0 is an empty chunk.
class CScriptedSource : public CSourceBase {
public:
    int rate = 44100;
    int channels = 2;
    int bytesPerSample = 2;
    double chunkTimestamp = 77.0; // of every chunk
    std::string media;
    std::vector<size_t> cuts{1000};
    bool emptyBeforeEnd = false;        // returns empty handles before its end
    std::deque<bool> eofAnswers;        // used first, if any
    std::function<void()> beforeChunk;  // may throw
    std::function<void()> beforeFormat; // may throw
    std::function<void()> beforeClose;

    int closes = 0;

    void open() override {
        ++opens;
        m_opened = true;
        m_position = 0;
    }
    void close() override {
        ++closes;
        if (beforeClose) beforeClose();
        m_opened = false;
    }
    void skipToTime(double) override {}
    double getDuration() override {
        return static_cast<double>(media.size()) / (channels * bytesPerSample) / rate;
    }
    bool isEOF() override {
        if (eofAnswers.empty()) return m_position >= media.size();
        const bool answer = eofAnswers.front();
        eofAnswers.pop_front();
        return answer;
    }
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override {
        if (beforeChunk) beforeChunk();
        if (emptyBeforeEnd || m_position >= media.size()) return nullptr;
        const size_t size = std::min(cuts[m_cut++ % cuts.size()], media.size() - m_position);
        m_position += size;
        return makeChunk(chunkTimestamp, media.substr(m_position - size, size));
    }
    // Like a decoder, it knows its format only while open.
    int getSampleRate() override { return m_opened ? rate : 0; }
    int getChannelCount() override {
        if (beforeFormat) beforeFormat();
        return m_opened ? channels : 0;
    }
    int getBytesPerSample() override { return m_opened ? bytesPerSample : 0; }

private:
    size_t m_position = 0;
    size_t m_cut = 0;
};

class CScriptedFormat : public CFormatBase {
public:
    std::function<void()> beforeWrite; // may throw
    std::function<void()> beforeClose;

    std::string written;
    std::vector<size_t> sizes;
    std::vector<double> timestamps;
    int opens = 0;
    int closes = 0;

    void open() override {
        ++opens;
        m_opened = true;
    }
    void close() override {
        ++closes;
        if (beforeClose) beforeClose();
        m_opened = false;
    }
    int64_t getEstimatedSizeBytes(double) override { return 0; }
    int getSampleRate() override { return 44100; }
    int getChannelCount() override { return 2; }
    int getBytesPerSample() override { return 2; }
    void setAudioQuality(double) override {}
    void setAudioBitRate(int, int, int) override {}
    void writeAudioChunk(const P<sonora2::audio::IAudioChunk>& chunk) override {
        if (beforeWrite) beforeWrite();
        written += bytesOf(chunk);
        sizes.push_back(chunk->getSize());
        timestamps.push_back(chunk->getTimestamp());
    }
};

// Records the calls; returns false from a fraction on.
class CScriptedListener : public peru::CObject, public sonora2::common::IEncodeListener {
public:
    double stopFrom = 2.0;
    std::function<void()> onCall;
    std::vector<double> fractions;
    std::vector<int32_t> integers;

    bool onProgress(double fraction, int32_t reserved) override {
        fractions.push_back(fraction);
        integers.push_back(reserved);
        if (onCall) onCall();
        return fraction < stopFrom;
    }
};

} // namespace tests
