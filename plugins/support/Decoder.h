// The interface that a reading plug-in implements.
#pragma once

#include "sonora2/context/ILogManager.h"
#include "support/MediaFile.h"

#include <memory>
#include <string>
#include <vector>

namespace sonora2::plugins {

struct SDecodedMedia {
    SPcmFormat format;
    int64_t frames = 0;      // exact: what reading an intact file to its end delivers
    std::string codec = {};  // to show to users, such as "FLAC" or "PCM signed 24 bit"; empty when unknown
    int floatBytes = 0;      // size of the file's floating-point samples if deliverFloat() is supported
    bool isEstimate = false; // the length is not exact: the sound ends where read() returns 0
    bool isDirect = false;   // read() takes locks of the caller, so another thread must not decode ahead
};

// One of several soundtracks in a file.
struct SSoundtrack {
    std::string name;
    std::string language;
};

struct SDecoderOptions {
    // Continue after damage: missing sound is replaced by silence of the same length and reported to the log.
    bool salvage = false;
    // Scale floating-point samples that exceed full scale when converting them to integers.
    bool preventClipping = false;
    P<common::ILogManager> log = {}; // may be empty

    // Reports something that does not stop the decoding.
    template <class... Args> void warn(const peru::SLocalizedText& text, const Args&... args) const {
        if (log) log->log(common::kSeverityWarning, peru::format(text, args...));
    }
    // The same for text that is not translated.
    template <class... Args> void warn(const char* text, const Args&... args) const {
        if (log) log->log(common::kSeverityWarning, peru::format(text, args...));
    }
};

// Decodes one file to PCM. CDecoderSource adds state checks, conversion, read-ahead and time.
// Calls never overlap but may come from different threads. Failures are thrown, preferably with fail().
// The destructor closes.
class IDecoder {
public:
    virtual ~IDecoder() = default;

    // Starts at frame 0. May be called again after close(), so results that were slow to obtain should be
    // cached.
    virtual SDecodedMedia open(const SDecoderOptions& options) = 0;
    virtual void close() = 0; // also called after open() has thrown; no effect when closed
    // Reads up to `frames` frames and returns the number read, which may be smaller; 0 means the end.
    // Everything that can be decoded before a damaged place is returned before the failure is thrown. An end
    // before the stated number of frames is reported by the caller unless that is an estimate.
    virtual int read(uint8_t* pcm, int frames) = 0;
    // The next read starts at exactly this frame, from 0 to the number of frames inclusive. If that is an
    // estimate, the frame may be behind the end, and the next read returns 0.
    virtual void seek(int64_t frame) = 0;
    // From the next seek() until close(), reads deliver the file's floating-point samples instead of
    // integers. Only called if open() has stated their size.
    virtual void deliverFloat() {}
    // The soundtracks of the file, the one that is decoded by default first. Known once it has been opened.
    virtual std::vector<SSoundtrack> getSoundtracks() { return {{}}; }
    // Selects one of them for the next open(). Only called while closed.
    virtual void selectSoundtrack(int index) {}
    // Another decoder of the same file, closed, for use by another thread while this one is open. Null unless
    // reading from any frame on yields exactly what an uninterrupted run does.
    virtual std::unique_ptr<IDecoder> createTwin() { return nullptr; }
};

} // namespace sonora2::plugins
