// A file whose tag has been read, and the means to notice that another program changed it.
#pragma once

#include "peru/Errors.h"
#include "peru/uri/IURI.h"

#include <string>
#include <sys/stat.h>

namespace filetag::posix {

using peru::P;

// Owns a file descriptor.
class CDescriptor {
public:
    explicit CDescriptor(int descriptor) : m_descriptor(descriptor) {}
    ~CDescriptor();
    CDescriptor(const CDescriptor&) = delete;
    CDescriptor& operator=(const CDescriptor&) = delete;
    int get() const { return m_descriptor; }

private:
    int m_descriptor;
};

// The file is not the one that was opened any more. The same change can be made to the new content.
class CFileChangedError : public peru::CFileError {
    PERU_EXCEPTION(CFileChangedError)
    explicit CFileChangedError(const P<peru::IURI>& file);
};

// How often a change is made again because a program that ignores locks changed the file meanwhile.
inline constexpr int kAttempts = 5;

enum class EAccess {
    shared,
    exclusive // holds the lock of CLock from before the file is read
};

// One thread at a time.
class COpenedFile {
public:
    // Refuses everything but regular files, without waiting for the other end of a pipe. Throws CFileError,
    // here and below.
    explicit COpenedFile(const P<peru::IURI>& uri, EAccess access = EAccess::shared);

    // A descriptor for reading that the caller has to close. All of them share one position.
    int duplicate() const;

    // Keeps other tags, in any process, from being stored to the same file. Waits up to ten seconds for them.
    // With exclusive access there is no wait; the lock is released at the end in any case.
    class CLock {
    public:
        explicit CLock(const COpenedFile& file);
        ~CLock();
        CLock(const CLock&) = delete;
        CLock& operator=(const CLock&) = delete;

    private:
        int m_descriptor;
    };

    // Throws CFileChangedError if the path now leads to another file, or the file was written to. Compares
    // the identity, size and times of the file and its first and last page, because a time may be too coarse.
    void checkUnchanged() const;
    // Whether checkUnchanged() cannot miss a store by another tag. It can if the file had been written to so
    // shortly before it was opened that a later store gave it the same time.
    bool isCertain() const { return m_certain; }

private:
    struct SState {
        struct stat status;
        std::string pages;
    };

    SState readState(int descriptor) const;
    int openPath() const;
    int openLocked() const;
    [[noreturn]] void fail(int error) const;

    P<peru::IURI> m_uri;
    std::string m_path;
    CDescriptor m_file;
    SState m_state;
    bool m_certain;
};

} // namespace filetag::posix
