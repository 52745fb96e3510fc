// Walks a sequence of chunks.
#pragma once

#include "chf/ChunkStream.h"

namespace chf {

// The four characters of an id as they are in the file.
constexpr uint32_t makeChunkId(const char (&text)[5]) {
    uint32_t id = 0;
    for (int i = 3; i >= 0; --i) id = id << 8 | static_cast<uint8_t>(text[i]);
    return id;
}

// Iterates over the chunks in its own body. As a stream it gives access to the bytes of that body, headers
// included: a new chunk is written at the end, or into space inserted in front of the current chunk.
//   for (chunks->Rewind(); chunks->Next();) use(chunks->GetId(), chunks->OpenStream());
class ZVR_LANG_API CChunkIterator : public CChunkStream, public virtual IChunkHolder {
public:
    using CChunkStream::CChunkStream;

    void Rewind();
    // Moves to the next chunk. Returns false if fewer than 12 bytes are left, and for a chunk whose header is
    // beyond the end of the file or whose size is negative.
    bool Next();
    uint32_t GetId() const { return m_id; }
    int64_t GetChunkSize() const { return m_bodySize; } // of the body; as in the file, which may be wrong

    // On the current chunk; throw std::logic_error if there is none.
    TRef<CChunkStream> OpenStream();
    TRef<CChunkIterator> OpenIterator();

    void OnSpaceInserted(IChunkSpaceListener* origin, int64_t position, int64_t count) override;
    void OnSpaceRemoved(IChunkSpaceListener* origin, int64_t position, int64_t count) override;
    void ChildClosed(CChunkStream* child) override;

protected:
    ~CChunkIterator() override = default;

private:
    int64_t findLiveSize(int64_t base) const override;
    const CChunkIterator* getRoot() const;
    template <class T> TRef<T> openChild();
    void invalidate();
    void adjustCurrentToInsertion(int64_t position, int64_t count);
    void adjustCurrentToRemoval(int64_t position, int64_t count);

    CChunkStream* m_firstChild = nullptr; // children hold a reference to this iterator
    uint32_t m_id = 0;
    int64_t m_bodySize = 0;
    int64_t m_offset = 0; // of the current chunk's header, relative to the base
    bool m_valid = false; // there is a current chunk
};

} // namespace chf
