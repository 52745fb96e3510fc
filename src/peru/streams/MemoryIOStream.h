// A seekable stream over a memory block.
#pragma once

#include "peru/MemoryManager.h"
#include "peru/streams/StreamTools.h"

namespace peru {

// Reads and writes the block in place, starting at its first byte; the block's capacity grows by doubling.
class PERU_API CMemoryIOStream : public CObject, public ISeekableIOStream {
public:
    class CMarker : public CPositionMarker {
    public:
        using CPositionMarker::CPositionMarker;
    };

    // Creates its own block when given none.
    explicit CMemoryIOStream(const P<IMemoryBlock>& block = nullptr, const P<IURI>& uri = nullptr);
    ~CMemoryIOStream() override;

    const P<IMemoryBlock>& getBlock() const { return m_block; } // valid after close, too

    void close() override;
    P<IURI> getURI() const override;
    bool isAtEnd() override;
    void read(void* buffer, int64_t size) override;
    int64_t readSome(void* buffer, int64_t size) override;
    void skip(int64_t size) override;
    void write(const void* buffer, int64_t size) override;
    void flush() override;
    void reset() override;
    int64_t getPosition() const override;
    void seek(int64_t position) override; // may be past the end; a write there fills the gap with zeros
    int64_t getSize() const override;
    void setSize(int64_t size) override;
    P<IStreamMarker> createMarker() override;

private:
    void checkOpen() const;

    P<IMemoryBlock> m_block;
    P<IURI> m_uri;
    int64_t m_position = 0;
    bool m_closed = false;
};

} // namespace peru
