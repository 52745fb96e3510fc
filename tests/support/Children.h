// The processes that a process has started, whoever has started them in it.
#pragma once

#include "support/Files.h"
#include "support/TempFolder.h"

#include <csignal>
#include <cstdlib>
#include <sstream>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

namespace tests {

// By the parents of all processes, zombies included.
inline std::vector<pid_t> listChildren(pid_t parent = ::getpid()) {
    std::vector<pid_t> children;
    for (const auto& entry : std::filesystem::directory_iterator("/proc")) {
        const std::string text = readFile(entry.path() / "stat");
        const size_t end = text.rfind(") ");
        if (end == std::string::npos) continue;
        std::istringstream fields(text.substr(end + 2));
        char state = 0;
        pid_t id = 0;
        fields >> state >> id;
        if (id == parent) children.push_back(std::atoi(text.c_str()));
    }
    return children;
}

// Sends a deadly signal to all of them, and returns when they have ended.
inline void endChildren(int signal) {
    for (const pid_t child : listChildren()) {
        ::kill(child, signal);
        siginfo_t info = {};
        ::waitid(P_PID, static_cast<id_t>(child), &info, WEXITED | WNOWAIT); // leaves it to its owner
    }
}

} // namespace tests
