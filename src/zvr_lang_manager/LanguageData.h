// Reads the values in a chunk of a language file.
#pragma once

#include "chf/ChunkStream.h"
#include "peru/strings/String.h"

#include <string>

namespace zvr_lang {

// Little-endian. A string is a 32-bit count of UTF-16 code units, including a terminator, and the code units.
// Every operation throws peru::CParseError when the chunk has fewer bytes than announced.
class CLanguageData {
public:
    // Reads the body into memory. `fileSize` limits what a wrong size can allocate.
    CLanguageData(chf::CChunkStream& chunk, int64_t fileSize);

    uint32_t readInt();
    peru::P<peru::IString> readString(); // in UTF-8
    // A count of items of at least `minimumSize` bytes each.
    uint32_t readCount(size_t minimumSize);

private:
    const char* take(size_t size);

    std::string m_bytes;
    size_t m_position = 0;
};

[[noreturn]] void throwDamaged();

} // namespace zvr_lang
