#include "media/Output.h"

#include "library/Failure.h"

#include <stdexcept>
#include <tonewright/host.h>

namespace host {

namespace {

constexpr const char* kHint = " (--force replaces it)";

} // namespace

COutput::COutput(const std::filesystem::path& target, const std::string& suffix, bool replace,
                 EGrowth growth) {
    std::error_code none;
    if (!replace && std::filesystem::is_regular_file(target, none))
        throw std::runtime_error(target.string() + " exists" + kHint);
    const int32_t flags =
        (replace ? TONEWRIGHT_OUTPUT_REPLACE : 0) | (growth == EGrowth::live ? TONEWRIGHT_OUTPUT_LIVE : 0);
    clearFailure();
    m_output = CHandle(TONEWRIGHT_Host_CreateOutput(target.c_str(), suffix.c_str(), flags));
    if (!m_output) {
        const std::string reason = takeFailure(target.string() + " cannot be written");
        throw std::runtime_error(reason.ends_with("was left by an earlier run") ? reason + kHint : reason);
    }
    m_temporary = TONEWRIGHT_Host_GetOutputPath(m_output.get());
}

void COutput::commit() {
    clearFailure();
    if (TONEWRIGHT_Host_CommitOutput(m_output.get()) != 1)
        throw std::runtime_error(takeFailure("The result could not be saved"));
}

void COutput::keep() {
    TONEWRIGHT_Host_KeepOutput(m_output.get());
}

} // namespace host
