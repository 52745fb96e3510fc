#include "peru/streams/StreamTools.h"

#include "peru/Errors.h"
#include "peru/uri/IURI.h"

#include <algorithm>
#include <array>

namespace peru {

namespace {
constexpr int64_t kStep = 64 * 1024;
}

void checkStreamSize(int64_t size, const char* method) {
    if (size < 0) throw CInvalidArgError("size", method);
}

void readFully(IInStream& stream, void* buffer, int64_t size) {
    checkStreamSize(size, "IInStream::read");
    uint8_t* target = static_cast<uint8_t*>(buffer);
    // At least one call, since reading 0 bytes from a closed stream must throw.
    do {
        const int64_t count = stream.readSome(target, size);
        if (count <= 0 && size > 0) throw CEndOfStreamError(stream.getURI());
        target += count;
        size -= count;
    } while (size > 0);
}

void skipByReading(IInStream& stream, int64_t size) {
    checkStreamSize(size, "IInStream::skip");
    std::array<uint8_t, 4096> dropped;
    do {
        const int64_t count = stream.readSome(dropped.data(), std::min<int64_t>(size, dropped.size()));
        if (count <= 0 && size > 0) throw CEndOfStreamError(stream.getURI());
        size -= count;
    } while (size > 0);
}

int64_t copyStream(IInStream& source, IOutStream& target) {
    std::string buffer(kStep, '\0');
    int64_t total = 0;
    while (const int64_t count = source.readSome(buffer.data(), kStep)) {
        target.write(buffer.data(), count);
        total += count;
    }
    return total;
}

std::string readAll(IInStream& stream) {
    std::string bytes;
    size_t filled = 0;
    for (;;) {
        if (filled == bytes.size()) bytes.resize(std::max<size_t>(kStep, filled * 2));
        const int64_t count =
            stream.readSome(bytes.data() + filled, static_cast<int64_t>(bytes.size() - filled));
        if (count <= 0) break;
        filled += static_cast<size_t>(count);
    }
    bytes.resize(filled);
    return bytes;
}

CPositionMarker::CPositionMarker(const P<ISeekableStream>& stream)
    : m_stream(stream), m_position(stream->getPosition()) {}

CPositionMarker::~CPositionMarker() = default;

void CPositionMarker::restore() {
    m_stream->seek(m_position);
}

} // namespace peru
