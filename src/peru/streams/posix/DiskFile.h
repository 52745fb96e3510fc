// The buffered file that the disk streams are built on.
#pragma once

#include "peru/posix/PlatformFile.h"
#include "peru/streams/IStreamManager.h"
#include "peru/uri/IURI.h"

#include <memory>

namespace peru::posix {

enum class EAccess { read, write, readWrite };

// Reading and writing share one buffer, so they may be mixed freely and small transfers cost only a copy.
// Failures throw CFileAccessDeniedError or CStreamError; after close every operation throws
// CStreamClosedError. Not thread-safe.
class PERU_API CDiskFile {
public:
    // Empty if the file, or the folder to create it in, does not exist. Never blocks. Throws CStreamError for
    // anything but a regular file, except that devices may be opened for writing only.
    static std::unique_ptr<CDiskFile> tryOpen(const P<IURI>& uri, EAccess access, EOpenMode mode);
    // Like tryOpen, but throws CFileNotFoundError instead of returning nothing.
    static std::unique_ptr<CDiskFile> open(const P<IURI>& uri, EAccess access, EOpenMode mode);
    // Takes over an open regular file whose file offset is 0 and whose access mode permits the intended use.
    static std::unique_ptr<CDiskFile> adopt(const P<IURI>& uri, CFileHandle handle);
    // Writes what is buffered and ignores errors; call close() to see them.
    ~CDiskFile();

    // Throws if buffered bytes cannot be written; the file is closed in any case.
    void close();
    const P<IURI>& getURI() const { return m_uri; }
    bool isAtEnd();
    int64_t readSome(void* buffer, int64_t size);
    void skip(int64_t size);
    void write(const void* buffer, int64_t size);
    // Writes through to the disk: everything written before survives a power failure.
    void flush();
    int64_t getPosition() const;
    void seek(int64_t position);
    int64_t getSize() const;
    void setSize(int64_t size);

private:
    CDiskFile(const P<IURI>& uri, CFileHandle handle, bool regular);

    void checkOpen() const;
    bool fill();        // reads the next buffer load; false at the end
    void writeBuffer(); // bytes that could not be written stay in the buffer
    void dropBuffer();  // read-ahead only; the position stays
    void moveTo(int64_t offset);
    int64_t readDirect(void* buffer, int64_t size);
    // Returns the number of bytes written; if less than `size`, errno holds the reason.
    int64_t writeDirect(const void* buffer, int64_t size);

    static constexpr int64_t kBufferSize = 64 * 1024;

    P<IURI> m_uri;
    CFileHandle m_handle;
    bool m_regular; // false for devices, which have no size and no position
    std::unique_ptr<uint8_t[]> m_buffer;
    int64_t m_bufferStart = 0; // offset in the file
    int64_t m_filled = 0;      // valid bytes in the buffer
    int64_t m_cursor = 0;      // the stream's position within the buffer
    bool m_dirty = false;      // the buffer holds bytes that have not been written
    int64_t m_fileOffset = 0;  // the descriptor's file offset
};

} // namespace peru::posix
