// Shared by all commands that write sound files.
#pragma once

#include "media/FormatOptions.h"
#include "media/SoundFile.h"
#include "terminal/Progress.h"

#include <filesystem>
#include <string>

namespace host {

// Sets the library's suffix of files still being written, for the whole process, and returns it.
std::string setTemporaryEnding(CLibrary& library);

// A format that writes to `temporary`. Throws std::runtime_error with the reason if the target cannot be
// written like this; `subject` is the name of the output in the message.
CHandle requireFormat(CLibrary& library, const std::filesystem::path& temporary, const SSampleFormat& samples,
                      const SFormatOptions& options, const std::filesystem::path& output,
                      const std::string& subject);

struct SEncodeFiles {
    const std::filesystem::path& input;
    const std::filesystem::path& temporary;
    const std::filesystem::path& output;
};

// Encodes the whole source and reports progress from the fraction `begin` on. False if Ctrl-C ended it.
// Throws std::runtime_error with the reason, in which files have the names that the user gave.
bool encode(CLibrary& library, const CHandle& source, const CHandle& format, CProgress& progress,
            CProgress::Job job, const SEncodeFiles& files, const std::string& temporaryEnding,
            double begin = 0.0);

} // namespace host
