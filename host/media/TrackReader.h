// Feeds an audio track to an encoder and measures what is read.
#pragma once

#include "library/Library.h"
#include "media/Disc.h"

#include <functional>
#include <vector>

namespace host {

class CTrackReader {
public:
    // Frames of an open stream. Those of the pregap are negative.
    struct SSection {
        DiscHandle<DISCIO_PCMAudioStream> stream;
        int64_t first = 0;
        int64_t count = 0;
    };
    // Delivers the sections one after the other. Throws std::runtime_error.
    explicit CTrackReader(std::vector<SSection> sections);

    // A source of the track's samples, which must not outlive this object. Null on failure.
    CHandle createSource();

    // Of everything that has been read in order from the start.
    uint32_t getCrc() const { return m_crc; }
    int64_t getFrames() const { return m_frames; }
    double getPeak() const { return m_peak / 32768.0; }
    int64_t getRepairs() const; // -1: unknown

    // Why the last read failed; empty if it did not.
    const std::string& getFailure() const { return m_reason; }
    // Throws std::runtime_error with the reason if not the whole track was read.
    void requireComplete() const;
    // Reads the track again. False if `stops` ended it; throws std::runtime_error if the samples differ.
    bool verify(const std::function<bool()>& stops);

private:
    // The one with that frame, and where it is inside.
    const SSection& findSection(int64_t frame, int64_t& inside) const;
    int64_t read(void* samples, int64_t frames);
    bool seek(int64_t frame);
    void restart();

    std::vector<SSection> m_sections;
    int64_t m_count = 0; // frames of all sections
    uint32_t m_crc = 0;
    int64_t m_frames = 0;
    int m_peak = 0;
    std::string m_reason; // why the last read failed
};

// The checksum of zip files and other programs' reports: continues that of what came before, 0 at the start.
uint32_t updateCrc32(uint32_t crc, const void* data, size_t size);

} // namespace host
