// Usage: sonora2_slave PARENT PIPE PLUG-IN CRASH-LOG LOG-LEVEL FLAGS SWITCH. Runs a plug-in for the process
// PARENT, which has started this program and waits for it at the pipe.
#include "crashhandler/CrashHandler.h"
#include "peru/log/ILog.h"
#include "peru/threads/IThreadManager.h"
#include "sonora2_slave/CrashDetails.h"
#include "sonora2_slave/Slave.h"

#include <atomic>
#include <cerrno>
#include <charconv>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace {

using peru::P;

constexpr int kParentPoll = 100; // milliseconds, for kernels without process descriptors

struct SArguments {
    pid_t parent = 0;
    std::string crashLog;
    slave::SSlaveOptions options;
};

template <class Number> bool parse(const char* text, Number& number) {
    const char* end = text + std::strlen(text);
    const auto result = std::from_chars(text, end, number);
    return result.ec == std::errc() && result.ptr == end;
}

bool parseArguments(int count, char** texts, SArguments& arguments) {
    if (count != 8) return false;
    slave::SSlaveOptions& options = arguments.options;
    options.pipeName = texts[2];
    options.pluginName = texts[3];
    arguments.crashLog = texts[4];
    int switchB = 0;
    const bool isValid = parse(texts[1], arguments.parent) && arguments.parent > 0 &&
                         parse(texts[5], options.logLevel) && parse(texts[6], options.flags) &&
                         parse(texts[7], switchB);
    options.switchB = switchB != 0;
    return isValid;
}

// A process descriptor tells of the end of the whole process. A parent-death signal would come when the
// thread of the parent that has started this process ends.
class CParent {
public:
    explicit CParent(pid_t id)
        : m_id(id), m_process(static_cast<int>(::syscall(SYS_pidfd_open, id, 0))),
          m_isGone(m_process < 0 && errno == ESRCH) {}

    // Returns when the parent has ended (false) or the event is set (true).
    bool waitFor(int event) const {
        while (!m_isGone) {
            pollfd descriptors[] = {{event, POLLIN, 0}, {m_process, POLLIN, 0}};
            const bool hasProcess = m_process >= 0;
            const int count = ::poll(descriptors, hasProcess ? 2 : 1, hasProcess ? -1 : kParentPoll);
            if (count > 0 && descriptors[0].revents != 0) return true;
            if (count > 0 && hasProcess && descriptors[1].revents != 0) return false;
            if (!hasProcess && ::kill(m_id, 0) != 0 && errno == ESRCH) return false;
        }
        return false;
    }

private:
    pid_t m_id;
    int m_process; // open until the process ends, like all descriptors here
    bool m_isGone;
};

// Opened now, since the crash handler should not depend on what the process may do later.
int openCrashLog(const std::string& path) {
    const int file = ::open(path.c_str(), O_WRONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK);
    if (file >= 0) ::flock(file, LOCK_EX | LOCK_NB); // the file is in use
    return file;
}

void installCrashHandler([[maybe_unused]] int file) {
#ifndef TONEWRIGHT_SANITIZED // which report crashes themselves
    if (file < 0) return;
    crashhandler::install({"Tonewright " TONEWRIGHT_VERSION " sonora2_slave", nullptr, nullptr, file,
                           slave::CCrashDetails::getText(), false});
#endif
}

void ignoreSignals() {
    // Sent to the whole process group by a terminal. The host decides what they mean.
    for (const int number : {SIGINT, SIGQUIT, SIGHUP, SIGPIPE}) std::signal(number, SIG_IGN);
}

// Everything that may take long, so that the main thread notices the end of the parent at any time.
class CWork : public peru::CObject, public peru::IAction {
public:
    CWork(slave::CSlave& slave, int end) : m_slave(slave), m_end(end) {}
    void run() override {
        try {
            m_isDone = m_slave.run();
        } catch (const peru::CException& exception) {
            peru::getLogManager()->logException(peru::newString("sonora2_slave"), exception);
        } catch (const std::exception& exception) {
            peru::outputDebugString(peru::CString::fromUTF8(exception.what()));
        }
        ::eventfd_write(m_end, 1);
    }
    bool isDone() const { return m_isDone; }

private:
    slave::CSlave& m_slave;
    int m_end;
    std::atomic<bool> m_isDone{false};
};

// Nobody else removes it.
void removeEmpty(const std::string& crashLog) {
    struct stat status {};
    if (::lstat(crashLog.c_str(), &status) == 0 && S_ISREG(status.st_mode) && status.st_size == 0)
        ::unlink(crashLog.c_str());
}

} // namespace

int main(int count, char** texts) {
    SArguments arguments;
    if (!parseArguments(count, texts, arguments)) {
        std::fputs("usage: sonora2_slave PARENT PIPE PLUG-IN CRASH-LOG LOG-LEVEL FLAGS SWITCH\n"
                   "Started by the Tonewright library to run a plug-in in a process of its own.\n",
                   stderr);
        return 2;
    }
    const CParent parent(arguments.parent);
    ignoreSignals();
    installCrashHandler(openCrashLog(arguments.crashLog));

    const int end = ::eventfd(0, EFD_CLOEXEC);
    slave::CSlave slave(arguments.options);
    const P<CWork> work = peru::make<CWork>(slave, end);
    const P<peru::IThread> thread = peru::getThreadManager()->createThread(P<peru::IAction>(work));
    const bool hasParent = parent.waitFor(end);
    if (hasParent)
        thread->wait(); // it has nothing left to do
    else
        removeEmpty(arguments.crashLog);
    // Threads of the plug-in may still run, so nothing is torn down.
    std::fflush(nullptr);
    ::_exit(hasParent && work->isDone() ? 0 : 1);
}
