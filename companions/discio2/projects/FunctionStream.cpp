#include "projects/FunctionStream.h"

#include <algorithm>
#include <vector>

namespace discio {

CFunctionStream::CFunctionStream(const DISCIO_PCMAudioStreamFuncs& funcs, void* user)
    : m_funcs(funcs), m_user(user) {
    if (!funcs.open || !funcs.close || !funcs.getChannelCount || !funcs.getSampleRate ||
        !funcs.getFrameCount || !funcs.rewind || !funcs.read)
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "the stream lacks a function");
}

CFunctionStream::~CFunctionStream() {
    if (m_funcs.end) m_funcs.end(m_user);
}

void CFunctionStream::open() {
    if (m_funcs.open(m_user) != 1) throw CDiscError(DISCIO_ERROR_READ_INPUT, "the source cannot be opened");
    try {
        rewind(); // a source that was open already may be anywhere
    } catch (...) {
        close();
        throw;
    }
}

void CFunctionStream::rewind() {
    if (m_funcs.rewind(m_user) != 1)
        throw CDiscError(DISCIO_ERROR_READ_INPUT, "the source cannot be read from its beginning");
    m_position = 0;
}

void CFunctionStream::seek(int64_t frame) {
    if (frame == m_position) return;
    if (m_funcs.seek && m_funcs.canSeek && m_funcs.canSeek(m_user) == 1) {
        if (m_funcs.seek(m_user, frame) != 1)
            throw CDiscError(DISCIO_ERROR_READ_INPUT,
                             "the source cannot be read at frame " + std::to_string(frame));
        m_position = frame;
        return;
    }
    if (frame < m_position) rewind();
    constexpr int32_t kFrames = 16384;
    std::vector<int16_t> skipped(size_t{2} * kFrames);
    while (m_position < frame)
        if (read(skipped.data(), static_cast<int32_t>(std::min<int64_t>(kFrames, frame - m_position))) == 0)
            break;
    m_position = frame;
}

int32_t CFunctionStream::read(int16_t* samples, int32_t frames) {
    int32_t delivered = 0;
    if (m_funcs.read(m_user, samples, frames, &delivered) != 1 || delivered < 0 || delivered > frames)
        throw CDiscError(DISCIO_ERROR_READ_INPUT,
                         "the source cannot be read at frame " + std::to_string(m_position));
    m_position += delivered;
    return delivered;
}

} // namespace discio
