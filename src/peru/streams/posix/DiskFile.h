// A buffered file, on which the disk streams stand.
#pragma once

#include "peru/posix/PlatformFile.h"
#include "peru/streams/IStreamManager.h"
#include "peru/uri/IURI.h"

#include <memory>

namespace peru::posix {

enum class EAccess { read, write, readWrite };

// One buffer serves reading and writing in turn, so that small values cost a copy and both may be mixed.
// Failures throw CFileAccessDeniedError or CStreamError; after close everything throws CStreamClosedError.
class PERU_API CDiskFile {
public:
    // Empty when there is no such file, or no folder to make it in. Folders are refused.
    static std::unique_ptr<CDiskFile> tryOpen(const P<IURI>& uri, EAccess access, EOpenMode mode);
    // Throws CFileNotFoundError in place of the empty result.
    static std::unique_ptr<CDiskFile> open(const P<IURI>& uri, EAccess access, EOpenMode mode);
    // Over a regular file that is open for all that is done with it, and stands at its start.
    static std::unique_ptr<CDiskFile> adopt(const P<IURI>& uri, CFileHandle handle);
    // Writes what is buffered; an error is lost: who needs to know calls close().
    ~CDiskFile();

    // Throws what kept the last bytes from being written; the file is closed all the same.
    void close();
    const P<IURI>& getURI() const { return m_uri; }
    bool isAtEnd();
    int64_t readSome(void* buffer, int64_t size);
    void skip(int64_t size);
    void write(const void* buffer, int64_t size);
    // To the disk itself: what was written before survives a loss of power.
    void flush();
    int64_t getPosition() const;
    void seek(int64_t position);
    int64_t getSize() const;
    void setSize(int64_t size);

private:
    CDiskFile(const P<IURI>& uri, CFileHandle handle, bool regular);

    void checkOpen() const;
    bool fill();        // reads the next buffer load; false at the end
    void writeBuffer(); // what could not be written stays in the buffer
    void dropBuffer();  // of a buffer that was read; the position stays
    void moveTo(int64_t offset);
    int64_t readDirect(void* buffer, int64_t size);
    // Answers the bytes written; less than `size` when errno tells why.
    int64_t writeDirect(const void* buffer, int64_t size);

    static constexpr int64_t kBufferSize = 64 * 1024;

    P<IURI> m_uri;
    CFileHandle m_handle;
    bool m_regular; // false for pipes and devices, which have neither size nor position
    std::unique_ptr<uint8_t[]> m_buffer;
    int64_t m_bufferStart = 0; // offset in the file
    int64_t m_filled = 0;      // valid bytes in the buffer
    int64_t m_cursor = 0;      // the stream's position within the buffer
    bool m_dirty = false;      // the buffer holds bytes to be written
    int64_t m_fileOffset = 0;  // where the system stands
};

} // namespace peru::posix
