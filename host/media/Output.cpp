#include "media/Output.h"

#include "base/Translation.h"
#include "library/Failure.h"

#include <stdexcept>
#include <tonewright/host.h>

namespace host {

namespace {

// Whether the library reports a temporary file that another run has left.
bool isLeftover(const std::string& reason) {
    const std::string text = tr("tonewright.Output.leftover", "%s was left by an earlier run");
    const size_t path = text.find("%s");
    return path != std::string::npos && reason.starts_with(text.substr(0, path)) &&
           reason.ends_with(text.substr(path + 2));
}

} // namespace

void createFolders(const std::filesystem::path& folder) {
    std::error_code error;
    if (!folder.empty()) std::filesystem::create_directories(folder, error);
    if (error)
        throw std::runtime_error(tr("host.folderNotCreated",
                                    "The folder %FOLDER% cannot be created: %REASON%",
                                    {{"%FOLDER%", folder.string()}, {"%REASON%", error.message()}}));
}

COutput::COutput(const std::filesystem::path& target, const std::string& suffix, bool replace,
                 EGrowth growth) {
    std::error_code none;
    if (!replace && std::filesystem::is_regular_file(target, none))
        throw std::runtime_error(
            tr("host.existsForce", "%FILE% exists (--force replaces it)", {{"%FILE%", target.string()}}));
    const int32_t flags =
        (replace ? TONEWRIGHT_OUTPUT_REPLACE : 0) | (growth == EGrowth::live ? TONEWRIGHT_OUTPUT_LIVE : 0);
    clearFailure();
    m_output = CHandle(TONEWRIGHT_Host_CreateOutput(target.c_str(), suffix.c_str(), flags));
    if (!m_output) {
        const std::string reason =
            takeFailure(tr("host.unwritable", "%FILE% cannot be written", {{"%FILE%", target.string()}}));
        throw std::runtime_error(isLeftover(reason) ? tr("host.withForce", "%REASON% (--force replaces it)",
                                                         {{"%REASON%", reason}})
                                                    : reason);
    }
    m_temporary = TONEWRIGHT_Host_GetOutputPath(m_output.get());
}

void COutput::commit() {
    clearFailure();
    if (TONEWRIGHT_Host_CommitOutput(m_output.get()) != 1)
        throw std::runtime_error(takeFailure(tr("host.unsaved", "The result could not be saved")));
}

void COutput::keep() {
    TONEWRIGHT_Host_KeepOutput(m_output.get());
}

} // namespace host
