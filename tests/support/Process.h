// Runs programs and reports the outcome.
#pragma once

#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <string>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace tests {

struct SProcessResult {
    int exitCode = -1; // 128 plus the signal number if it was killed
    std::string out;
    std::string err;
    long peakMemory = 0; // kB resident, of the program and its children
    double cpuSeconds = 0;
};

// A child process whose output goes to two unlinked files. Killed at the end of the scope.
class CProcess {
public:
    explicit CProcess(const std::vector<std::string>& command, const std::string& folder = {},
                      const std::vector<std::pair<std::string, std::string>>& environment = {})
        : m_out(makeFile()), m_err(makeFile()) {
        std::vector<char*> arguments;
        for (const std::string& argument : command) arguments.push_back(const_cast<char*>(argument.c_str()));
        arguments.push_back(nullptr);
        m_id = ::fork();
        if (m_id != 0) return;
        if (!folder.empty() && ::chdir(folder.c_str()) != 0) ::_exit(126);
        for (const auto& [name, value] : environment) ::setenv(name.c_str(), value.c_str(), 1);
        ::dup2(::open("/dev/null", O_RDONLY), 0);
        ::dup2(m_out, 1);
        ::dup2(m_err, 2);
        ::execvp(arguments[0], arguments.data());
        ::_exit(127);
    }
    ~CProcess() {
        if (m_id > 0) {
            ::kill(m_id, SIGKILL);
            wait();
        }
        ::close(m_out);
        ::close(m_err);
    }
    CProcess(const CProcess&) = delete;
    CProcess& operator=(const CProcess&) = delete;

    pid_t getId() const { return m_id; }
    // Must not be called after waiting: the id would then address all processes.
    void signal(int number) const {
        if (m_id > 0) ::kill(m_id, number);
    }
    bool isRunning() const {
        siginfo_t state = {};
        return m_id > 0 &&
               ::waitid(P_PID, static_cast<id_t>(m_id), &state, WEXITED | WNOHANG | WNOWAIT) == 0 &&
               state.si_pid == 0;
    }
    std::string readOut() const { return read(m_out); }

    SProcessResult wait() {
        int status = 0;
        rusage usage = {};
        ::wait4(m_id, &status, 0, &usage);
        m_id = -1;
        return {WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status), read(m_out), read(m_err),
                usage.ru_maxrss, toSeconds(usage.ru_utime) + toSeconds(usage.ru_stime)};
    }

private:
    static double toSeconds(const timeval& time) {
        return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) / 1e6;
    }
    static int makeFile() {
        std::string name = "/tmp/tonewright-output-XXXXXX";
        const int file = ::mkostemp(name.data(), O_CLOEXEC);
        ::unlink(name.c_str());
        return file;
    }
    static std::string read(int file) {
        std::string text(static_cast<size_t>(::lseek(file, 0, SEEK_END)), '\0');
        if (::pread(file, text.data(), text.size(), 0) < 0) text.clear();
        return text;
    }

    int m_out;
    int m_err;
    pid_t m_id = -1;
};

inline SProcessResult run(const std::vector<std::string>& command, const std::string& folder = {},
                          const std::vector<std::pair<std::string, std::string>>& environment = {}) {
    return CProcess(command, folder, environment).wait();
}

} // namespace tests
