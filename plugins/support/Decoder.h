// What the author of a reading plug-in writes.
#pragma once

#include "support/MediaFile.h"

namespace sonora2::plugins {

struct SDecodedMedia {
    SPcmFormat format;
    int64_t frames = 0;     // exact: what a run to the end delivers from a sound file
    std::string codec = {}; // such as "FLAC" or "PCM signed 24 bit", for people; empty when unknown
};

// Decodes one file into PCM. CDecoderSource does everything else: states, conversion, read-ahead, time.
// Never used by two threads at once, but not always by the same one. Failures are thrown, best by fail().
// The destructor closes.
class IDecoder {
public:
    virtual ~IDecoder() = default;

    // Starts at frame 0. Called again after close(): what took long to find out should be kept.
    virtual SDecodedMedia open() = 0;
    virtual void close() = 0; // also after an open() that threw; nothing when closed
    // Fills up to `frames` frames and answers how many; fewer are legal, 0 means the end. What could be
    // decoded before a damaged place is delivered before the failure is thrown.
    virtual int read(uint8_t* pcm, int frames) = 0;
    // The next read starts at exactly that frame, 0 to the number of frames. Also legal at the end.
    virtual void seek(int64_t frame) = 0;
};

} // namespace sonora2::plugins
