#include "tonewright/CancelAutoplay2.h"

#include "InstallFolders.h"
#include "peru/Errors.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"

#include <filesystem>

namespace cap {

namespace {

constexpr const char* kCompanionName = "CancelAutoplay2";

std::string toPath(const P<peru::IURI>& file) {
    return peru::CString::toStdString(peru::getPathes()->toPlatformPath(file));
}

// The first candidate that exists; otherwise the first candidate, so that the error message names a path.
P<peru::IURI> findCompanion() {
    const P<peru::ISystem> system = peru::getSystem();
    std::vector<P<peru::IURI>> folders =
        system->getSearchFolders("TONEWRIGHT_COMPANION_PATH", TONEWRIGHT_COMPANION_FOLDER);
    if (P<peru::IURI> program = system->getProgramFileFolder()) folders.push_back(program);
    for (const P<peru::IURI>& folder : folders) {
        P<peru::IURI> file = folder->appendPath(kCompanionName);
        std::error_code ignored;
        if (std::filesystem::is_regular_file(toPath(file), ignored)) return file;
    }
    if (folders.empty()) throw peru::CError("CCancelAutoplay2: there is no folder of companion programs");
    return folders.front()->appendPath(kCompanionName);
}

} // namespace

CCancelAutoplay2::CCancelAutoplay2() {
    const P<peru::IURI> companion = findCompanion();
    const P<peru::IProcessManager> processes = peru::getProcessManager();
    const P<peru::IString> ownId = peru::format("%d", processes->getCurrentProcessId());
    try {
        m_process = processes->start(companion, {ownId, peru::CString::fromUTF8("dummy")});
    } catch (const peru::CException&) {
        const P<peru::IString> path = peru::getPathes()->toPlatformPath(companion, true);
        throw peru::CError(peru::format(
            {"tonewright.CCancelAutoplay2.execute", "CCancelAutoplay2: failed to execute \"%s\""}, path));
    }
}

CCancelAutoplay2::~CCancelAutoplay2() {
    try {
        m_process->terminate();
        int exitCode = 0;
        m_process->wait(1000, exitCode);
    } catch (const peru::CException&) {
        // It has already ended, or ends with this process.
    }
}

} // namespace cap
