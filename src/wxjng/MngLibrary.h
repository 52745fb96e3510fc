// The library for MNG and JNG files.
#pragma once

// The library's header includes that of the JPEG library, which needs this one.
#include <cstdio>
#define MNG_USE_SO
#include <libmng.h>

#include <cstdint>
#include <string>

namespace wxjng {

// Owns a handle whose memory is limited. Handles do not move: the library's callbacks refer to them.
class CMngHandle {
public:
    // `user` is what the library's callbacks receive as user data. Throws std::bad_alloc.
    CMngHandle(void* user, int64_t maximalBytes);
    ~CMngHandle();
    CMngHandle(const CMngHandle&) = delete;
    CMngHandle& operator=(const CMngHandle&) = delete;

    // For the next calls of the library: what these allocate counts for this handle, since the library's
    // allocator does not know on behalf of which handle it is called.
    mng_handle use();

private:
    int64_t m_room; // bytes that may still be allocated
    mng_handle m_handle = nullptr;
};

// Collects chunks and writes them to memory.
class CMngWriter {
public:
    CMngWriter();

    mng_handle getHandle() { return m_handle.use(); }
    // Throws CError unless the library's function succeeded.
    void put(mng_retcode result) const;
    // The file, once all chunks are put. Throws CError.
    std::string write();

private:
    std::string m_bytes;
    CMngHandle m_handle;
};

} // namespace wxjng
