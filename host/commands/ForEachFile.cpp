#include "commands/ForEachFile.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "terminal/Progress.h"

#include <cstdio>
#include <exception>

namespace host {

namespace fs = std::filesystem;

void printFailure(const fs::path& file, const std::string& reason) {
    std::fprintf(stderr, "tonewright: %s: %s\n", toPrintable(file.native()).c_str(),
                 toPrintable(reason).c_str());
}

int forEachFile(const std::vector<fs::path>& files, bool json, EReader reader,
                const std::function<void(const fs::path&)>& job) {
    bool failed = false;
    for (const fs::path& file : files) {
        if (isCancelled()) break;
        try {
            job(file);
        } catch (const std::exception& error) {
            failed = true;
            if (json)
                std::printf("%s\n", toLine({{"file", file.native()}, {"error", error.what()}}).c_str());
            else
                printFailure(file, error.what());
        }
        if (!flushOutput() && reader == EReader::needed) break;
    }
    return isCancelled() ? kExitCancelled : failed ? kExitFailure : kExitSuccess;
}

} // namespace host
