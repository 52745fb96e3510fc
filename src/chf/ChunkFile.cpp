#include "chf/ChunkFile.h"

#include <bit>
#include <cstring>

namespace chf {

// Integers are read and written as they are in memory.
static_assert(std::endian::native == std::endian::little);

CChunkFile::CChunkFile(IStream* underlying, int64_t size, const char (&signature)[9])
    : CChunkIterator(nullptr, underlying, underlying->GetPosition(), size) {
    std::memcpy(m_signature, signature, sizeof m_signature);
}

TRef<CChunkFile> OpenChunkFile(IStream* stream) {
    char signature[9] = {};
    int64_t size = 0;
    stream->Read(signature, 8);
    stream->Read(&size, sizeof size);
    return TRef<CChunkFile>(new CChunkFile(stream, size, signature));
}

} // namespace chf
