// Samples from the functions of a host.
#pragma once

#include "PcmStream.h"

namespace discio {

class CFunctionStream : public IPcmStream {
public:
    // Copies the record. Throws CDiscError if a function is missing that writing needs.
    CFunctionStream(const DISCIO_PCMAudioStreamFuncs& funcs, void* user);
    ~CFunctionStream() override;

    const DISCIO_PCMAudioStreamFuncs& getFuncs() const { return m_funcs; }

    void open() override;
    void close() noexcept override { m_funcs.close(m_user); }
    int32_t getChannelCount() override { return m_funcs.getChannelCount(m_user); }
    int32_t getSampleRate() override { return m_funcs.getSampleRate(m_user); }
    int64_t getFrameCount() override { return m_funcs.getFrameCount(m_user); }
    int64_t getPosition() override { return m_position; }
    int64_t getRepairs() override { return m_funcs.getRepairs ? m_funcs.getRepairs(m_user) : -1; }
    // Streams that cannot seek are read from the beginning.
    void seek(int64_t frame) override;
    int32_t read(int16_t* samples, int32_t frames) override;

private:
    void rewind();

    DISCIO_PCMAudioStreamFuncs m_funcs;
    void* m_user;
    int64_t m_position = 0;
};

} // namespace discio
