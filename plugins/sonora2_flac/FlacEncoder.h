// Encodes FLAC.
#pragma once

#include "sonora2_flac/LibraryEncoder.h"
#include "sonora2_flac/ParallelEncoder.h"
#include "support/Encoder.h"

#include <FLAC/metadata.h>
#include <md5.h>

#include <memory>
#include <vector>

namespace sonora2::plugins::flac {

// The quality selects the compression level, 0.0 to 1.0 for 0 to 8, by default 5; all are lossless. The file
// has a seek table and padding for tags, so that adding tags later does not move the sound. A long stream is
// encoded on several threads where that does not change the file.
class CFlacEncoder : public IEncoder, private IFrameSink {
public:
    CFlacEncoder();
    ~CFlacEncoder() override;

    bool accepts(const SPcmFormat& format) const override;
    uint32_t getUsedSettings() const override {
        return common::IFormatSettings::kQuality | common::IFormatSettings::kSampleWidth;
    }
    void open(COutputFile& file, const SEncoderSettings& settings) override;
    void write(const uint8_t* pcm, int frames) override;
    void update() override;
    void finish() override;
    int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const override;

private:
    struct SBlockDeleter {
        void operator()(FLAC__StreamMetadata* block) const { FLAC__metadata_object_delete(block); }
    };
    using MetadataBlock = std::unique_ptr<FLAC__StreamMetadata, SBlockDeleter>;
    struct SSeekPoint {
        int64_t frame;
        int64_t offset; // bytes from the first frame's header
        uint32_t frames;
    };

    static FLAC__StreamEncoderWriteStatus onWrite(const FLAC__StreamEncoder* encoder, const FLAC__byte data[],
                                                  size_t size, uint32_t samples, uint32_t frame, void* self);
    static FLAC__StreamEncoderSeekStatus onSeek(const FLAC__StreamEncoder* encoder, FLAC__uint64 position,
                                                void* self);
    static FLAC__StreamEncoderTellStatus onTell(const FLAC__StreamEncoder* encoder, FLAC__uint64* position,
                                                void* self);
    void noteFrame(uint32_t samples); // the next one, at the file's position
    void addSeekPoint(int64_t offset, uint32_t frames);
    void addFrame(const uint8_t* bytes, size_t size, uint32_t samples) override;
    void addToHash(const std::vector<uint8_t>& pcm) noexcept override;
    void writeStreamInfo();
    void writeSeekTable();
    [[noreturn]] void failEncoding(const char* reason) override;
    const char* getState() const; // of the library's encoder

    MetadataBlock m_seekTable; // both must outlive the encoder
    MetadataBlock m_padding;
    std::unique_ptr<CLibraryEncoder> m_encoder;
    std::unique_ptr<CParallelEncoder> m_parallel; // null if this thread encodes the whole stream
    COutputFile* m_file = nullptr;                // null outside a job; nothing is written then
    SPcmFormat m_format;
    MD5_CTX m_hash{};             // of the samples, if the stream is encoded in parallel
    uint32_t m_smallestFrame = 0; // bytes; 0 before the first
    uint32_t m_largestFrame = 0;
    std::vector<SSeekPoint> m_seekPoints;
    int64_t m_seekSpacing = 0;     // frames
    int64_t m_seekTableStart = -1; // offset of the points in the file
    int64_t m_soundStart = -1;
    int64_t m_encoded = 0; // frames
};

} // namespace sonora2::plugins::flac
