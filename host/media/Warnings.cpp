#include "media/Warnings.h"

#include "base/Text.h"

#include <sstream>
#include <string>
#include <tonewright/host.h>

namespace host {

void reportWarnings(const CHandle& source, const std::filesystem::path& input, CProgress& progress,
                    CProgress::Job job) {
    char* const lines = TONEWRIGHT_Host_TakeWarnings(source.get());
    if (!lines) return;
    std::istringstream text(lines);
    TONEWRIGHT_Host_Free(lines);
    for (std::string line; std::getline(text, line);) progress.warn(job, asReason(withPaths(line), input));
}

void dropWarnings(const CHandle& source) {
    TONEWRIGHT_Host_Free(TONEWRIGHT_Host_TakeWarnings(source.get()));
}

} // namespace host
