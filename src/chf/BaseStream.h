// The base of streams over real storage: makes and removes space by moving bytes.
#pragma once

#include "chf/Interfaces.h"

#include <memory>

namespace chf {

class ZVR_LANG_API CBaseStream : public IStream {
public:
    static constexpr int64_t kMoveSize = 65536;

    void AddRef() override { ++m_references; }
    void Release() override;

    // Moves at most the last 65,536 bytes of the stream, in one block: when more bytes follow the position,
    // those further from the end stay where they are.
    void InsertSpace(int64_t count) override;
    // Moves all bytes that follow the removed ones, then truncates the stream.
    void RemoveSpace(int64_t count) override;

    virtual void Truncate(int64_t size) = 0;
    // Appends unspecified bytes: up to one block, which later writes extend.
    virtual void Grow(int64_t size);

protected:
    CBaseStream() = default;
    ~CBaseStream() override = default;
    CBaseStream(const CBaseStream&) = delete;
    CBaseStream& operator=(const CBaseStream&) = delete;

private:
    char* getMoveBuffer();
    // Moves up to a block of the bytes that end at `end`; returns how many.
    int64_t moveBlock(int64_t source, int64_t destination, int64_t end);

    int32_t m_references = 1;
    std::unique_ptr<char[]> m_moveBuffer; // allocated on the first move
};

} // namespace chf
