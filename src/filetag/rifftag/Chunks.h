// Reads the chunks of a WAVE file, also where their sizes are wrong.
#pragma once

#include "peru/streams/IStreams.h"

#include <array>

namespace filetag::rifftag {

using peru::P;

using FourCC = std::array<char, 4>;

struct SChunkHeader {
    FourCC id;
    uint32_t size; // little-endian in the file
};
static_assert(sizeof(SChunkHeader) == 8);

struct SChunk {
    int64_t offset; // of the header
    FourCC id;
    uint32_t toldSize; // of the body, according to its header
    int64_t size;      // of the body, limited to the end of the file
    bool info;         // a LIST of type INFO with a size above 4
};

// Iterates over the chunks of a file. It always ends at the end of the file, whatever the bytes are, and does
// not load chunk bodies.
//
// Most programs write a pad byte behind a chunk of odd size, but some do not. The byte behind such a chunk is
// taken as padding if it is zero (no id starts with a zero), if it is the last byte of the file, or if an id
// can only be read one byte later.
//
// A "data" chunk of size 0 that is not followed by a chunk, in a file whose RIFF size is wrong as well, comes
// from a program that never got to write the sizes: it extends to the end of the file.
class CChunkReader {
public:
    static constexpr int64_t kHeaderSize = 12; // "RIFF", a size, "WAVE"

    // If isWave() returns false the stream is not a WAVE file and the reader must not be used. The
    // constructor and next() throw CStreamError.
    explicit CChunkReader(const P<peru::ISeekableInStream>& stream);
    bool isWave() const { return m_wave; }
    // Returns false at the end of the chunks. Up to seven trailing bytes may remain there.
    bool next(SChunk& chunk);
    // Where an ID3v1 or APE tag follows the chunks, which must stay at the end of the file; otherwise the end
    // of the file.
    int64_t getEnd() const { return m_end; }

private:
    bool isTagAt(int64_t offset);
    bool isIdAt(int64_t offset);
    bool isPadAt(int64_t offset);
    bool readAt(int64_t offset, void* bytes, int64_t size); // false if the file is too short

    P<peru::ISeekableInStream> m_stream;
    int64_t m_end; // of the chunks
    int64_t m_offset = kHeaderSize;
    bool m_wave = false;
    bool m_sizeTold = false; // the size in the RIFF header is correct
};

} // namespace filetag::rifftag
