// The file that an encoder writes.
#pragma once

#include "peru/files/IFileReplacement.h"
#include "support/MediaFile.h"

#include <vector>

namespace sonora2::plugins {

// Buffered writing with random access. A new file grows in place, so that what a killed process has written
// can still be read. An existing file keeps its content until close() replaces it as a whole; until then the
// new content has no name. Devices are written to directly.
//
// A failure is thrown as a CSonoraError that names the file and the reason, and is kept: every later
// operation that writes throws it again, so that codec libraries that ignore errors, or cannot be thrown
// through, lose none.
class COutputFile {
public:
    explicit COutputFile(const SMediaFile& file); // throws CSonoraError when it cannot be opened for writing
    ~COutputFile();                               // without flushing; an existing file stays as it was
    COutputFile(const COutputFile&) = delete;
    COutputFile& operator=(const COutputFile&) = delete;

    void write(const void* data, size_t size);
    void seek(int64_t position);
    int64_t tell() const { return m_position + static_cast<int64_t>(m_fill); }
    int64_t getSize() const; // highest byte written so far
    void flush();            // writes the buffer
    void close();            // completes the file; also throws the error of an earlier operation

    // For callbacks of C libraries, which no exception may cross: false on failure, which is kept.
    bool tryWrite(const void* data, size_t size) noexcept;
    bool trySeek(int64_t position) noexcept;
    void throwFailure() const; // throws the first error, if any

    // Closes without a result: removes a file that this object has created, leaves any other as it was.
    void discard() noexcept;
    // Whether others see the file grow.
    bool growsInPlace() const { return !m_replacement; }

    const SMediaFile& getFile() const { return m_file; }

private:
    bool flushBuffer() noexcept;
    bool writeThrough(const uint8_t* data, size_t size) noexcept;
    bool keepError(int error) noexcept; // false

    SMediaFile m_file;
    int m_handle = -1;
    std::string m_created;                   // path of the new file, links followed; otherwise empty
    uint64_t m_identity[2] = {};             // device and number of the new file
    P<peru::IFileReplacement> m_replacement; // of an existing file
    bool m_hasFailed = false;
    int m_error = 0;           // errno of the first failure, or
    P<peru::IString> m_reason; // its text
    int64_t m_position = 0;    // in the file, of the first byte of the buffer
    int64_t m_size = 0;        // written through so far
    size_t m_fill = 0;
    std::vector<uint8_t> m_buffer;
};

} // namespace sonora2::plugins
