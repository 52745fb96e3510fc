// Streams over files.
#pragma once

#include "peru/Object.h"
#include "peru/streams/StreamTools.h"
#include "peru/streams/posix/DiskFile.h"

namespace peru::posix {

// Seekable, with 64-bit positions. Opening throws CFileNotFoundError, CFileAccessDeniedError or CStreamError.
// close() throws if buffered bytes cannot be written; the destructor closes and ignores errors. flush() waits
// for the disk itself, so it is slow.
template <class Interface> class TDiskStream : public CObject, public Interface {
public:
    explicit TDiskStream(std::unique_ptr<CDiskFile> file) : m_file(std::move(file)) {}

    void close() override { m_file->close(); }
    P<IURI> getURI() const override { return m_file->getURI(); }
    bool isAtEnd() override { return m_file->isAtEnd(); }
    void reset() override { m_file->seek(0); }
    int64_t getPosition() const override { return m_file->getPosition(); }
    void seek(int64_t position) override { m_file->seek(position); }
    int64_t getSize() const override { return m_file->getSize(); }
    P<IStreamMarker> createMarker() override {
        return make<CPositionMarker>(P<ISeekableStream>::share(this));
    }

protected:
    std::unique_ptr<CDiskFile> m_file;
};

class PERU_API CDiskInStream : public TDiskStream<ISeekableInStream> {
public:
    explicit CDiskInStream(const P<IURI>& uri);
    using TDiskStream::TDiskStream;
    ~CDiskInStream() override;

    void read(void* buffer, int64_t size) override;
    int64_t readSome(void* buffer, int64_t size) override;
    void skip(int64_t size) override;
};

class PERU_API CDiskOutStream : public TDiskStream<ISeekableOutStream> {
public:
    CDiskOutStream(const P<IURI>& uri, EOpenMode mode);
    using TDiskStream::TDiskStream;
    ~CDiskOutStream() override;

    void write(const void* buffer, int64_t size) override;
    void flush() override;
    void setSize(int64_t size) override;
};

// Reading and writing share one position and may be mixed.
class PERU_API CDiskIOStream : public TDiskStream<ISeekableIOStream> {
public:
    class CMarker : public CPositionMarker {
    public:
        using CPositionMarker::CPositionMarker;
    };

    CDiskIOStream(const P<IURI>& uri, EOpenMode mode);
    using TDiskStream::TDiskStream;
    ~CDiskIOStream() override;

    void read(void* buffer, int64_t size) override;
    int64_t readSome(void* buffer, int64_t size) override;
    void skip(int64_t size) override;
    void write(const void* buffer, int64_t size) override;
    void flush() override;
    void setSize(int64_t size) override;
    P<IStreamMarker> createMarker() override;
};

} // namespace peru::posix
