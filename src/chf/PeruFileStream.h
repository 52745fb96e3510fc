// A chunk file's storage in a stream of the stream manager.
#pragma once

#include "chf/BaseStream.h"
#include "peru/streams/IStreams.h"

namespace chf {

enum class EFileAccess { read = 1, update = 2 }; // an update requires that the file exists

// Uses whatever interfaces the stream and the streams below it have. Throws std::exception for an operation
// that none of them supports. Can grow but never shrink: Truncate, and therefore RemoveSpace, always throws.
class ZVR_LANG_API CPeruFileStream : public CBaseStream {
public:
    static TRef<CPeruFileStream> Open(const peru::P<peru::IURI>& uri, EFileAccess access);
    explicit CPeruFileStream(const peru::P<peru::IStreamBase>& stream);

    int64_t GetPosition() override;
    int64_t GetSize() override;
    void Seek(int64_t position) override;
    void Write(const void* buffer, uint32_t count) override;
    // Returns 0 if the stream cannot be read at all.
    uint32_t Read(void* buffer, uint32_t count) override;
    void RemoveSpace(int64_t count) override; // throws before it moves anything
    [[noreturn]] void Truncate(int64_t size) override;
    // Appends zeros, at most 2 GiB at a time.
    void Grow(int64_t size) override;

protected:
    ~CPeruFileStream() override;

private:
    peru::P<peru::IStreamBase> m_stream;
};

} // namespace chf
