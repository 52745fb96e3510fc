// One run of audio from a source.
#pragma once

#include "peru/MemoryManager.h"
#include "sonora2/Api.h"

namespace sonora2::audio {

using peru::P;

// Interleaved linear PCM, little-endian: 8 bit unsigned, 16, 24 and 32 bit signed. Rate, channels and bytes
// per sample are those of the source.
class SONORA2_API IAudioChunk : public virtual peru::IBase, public virtual peru::ISerializable {
public:
    virtual double getTimestamp() const = 0; // seconds, of the first sample within the source
    virtual uint8_t* getData() = 0;          // the block's buffer, writable
    virtual uint32_t getSize() const = 0;    // valid bytes; 0 is legal
    virtual P<peru::IMemoryBlock> getMemoryBlock() const = 0;
};

} // namespace sonora2::audio
