// The file that an encoder writes.
#pragma once

#include "support/MediaFile.h"

#include <vector>

namespace sonora2::plugins {

// Buffered writing with random access. Nothing that is there is touched before commit() or the first
// bytes that no longer fit the buffer. A failure is thrown as a CSonoraError
// that names the file and the reason and is kept: every later operation that writes throws it again, so that
// a codec library that swallows it (or cannot be thrown through) loses nothing.
class COutputFile {
public:
    explicit COutputFile(const SMediaFile& file); // throws CSonoraError when it cannot be opened for writing
    ~COutputFile();                               // closes without flushing
    COutputFile(const COutputFile&) = delete;
    COutputFile& operator=(const COutputFile&) = delete;

    void write(const void* data, size_t size);
    void seek(int64_t position);
    int64_t tell() const { return m_position + static_cast<int64_t>(m_fill); }
    int64_t getSize() const; // highest byte written so far
    void commit();           // empties what was there before; an encoder has taken its settings
    void flush();            // nothing stays in the buffer
    void close();            // flushes; throws also what an earlier operation failed with

    // For callbacks of C libraries, which no exception may cross: false on failure, which is kept.
    bool tryWrite(const void* data, size_t size) noexcept;
    bool trySeek(int64_t position) noexcept;
    void throwFailure() const; // what has failed so far, if anything

    // Closes and takes back a file that this object has made; one that was there before stays as it was,
    // as long as nothing was committed.
    void discard() noexcept;

    const SMediaFile& getFile() const { return m_file; }

private:
    int flushBuffer() noexcept;
    int writeThrough(const uint8_t* data, size_t size) noexcept;
    int truncateOnce() noexcept;

    SMediaFile m_file;
    int m_handle = -1;
    bool m_made = false;      // there was no such file before
    bool m_truncated = false; // what was there before is gone
    int m_error = 0;          // errno of the first failure
    int64_t m_position = 0;   // in the file, of the first byte of the buffer
    int64_t m_size = 0;       // written through so far
    size_t m_fill = 0;
    std::vector<uint8_t> m_buffer;
};

} // namespace sonora2::plugins
