// Functions for implementing and using streams.
#pragma once

#include "peru/Object.h"
#include "peru/streams/IStreams.h"

#include <string>

namespace peru {

// Throws CInvalidArgError for a negative size.
PERU_API void checkStreamSize(int64_t size, const char* method);
// Reads exactly `size` bytes through readSome or throws CEndOfStreamError.
PERU_API void readFully(IInStream& stream, void* buffer, int64_t size);
// Skips `size` bytes by reading them, or throws CEndOfStreamError.
PERU_API void skipByReading(IInStream& stream, int64_t size);
// Copies the rest of the source. Returns the number of bytes copied.
PERU_API int64_t copyStream(IInStream& source, IOutStream& target);
// Reads the rest of the stream.
PERU_API std::string readAll(IInStream& stream);

// A marker for any seekable stream; holds a reference to the stream and a position.
class PERU_API CPositionMarker : public CObject, public IStreamMarker {
public:
    explicit CPositionMarker(const P<ISeekableStream>& stream);
    ~CPositionMarker() override;
    void restore() override;

private:
    P<ISeekableStream> m_stream;
    int64_t m_position;
};

} // namespace peru
