// Encodes a part of a stream by itself.
#pragma once

#include "sonora2_flac/LibraryEncoder.h"

#include <cstdint>
#include <string>
#include <vector>

namespace sonora2::plugins::flac {

// Whole blocks of sound that follow each other; only the last block of a stream may be shorter. Then, the
// frames.
struct SFrameRun {
    struct SFrame {
        uint32_t bytes;
        uint32_t samples; // of each channel
    };

    uint64_t firstNumber = 0; // of the first frame in the stream
    std::vector<uint8_t> pcm;
    std::vector<uint8_t> encoded;
    std::vector<SFrame> frames; // in `encoded`
    std::string failure;        // of the library; empty for none
    bool isEncoded = false;
    bool isHashed = false;

    bool isDone() const { return isEncoded && isHashed; }
};

// Yields the same frames as an encoder of the whole stream, for the levels for which canSplit() is true. One
// thread at a time.
class CFrameRunEncoder {
public:
    explicit CFrameRunEncoder(const SStreamSettings& settings);

    // Whether every frame at these settings depends on its own samples alone.
    static bool canSplit(const SStreamSettings& settings);

    void encode(SFrameRun& run) noexcept;

private:
    static FLAC__StreamEncoderWriteStatus onWrite(const FLAC__StreamEncoder* encoder, const FLAC__byte data[],
                                                  size_t size, uint32_t samples, uint32_t frame, void* self);

    const int m_frameBytes;
    CLibraryEncoder m_encoder;
    SFrameRun* m_run = nullptr; // while encoding
};

} // namespace sonora2::plugins::flac
