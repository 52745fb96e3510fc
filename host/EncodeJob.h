// What every command that writes a sound file does alike.
#pragma once

#include "Commands.h"
#include "SoundFile.h"

#include <filesystem>
#include <string>

namespace host {

// What files are called behind their names while they are written; from now on the library knows it. For the
// whole process.
std::string setTemporaryEnding(CLibrary& library);

// Empty when the target cannot be written like this; the log has the reason, if there is more to it.
CHandle createFormat(CLibrary& library, const std::filesystem::path& temporary, const SSampleFormat& samples,
                     const SFormatOptions& options);
// Throws std::runtime_error instead. `subject` is what the message calls the output.
CHandle requireFormat(CLibrary& library, const std::filesystem::path& temporary, const SSampleFormat& samples,
                      const SFormatOptions& options, const std::filesystem::path& output,
                      const std::string& subject);

struct SEncodeFiles {
    const std::filesystem::path& input;
    const std::filesystem::path& temporary;
    const std::filesystem::path& output;
};

// Reads the source to its end into the file of the format, telling how far it is. False when Ctrl-C ended it;
// throws std::runtime_error with the reason, in which files are called as the user knows them.
bool encode(CLibrary& library, const CHandle& source, const CHandle& format, CProgress& progress,
            CProgress::Job job, const SEncodeFiles& files, const std::string& temporaryEnding);

} // namespace host
