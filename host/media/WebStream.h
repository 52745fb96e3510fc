// Sound on web servers that is read while it arrives.
#pragma once

#include "library/Library.h"
#include "media/PrivateFolder.h"

#include <atomic>
#include <filesystem>
#include <mutex>
#include <string>
#include <thread>

namespace host {

// Whether the server states no length, as for a radio station, which must not be copied first. Waits for the
// server. Throws std::runtime_error.
bool isEndless(const std::filesystem::path& address);

// Passes a resource on to a reader through a named pipe. The server is asked at once; what the reader does
// not take stays with the server, so the memory in use is that of a pipe.
class CWebStream {
public:
    explicit CWebStream(const std::filesystem::path& address); // throws std::runtime_error
    ~CWebStream();
    CWebStream(const CWebStream&) = delete;
    CWebStream& operator=(const CWebStream&) = delete;

    // For one reader, which finds the end of the pipe once the resource ends, fails or is stopped.
    const std::filesystem::path& getPath() const { return m_path; }
    // Any thread. Takes what is left out of the pipe.
    void stop();
    // Why the resource ended early. Empty if it did not, or was stopped. Any thread.
    std::string getFailure() const;

private:
    void run();
    void drain();

    CPrivateFolder m_folder;
    std::filesystem::path m_path;
    CHandle m_job;
    std::atomic<bool> m_isStopped{false};
    mutable std::mutex m_mutex; // guards the next two members
    std::string m_failure;
    int m_keeper = -1; // both ends of the pipe, so that no end is missing before the thread has ended
    std::thread m_thread;
};

} // namespace host
