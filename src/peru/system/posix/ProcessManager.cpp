#include "peru/system/posix/ProcessManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/posix/ProcessImpl.h"

#include <cerrno>
#include <csignal>
#include <sched.h>
#include <spawn.h>
#include <string>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace peru::posix {

namespace {

class CSpawnSettings {
public:
    CSpawnSettings() {
        posix_spawn_file_actions_init(&m_actions);
        posix_spawn_file_actions_addclosefrom_np(&m_actions, STDERR_FILENO + 1);
        posix_spawnattr_init(&m_attributes);
        sigset_t all, none;
        sigfillset(&all);
        sigemptyset(&none);
        posix_spawnattr_setsigdefault(&m_attributes, &all);
        posix_spawnattr_setsigmask(&m_attributes, &none);
        posix_spawnattr_setflags(&m_attributes, POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK);
    }
    ~CSpawnSettings() {
        posix_spawnattr_destroy(&m_attributes);
        posix_spawn_file_actions_destroy(&m_actions);
    }
    CSpawnSettings(const CSpawnSettings&) = delete;
    CSpawnSettings& operator=(const CSpawnSettings&) = delete;

    int spawn(pid_t& id, const std::string& path, std::vector<char*>& arguments) const {
        return posix_spawn(&id, path.c_str(), &m_actions, &m_attributes, arguments.data(), environ);
    }

private:
    posix_spawn_file_actions_t m_actions;
    posix_spawnattr_t m_attributes;
};

// A child inherits the priority of the thread that starts it. If the system refuses, the priority stays.
void setPriority(pid_t id, int niceValue) {
    if (getpriority(PRIO_PROCESS, static_cast<id_t>(id)) != niceValue &&
        setpriority(PRIO_PROCESS, static_cast<id_t>(id), niceValue) != 0)
        setpriority(PRIO_PROCESS, static_cast<id_t>(id), 0);
    sched_param parameters{};
    if (sched_getscheduler(id) != SCHED_OTHER) sched_setscheduler(id, SCHED_OTHER, &parameters);
}

} // namespace

P<IProcess> CProcessManager::start(const P<IURI>& executable, const std::vector<P<IString>>& arguments,
                                   int niceValue) {
    std::vector<std::string> texts{toPath(executable)};
    for (const P<IString>& argument : arguments) texts.push_back(CString::toStdString(argument));
    std::vector<char*> pointers;
    pointers.reserve(texts.size() + 1);
    for (std::string& text : texts) pointers.push_back(text.data());
    pointers.push_back(nullptr);

    pid_t id = 0;
    int error = CSpawnSettings().spawn(id, texts[0], pointers);
    if (error != 0)
        throw CError(
            localize("peru.CProcessManager.startError", "Error starting '%FILE%' (%ERRORDESC%).",
                     {{"%FILE%", CString::fromUTF8(texts[0])}, {"%ERRORDESC%", getSystemText(error)}}));
    setPriority(id, niceValue);
    try {
        P<CProcessImpl> process = make<CProcessImpl>(id);
        process->watch();
        return process;
    } catch (...) {
        // Nobody would ever reap it.
        kill(id, SIGKILL);
        waitpid(id, nullptr, 0);
        throw;
    }
}

int64_t CProcessManager::getCurrentProcessId() const {
    return getpid();
}

} // namespace peru::posix

namespace peru {

P<IProcessManager> getProcessManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IProcessManager>(
        key, [] { return P<IProcessManager>(make<posix::CProcessManager>()); });
}

} // namespace peru
