// Samples of 16 bits in order, from a track, a file or a host.
#pragma once

#include "Error.h"

#include <atomic>
#include <cstdint>
#include <memory>

namespace discio {

// Belongs to one thread. All functions throw CDiscError unless stated otherwise.
class IPcmStream {
public:
    virtual ~IPcmStream() = default;
    virtual void open() = 0; // at the first frame; the others require it
    virtual void close() noexcept = 0;
    virtual int32_t getChannelCount() = 0;
    virtual int32_t getSampleRate() = 0;
    virtual int64_t getFrameCount() = 0;
    virtual int64_t getPosition() = 0;
    virtual int64_t getRepairs() = 0; // -1: unknown
    virtual void seek(int64_t frame) = 0;
    // Up to that many frames; 0 only at the end.
    virtual int32_t read(int16_t* samples, int32_t frames) = 0;
    // A track of a virtual disc may not become part of one: the disc could contain itself.
    virtual bool isInsertable() const { return true; }

private:
    friend class CStreamUse;
    std::atomic<bool> m_isInUse = false;
};

// Opens a stream for as long as it exists. Throws CDiscError, with DISCIO_ERROR_STREAM_ALREADY_OPEN if
// another object uses the stream.
class CStreamUse {
public:
    explicit CStreamUse(std::shared_ptr<IPcmStream> stream) : m_stream(std::move(stream)) {
        if (m_stream->m_isInUse.exchange(true)) throw CDiscError(DISCIO_ERROR_STREAM_ALREADY_OPEN, "");
        try {
            m_stream->open();
        } catch (...) {
            m_stream->m_isInUse = false;
            throw;
        }
    }
    ~CStreamUse() {
        m_stream->close();
        m_stream->m_isInUse = false;
    }
    CStreamUse(const CStreamUse&) = delete;
    CStreamUse& operator=(const CStreamUse&) = delete;

    IPcmStream& operator*() const { return *m_stream; }
    IPcmStream* operator->() const { return m_stream.get(); }

private:
    std::shared_ptr<IPcmStream> m_stream;
};

} // namespace discio
