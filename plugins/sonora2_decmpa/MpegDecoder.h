// Reads MPEG audio, layers I to III, with libmpg123.
#pragma once

#include "support/Decoder.h"

#include <memory>
#include <mpg123.h>
#include <vector>

namespace sonora2::plugins {

// Delivers 16 bit. What an encoder put before and behind the sound is cut off where the file tells how much.
// The first opening reads the whole file; later ones of the same file only its beginning.
class CMpegDecoder : public IDecoder {
public:
    explicit CMpegDecoder(const SMediaFile& file) : m_file(file) {}

    SDecodedMedia open() override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;

private:
    struct SDelete {
        void operator()(mpg123_handle* handle) const { mpg123_delete(handle); }
    };
    // Tells a file from its successor of the same name.
    struct SIdentity {
        uint64_t device = 0;
        uint64_t node = 0;
        int64_t size = -1;
        int64_t seconds = 0;
        int64_t nanoseconds = 0;
        bool operator==(const SIdentity&) const = default;
    };
    // What only a run through the file tells.
    struct SScan {
        SIdentity identity; // of the file that was run through
        int64_t start = 0;  // decoded frame with which the sound begins
        int64_t frames = 0; // of the sound
        std::vector<off_t> places;
        off_t framesPerPlace = 0;
    };

    SPcmFormat readFormat();
    SIdentity identify() const;
    void scan();
    [[noreturn]] void failWith(const char* doing);

    SMediaFile m_file;
    SPcmFormat m_format;
    SScan m_scan;
    std::vector<char> m_buffer;                       // of the input
    InputFile m_input;                                // the handle reads from it
    std::unique_ptr<mpg123_handle, SDelete> m_handle; // while open
};

} // namespace sonora2::plugins
