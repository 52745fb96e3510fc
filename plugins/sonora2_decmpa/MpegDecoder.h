// Decodes MPEG audio layers I to III with libmpg123.
#pragma once

#include "support/Decoder.h"

#include <memory>
#include <mpg123.h>
#include <vector>

namespace sonora2::plugins {

// Delivers 16 bits. Encoder delay and padding are removed where the file states them.
// The first opening scans the whole file; later openings of the same file only read its beginning.
class CMpegDecoder : public IDecoder {
public:
    explicit CMpegDecoder(const SMediaFile& file) : m_file(file) {}

    SDecodedMedia open(const SDecoderOptions& options) override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;
    std::unique_ptr<IDecoder> createTwin() override; // shares the results of scanning

private:
    struct SDelete {
        void operator()(mpg123_handle* handle) const { mpg123_delete(handle); }
    };
    // Results of scanning the whole file.
    struct SScan {
        SFileIdentity identity; // of the scanned file
        int64_t start = 0;      // decoded frame at which the sound begins
        int64_t frames = 0;     // of the sound
        std::vector<off_t> places;
        off_t framesPerPlace = 0;
    };

    SPcmFormat readFormat();
    std::string getCodecName();
    void scan();
    void checkContinuity();
    P<peru::IString> describe(int error) const;
    [[noreturn]] void failToOpen() const;
    double toSeconds(int64_t frame) const { return static_cast<double>(frame) / m_format.rate; }
    static ssize_t readInput(void* self, void* data, size_t size);
    static off_t seekInput(void* self, off_t offset, int whence);

    SMediaFile m_file;
    SDecoderOptions m_options;
    SPcmFormat m_format;
    SScan m_scan;
    std::vector<char> m_buffer; // of the input
    InputFile m_input;          // read by the handle
    int64_t m_inputEnd = 0;     // of the sound; tags follow
    int64_t m_inputPosition = 0;
    std::unique_ptr<mpg123_handle, SDelete> m_handle; // while open
    int64_t m_position = 0;                           // next frame to read
    int m_mpegFrames = 1152;                          // decoded frames in an MPEG frame
    int64_t m_frameEnd = 0;     // where the next MPEG frame should start in the file; 0 if unknown
    int64_t m_checkedUntil = 0; // damage before this offset has been reported
    bool m_padding = false;     // silence is delivered for frames that are missing
};

} // namespace sonora2::plugins
