// A file whose tag has been read, and the means to notice that another program changed it.
#pragma once

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

// One thread at a time.
class COpenedFile {
public:
    // Refuses everything but regular files, without waiting for the other end of a pipe. Throws CFileError,
    // here and below.
    explicit COpenedFile(const P<peru::IURI>& uri);

    // A descriptor for reading that the caller has to close. All of them share one position.
    int duplicate() const;

    // Keeps other tags, in any process, from being stored to the same file. Waits up to ten seconds for them.
    class CLock {
    public:
        explicit CLock(const COpenedFile& file);
        ~CLock();
        CLock(const CLock&) = delete;
        CLock& operator=(const CLock&) = delete;

    private:
        int m_descriptor;
    };

    // Throws if the path now leads to another file, or the file was written to. Compares the identity, size
    // and times of the file and its first and last page, because a time may be too coarse to tell.
    void checkUnchanged() const;
    [[noreturn]] void failChanged() const; // with the error of checkUnchanged()

private:
    struct SState {
        struct stat status;
        std::string pages;
    };

    SState readState(int descriptor) const;
    int openPath() const;
    [[noreturn]] void fail(int error) const;

    P<peru::IURI> m_uri;
    std::string m_path;
    CDescriptor m_file;
    SState m_state;
};

} // namespace filetag::posix
