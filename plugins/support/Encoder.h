// The interface that the author of a writing plug-in implements.
#pragma once

#include "sonora2/media/IFormatSettings.h"
#include "support/MediaFile.h"
#include "support/OutputFile.h"

#include <optional>

namespace sonora2::plugins {

struct SEncoderSettings {
    SPcmFormat format;
    std::optional<double> quality; // 0.0 to 1.0; empty for the codec's own default
    int nominalBitRate = 0;        // bits per second, 0 for unspecified
    int minBitRate = 0;
    int maxBitRate = 0;
};

// Encodes PCM into one file. CEncoderFormat does everything else: states, the file and error handling. One
// thread at a time. The destructor frees the codec's resources and writes nothing.
class IEncoder {
public:
    virtual ~IEncoder() = default;

    // Whether the codec supports this format; called once before a format object is returned. May throw the
    // reason instead of returning false.
    virtual bool accepts(const SPcmFormat& format) const = 0;
    // The settings that have an effect on the file: a combination of IFormatSettings::ESetting.
    virtual uint32_t getUsedSettings() const { return common::IFormatSettings::kAllSettings; }
    // Throws if the settings are invalid; the target file has not been touched then.
    virtual void open(COutputFile& file, const SEncoderSettings& settings) = 0;
    virtual void write(const uint8_t* pcm, int frames) = 0;
    // Updates the sizes in the file's headers in the middle of a job, if a reader needs them.
    virtual void update() {}
    // Completes the file, with the sizes in its headers. Called once, also after a cancelled job.
    virtual void finish() = 0;
    // Estimated file size in bytes for that many seconds; may be called in any state.
    virtual int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const = 0;
    // Whether files can hold this format of floating-point samples. Other encoders never receive one.
    virtual bool holdsFloat(const SPcmFormat&) const { return false; }
};

} // namespace sonora2::plugins
