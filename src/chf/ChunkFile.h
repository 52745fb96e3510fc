// The root of a chunk file.
//
// All integers are little-endian. The file is a signature of eight characters, the size of the content as 64
// bits, and the content: a sequence of chunks. A chunk is an id of four characters, the size of its body as
// 64 bits, and the body: any bytes, or again a sequence of chunks. There is no padding and no checksum.
#pragma once

#include "chf/ChunkIterator.h"

namespace chf {

class ZVR_LANG_API CChunkFile : public CChunkIterator {
public:
    CChunkFile(IStream* underlying, int64_t size, const char (&signature)[9]);

    const char* GetSignature() const { return m_signature; }

protected:
    ~CChunkFile() override = default;

private:
    char m_signature[9]; // zero-terminated
};

// The stream must be at its start. Checks nothing: compare the signature with what you expect.
ZVR_LANG_API TRef<CChunkFile> OpenChunkFile(IStream* stream);

} // namespace chf
