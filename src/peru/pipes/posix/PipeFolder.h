// The folder that holds the sockets of this user's pipes.
#pragma once

#include "peru/posix/PlatformFile.h"

#include <sys/types.h>

namespace peru::posix {

// A private folder below $XDG_RUNTIME_DIR, or below $TMPDIR where that is not set or not usable. All paths
// go through the folder's descriptor: the folder cannot be replaced between its check and its use, and the
// length of its path does not count towards the short limit of a socket's path.
class CPipeFolder {
public:
    // Creates the folder if needed. Throws CError if it is not a folder that only this user can access.
    static CPipeFolder open();

    // Waits up to `milliseconds` for room in the queue of a busy server. Not open if the connection failed.
    CFileHandle connect(const std::string& name, int milliseconds) const;

private:
    friend class CListeningPipe;
    explicit CPipeFolder(CFileHandle folder) : m_folder(std::move(folder)) {}

    CFileHandle m_folder;
};

// A socket that listens under a name, accessible to this user only. The name is removed at the end.
class CListeningPipe {
public:
    // Replaces the file of a server that has died. Throws CError, among others if another server uses the
    // name. Up to `backlog` clients connect before they are accepted; further ones wait.
    CListeningPipe(const std::string& name, int backlog);
    ~CListeningPipe();
    CListeningPipe(const CListeningPipe&) = delete;
    CListeningPipe& operator=(const CListeningPipe&) = delete;

    int get() const { return m_socket.get(); } // does not block

private:
    CPipeFolder m_folder;
    std::string m_name;
    CFileHandle m_socket;
    ino_t m_identity = 0;
};

} // namespace peru::posix
