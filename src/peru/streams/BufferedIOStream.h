// A queue of bytes between a writer and a reader.
#pragma once

#include "peru/MemoryManager.h"

#include <deque>

namespace peru {

// A first-in, first-out queue over pooled blocks. Not thread-safe.
class PERU_API CBufferedIOStream : public CObject, public IIOStream {
public:
    // Creates its own manager when given none.
    explicit CBufferedIOStream(const P<IMemoryManager>& memoryManager);
    ~CBufferedIOStream() override;

    void close() override; // discards what is queued
    P<IURI> getURI() const override;
    bool isAtEnd() override; // the queue is empty now
    // Throws CEndOfStreamError and consumes nothing when fewer bytes are queued; so does skip.
    void read(void* buffer, int64_t size) override;
    int64_t readSome(void* buffer, int64_t size) override; // never blocks
    void skip(int64_t size) override;
    void write(const void* buffer, int64_t size) override; // copies
    void flush() override;

    // Appends a block without copying it; the caller must not modify its bytes afterwards.
    void append(const P<IMemoryBlock>& block);
    void clear();
    int64_t getAvailable() const { return m_available; }
    int64_t getTotalWritten() const { return m_totalWritten; }

private:
    void checkOpen() const;
    void takeOut(uint8_t* target, int64_t size); // a null target discards the bytes

    P<IMemoryManager> m_memoryManager;
    std::deque<P<IMemoryBlock>> m_blocks;
    int64_t m_readOffset = 0; // within the first block
    int64_t m_available = 0;
    int64_t m_totalWritten = 0;
    bool m_closed = false;
};

} // namespace peru
