// A chunk's body as a stream.
#pragma once

#include "chf/Interfaces.h"

namespace chf {

// A window on the underlying stream. A write past the end of the body makes room in the file. All open
// streams, iterators and parents are told, so that their offsets stay right.
class ZVR_LANG_API CChunkStream : public virtual IStream, public virtual IChunkSpaceListener {
public:
    // Where the body of a chunk starts. The size field is in the 8 bytes before the body, in chunks as well
    // as in the file header.
    static constexpr int64_t kHeaderSize = 12;
    static constexpr int64_t kSizeFieldSize = 8;

    // `holder` may be null.
    CChunkStream(IChunkHolder* holder, IStream* underlying, int64_t base, int64_t size);

    void AddRef() override { ++m_references; }
    void Release() override;

    int64_t GetPosition() override { return m_position; }
    int64_t GetSize() override { return m_size; }
    void Seek(int64_t position) override { m_position = position; } // not checked
    void Write(const void* buffer, uint32_t count) override;
    // Not limited to the chunk: only the position is clamped to the size afterwards.
    uint32_t Read(void* buffer, uint32_t count) override;
    void InsertSpace(int64_t count) override;
    // The bytes must be within the chunk.
    void RemoveSpace(int64_t count) override;

    // Space inserted at the very end of the body belongs to it. Before inserting a chunk behind another one,
    // close the streams of that one.
    void OnSpaceInserted(IChunkSpaceListener* origin, int64_t position, int64_t count) override;
    void OnSpaceRemoved(IChunkSpaceListener* origin, int64_t position, int64_t count) override;

    int64_t GetBase() const { return m_base; }
    // Writes a changed size to the file. The last Release does this too but cannot report a failure.
    void StoreSize();

protected:
    ~CChunkStream() override;
    CChunkStream(const CChunkStream&) = delete;
    CChunkStream& operator=(const CChunkStream&) = delete;

    // The size of the body at that position, if this stream or one opened from it is open on it; otherwise
    // -1.
    virtual int64_t findLiveSize(int64_t base) const;
    void adjustToInsertion(int64_t position, int64_t count);
    void adjustToRemoval(int64_t position, int64_t count);
    // A size in a damaged file can be near the limit of its type; it stops there.
    static void grow(int64_t& size, int64_t count);

    TRef<IChunkHolder> m_holder;
    TRef<IStream> m_underlying;
    int64_t m_base; // absolute position of the body
    int64_t m_size;

private:
    void resize(int64_t difference);

    friend class CChunkIterator; // links its children

    int64_t m_position = 0; // relative to the base
    // The size in the file may be out of date. Comparing with the size at the opening would miss one that
    // another stream on the same chunk has stored since.
    bool m_sizeChanged = false;
    int32_t m_references = 1;
    CChunkStream* m_next = nullptr;
    CChunkStream* m_previous = nullptr;
    bool m_deleted = false; // the whole body was removed
};

} // namespace chf
