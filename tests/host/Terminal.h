// Runs a program on its own terminal.
#pragma once

#include "support/Process.h"

#include <cstdlib>
#include <fcntl.h>
#include <optional>
#include <stdexcept>
#include <string>
#include <sys/ioctl.h>
#include <termios.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace tests {

// The command runs in a new session with this controlling terminal, so that Ctrl-C reaches it. Standard input
// and standard error are the terminal; standard output is the terminal or a file.
class CTerminal {
public:
    enum class EOutput { terminal, file };

    CTerminal(std::vector<std::string> command, EOutput output, const std::string& folder,
              const std::vector<std::pair<std::string, std::string>>& environment)
        : m_master(::posix_openpt(O_RDWR | O_NOCTTY | O_CLOEXEC | O_NONBLOCK)) {
        if (m_master < 0 || ::grantpt(m_master) != 0 || ::unlockpt(m_master) != 0)
            throw std::runtime_error("there are no terminals");
        const std::string name = ::ptsname(m_master);
        m_slave = ::open(name.c_str(), O_RDWR | O_NOCTTY | O_CLOEXEC); // keeps the mode when the program ends
        const winsize size{24, 80, 0, 0};
        ::ioctl(m_master, TIOCSWINSZ, &size);
        // A shell, as leader of the new session, opens the terminal and then executes the command.
        const std::string redirect = output == EOutput::terminal ? " 1<>$T" : "";
        command.insert(command.begin(),
                       {"setsid", "sh", "-c", "T=$0; exec <>$T" + redirect + " 2<>$T \"$@\"", name});
        m_process.emplace(command, folder, environment);
    }
    ~CTerminal() {
        m_process.reset();
        ::close(m_slave);
        ::close(m_master);
    }
    CTerminal(const CTerminal&) = delete;
    CTerminal& operator=(const CTerminal&) = delete;

    CProcess& getProcess() { return *m_process; }
    void type(char key) { // 3 is Ctrl-C, 26 Ctrl-Z
        if (::write(m_master, &key, 1) != 1) throw std::runtime_error("the terminal takes no key");
    }
    // Everything shown so far.
    const std::string& getScreen() {
        char part[4096];
        for (ssize_t size; (size = ::read(m_master, part, sizeof part)) > 0;)
            m_screen.append(part, static_cast<size_t>(size));
        return m_screen;
    }
    // Whether input is echoed and line-buffered, as a shell expects.
    bool isInUsualMode() const {
        termios mode = {};
        ::tcgetattr(m_slave, &mode);
        return (mode.c_lflag & (ICANON | ECHO)) == (ICANON | ECHO);
    }

private:
    int m_master;
    int m_slave = -1;
    std::string m_screen;
    std::optional<CProcess> m_process;
};

} // namespace tests
