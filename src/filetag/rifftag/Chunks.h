// The chunks of a WAVE file, as they stand in the file and not only as their sizes say.
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
    uint32_t toldSize; // of the body, as its header tells it
    int64_t size;      // of the body, as far as the file holds it
    bool info;         // a list of descriptive texts with at least one byte behind its type
};

// Walks a file's chunks. Whatever the bytes are, it comes to the end of the file and no further, and takes no
// memory for them.
//
// A chunk of odd size has a pad byte behind it in files of most programs and none in those of others. One
// follows where a zero stands, with which no id begins, where the last byte of the file stands, and where no
// id can be read at once but one a byte later.
//
// A "data" chunk of size 0 with something behind it that is no chunk, in a file whose own size is not told
// rightly either, was written by a program that never came to tell sizes: it reaches to the end of the file.
class CChunkReader {
public:
    static constexpr int64_t kHeaderSize = 12; // "RIFF", a size, "WAVE"

    // False when the stream is no WAVE file; the reader is of no use then. Throws CStreamError, here and
    // below.
    explicit CChunkReader(const P<peru::ISeekableInStream>& stream);
    bool isWave() const { return m_wave; }
    // False at the end of the file. Up to seven bytes that are no chunk may be left there.
    bool next(SChunk& chunk);

private:
    bool isIdAt(int64_t offset);
    bool isPadAt(int64_t offset);
    bool readAt(int64_t offset, void* bytes, int64_t size); // false when the file ends before

    P<peru::ISeekableInStream> m_stream;
    int64_t m_fileSize;
    int64_t m_offset = kHeaderSize;
    bool m_wave = false;
    bool m_sizeTold = false; // the file is as long as its header says
};

} // namespace filetag::rifftag
