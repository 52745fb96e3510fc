// The blocks of a data disc's file system, in order.
#pragma once

#include "projects/VirtualDataDisc.h"
#include "writing/FirstFailure.h"

struct burn_source;

namespace discio {

class CIsoSource {
public:
    // Reads the sources on a thread of its own from here on. `tailBlocks` zeros follow the file system.
    // Throws CDiscError.
    CIsoSource(const CVirtualDataDisc& disc, uint32_t tailBlocks);
    ~CIsoSource();
    CIsoSource(const CIsoSource&) = delete;
    CIsoSource& operator=(const CIsoSource&) = delete;

    int64_t getSize() const { return m_size; } // bytes; whole blocks
    // A multiple of a block; fewer bytes only at the end. Throws CDiscError, also if one of the files that
    // were read so far has failed or changed.
    size_t read(void* data, size_t size);

private:
    std::shared_ptr<CFirstFailure> m_failure = std::make_shared<CFirstFailure>(); // of the files
    burn_source* m_source = nullptr;
    int64_t m_size = 0;
    int64_t m_position = 0;
};

} // namespace discio
