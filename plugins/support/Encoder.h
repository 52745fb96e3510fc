// What the author of a writing plug-in writes.
#pragma once

#include "support/MediaFile.h"
#include "support/OutputFile.h"

#include <optional>

namespace sonora2::plugins {

struct SEncoderSettings {
    SPcmFormat format;
    std::optional<double> quality; // 0.0 to 1.0; empty: the codec's own default
    int nominalBitRate = 0;        // bits per second, 0 where open
    int minBitRate = 0;
    int maxBitRate = 0;
};

// Encodes PCM into one file. CEncoderFormat does everything else: states, the file and its failures.
// One thread at a time. The destructor frees what the codec holds and writes nothing.
class IEncoder {
public:
    virtual ~IEncoder() = default;

    // Whether the codec takes this format; asked once before a format object is handed out.
    virtual bool accepts(const SPcmFormat& format) const = 0;
    // Throws what is wrong with the settings; the target file has not been touched when it does.
    virtual void open(COutputFile& file, const SEncoderSettings& settings) = 0;
    virtual void write(const uint8_t* pcm, int frames) = 0;
    // Brings the sizes in the file's headers up to date in the middle of a job, where it has some that a
    // reader needs.
    virtual void update() {}
    // Completes the file, with the sizes in its headers. Called once, also after a cancelled job.
    virtual void finish() = 0;
    // Bytes of the file for that many seconds; asked in any state.
    virtual int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const = 0;
};

} // namespace sonora2::plugins
